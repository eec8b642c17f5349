#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <filesystem>
#include <string>

#include "tests/host/cgi/SessionFixture.h"

namespace {

// What can stand in the place of a session's file.
class SessionFile : public SessionTest {
  protected:
    SessionFile() : id(Open()), record(Read(id)) {}

    void ExpectNoSession(const std::string& what) {
        talo::Session session;
        session.user = "untouched";
        EXPECT_FALSE(talo::FindSession(id, &session)) << what;
        EXPECT_EQ(session.user, "untouched") << what;
        EXPECT_FALSE(talo::RenewSession(id)) << what;
        EXPECT_TRUE(talo::ListSessions().empty()) << what;
    }

    void ExpectRefused(const std::string& what, const std::string& content) {
        Write(id, content);
        ExpectNoSession(what);
    }

    void Remove() {
        ASSERT_EQ(unlink(PathOf(id).c_str()), 0);
    }

    const std::string id;
    const std::string record;
};

TEST_F(SessionFile, IsASessionAsItWasWritten) {
    EXPECT_TRUE(Exists(id));
    EXPECT_EQ(talo::ListSessions().size(), 1u);
}

TEST_F(SessionFile, IsNoneWhenItIsEmptyOrNoJsonObject) {
    ExpectRefused("empty", "");
    ExpectRefused("a blank", " ");
    ExpectRefused("text", "user=normal");
    ExpectRefused("an array", "[" + record + "]");
    ExpectRefused("a text", "\"normal\"");
    ExpectRefused("null", "null");
    ExpectRefused("two objects", record + record);
    ExpectRefused("text behind", record + "x");
    ExpectRefused("a comment", "/**/" + record);
    ExpectRefused("NUL behind", record + std::string(1, '\0'));
}

TEST_F(SessionFile, IsNoneWhenItIsCutAnywhere) {
    for (size_t size = 0; size < record.size(); ++size) {
        ExpectRefused("cut to " + std::to_string(size), record.substr(0, size));
    }
}

TEST_F(SessionFile, IsNoneWhenItIsNestedDeep) {
    const std::string deep = std::string(100000, '[') + std::string(100000, ']');
    ExpectRefused("deep alone", deep.substr(0, 8000));
    ExpectRefused("deep within", "{\"user\":\"normal\",\"handle\":\"h\",\"more\":" +
                                     std::string(4000, '[') + std::string(4000, ']') + "}");
    ExpectRefused("deep and large", deep);
}

TEST_F(SessionFile, IsNoneWhenItIsTooLarge) {
    const size_t limit = 16 * 1024;
    Write(id, record + std::string(limit - record.size(), ' '));
    EXPECT_TRUE(Exists(id));
    ExpectRefused("a byte more", record + std::string(limit - record.size() + 1, ' '));
    Write(id, record);
    ASSERT_EQ(truncate(PathOf(id).c_str(), 1LL << 40), 0);
    ExpectNoSession("a terabyte of holes");
}

TEST_F(SessionFile, IsNoneWhenSomebodyElseOwnsIt) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only the superuser can give a file away";
    }
    ASSERT_EQ(chown(PathOf(id).c_str(), 12345, static_cast<gid_t>(-1)), 0);
    ExpectNoSession("of another user");
    ASSERT_EQ(chown(PathOf(id).c_str(), 0, static_cast<gid_t>(-1)), 0);
    EXPECT_TRUE(Exists(id));
}

TEST_F(SessionFile, IsNoneWhenItIsALinkEvenToASession) {
    const std::string other = Open("other");
    Remove();
    ASSERT_EQ(symlink(PathOf(other).c_str(), PathOf(id).c_str()), 0);
    LeaveUnused(other, 100);
    EXPECT_FALSE(Exists(id));
    EXPECT_FALSE(talo::RenewSession(id));
    talo::Session session;
    ASSERT_TRUE(talo::FindSession(other, &session));
    EXPECT_LE(session.lastUse, time(nullptr) - 100);
    EXPECT_EQ(talo::ListSessions().size(), 1u);
    EXPECT_TRUE(talo::EndSession(id));
    EXPECT_TRUE(Exists(other));
}

TEST_F(SessionFile, IsNoneWhenItIsALinkThatLeadsNowhere) {
    Remove();
    ASSERT_EQ(symlink("nowhere", PathOf(id).c_str()), 0);
    ExpectNoSession("a dangling link");
    EXPECT_FALSE(std::filesystem::exists(PathOf("nowhere")));
}

TEST_F(SessionFile, IsNoneWhenItIsAPipe) {
    Remove();
    ASSERT_EQ(mkfifo(PathOf(id).c_str(), 0600), 0);
    ExpectNoSession("a pipe");
}

TEST_F(SessionFile, IsNoneWhenItIsAFolder) {
    Remove();
    ASSERT_EQ(mkdir(PathOf(id).c_str(), 0700), 0);
    LeaveUnused(id, 100000);
    ExpectNoSession("a folder");
    EXPECT_FALSE(talo::EndSession(id));
    EXPECT_TRUE(std::filesystem::is_directory(PathOf(id)));
}

TEST_F(SessionFile, IsNotFoundByTheHandleOfADamagedOne) {
    const std::string other = Open("other");
    Write(other, "{");
    talo::Session session;
    ASSERT_TRUE(talo::FindSession(id, &session));
    EXPECT_TRUE(talo::EndSessionByHandle(session.handle));
    EXPECT_EQ(Names(), std::vector<std::string>{other});
}

}  // namespace
