#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <string>
#include <utility>

#include "tests/host/cgi/SessionFixture.h"

namespace {

class SessionStore : public SessionTest {
  protected:
    static talo::Session Found(const std::string& id) {
        talo::Session session;
        EXPECT_TRUE(talo::FindSession(id, &session)) << id;
        return session;
    }

    static std::vector<std::string> Users() {
        std::vector<std::string> users;
        for (const talo::Session& session : talo::ListSessions()) {
            users.push_back(session.user);
        }
        return users;
    }
};

TEST_F(SessionStore, FindsWhatItWasGiven) {
    talo::Session session;
    session.user = "domain\\u.s-e_r@1";
    session.address = "2001:db8::1";
    session.language = "fre";
    session.application = "photo";
    session.privilege = "photo \"quoted\" \xC3\xA9";
    session.timeout = 77;
    session.skipAddress = true;
    const long long before = time(nullptr);
    const talo::Session found = Found(Open(session));
    EXPECT_EQ(found.user, session.user);
    EXPECT_EQ(found.address, session.address);
    EXPECT_EQ(found.language, session.language);
    EXPECT_EQ(found.application, session.application);
    EXPECT_EQ(found.privilege, session.privilege);
    EXPECT_EQ(found.timeout, session.timeout);
    EXPECT_TRUE(found.skipAddress);
    EXPECT_GE(found.created, before);
    EXPECT_LE(found.created, time(nullptr));
    EXPECT_GE(found.lastUse, before - 1);
}

TEST_F(SessionStore, MakesHandleAndTimesItself) {
    talo::Session session;
    session.user = "normal";
    session.handle = "mine";
    session.created = 5;
    session.lastUse = 5;
    const talo::Session found = Found(Open(session));
    EXPECT_NE(found.handle, "mine");
    EXPECT_GT(found.created, 5);
    EXPECT_GT(found.lastUse, 5);
}

TEST_F(SessionStore, LetsNobodyElseReadASession) {
    struct stat facts = {};
    ASSERT_EQ(stat(PathOf(Open()).c_str(), &facts), 0);
    EXPECT_EQ(facts.st_mode & 07777, 0600u);
}

TEST_F(SessionStore, RenewsTheLastUseAndNothingElse) {
    const std::string id = Open();
    LeaveUnused(id, 1000);
    const std::string record = Read(id);
    EXPECT_LE(Found(id).lastUse, time(nullptr) - 1000);
    const long long before = time(nullptr);
    EXPECT_TRUE(talo::RenewSession(id));
    EXPECT_GE(Found(id).lastUse, before - 1);
    EXPECT_EQ(Read(id), record);
}

TEST_F(SessionStore, RenewsOneThatWasFound) {
    const std::string id = Open();
    LeaveUnused(id, 1000);
    talo::Session found = Found(id);
    const long long before = time(nullptr);
    EXPECT_TRUE(talo::RenewSession(id, &found));
    EXPECT_GE(found.lastUse, before - 1);
    EXPECT_EQ(Found(id).lastUse, found.lastUse);
    found.lastUse = 0;
    EXPECT_FALSE(talo::RenewSession("../session", &found)) << "no id at all";
    ASSERT_TRUE(talo::EndSession(id));
    EXPECT_FALSE(talo::RenewSession(id, &found));
}

// Others that have read it need not read it again.
TEST_F(SessionStore, LeavesATimeOfThisSecondAlone) {
    const std::string id = Open();
    const auto changed = [&] {
        struct stat facts = {};
        EXPECT_EQ(stat(PathOf(id).c_str(), &facts), 0);
        return std::make_pair(facts.st_ctim.tv_sec, facts.st_ctim.tv_nsec);
    };
    // A try that ends in another second than it began in tells nothing.
    for (int tries = 0; tries < 5; ++tries) {
        const time_t second = time(nullptr);
        EXPECT_TRUE(talo::RenewSession(id));
        const auto first = changed();
        (void)usleep(20000);
        EXPECT_TRUE(talo::RenewSession(id));
        if (time(nullptr) == second) {
            EXPECT_EQ(changed(), first);
            EXPECT_EQ(Found(id).lastUse, second);
            return;
        }
    }
    FAIL() << "no two calls in one second";
}

TEST_F(SessionStore, RenewsATimeInTheFuture) {
    const std::string id = Open();
    LeaveUnused(id, -1000);
    EXPECT_TRUE(talo::RenewSession(id));
    EXPECT_LE(Found(id).lastUse, time(nullptr));
}

TEST_F(SessionStore, RenewsNothingThatIsNotThere) {
    EXPECT_FALSE(talo::RenewSession(UnusedId()));
    EXPECT_TRUE(Names().empty());
}

TEST_F(SessionStore, EndsASessionOnceAndNoOther) {
    const std::string first = Open();
    const std::string second = Open();
    EXPECT_TRUE(talo::EndSession(first));
    EXPECT_FALSE(Exists(first));
    EXPECT_FALSE(talo::EndSession(first));
    EXPECT_FALSE(talo::RenewSession(first));
    EXPECT_TRUE(Exists(second));
}

TEST_F(SessionStore, EndsASessionByItsHandleAndNoOther) {
    const std::string first = Open();
    const std::string second = Open();
    const std::string handle = Found(first).handle;
    EXPECT_TRUE(talo::EndSessionByHandle(handle));
    EXPECT_FALSE(Exists(first));
    EXPECT_TRUE(Exists(second));
    EXPECT_FALSE(talo::EndSessionByHandle(handle));
}

TEST_F(SessionStore, TakesNothingButAHandleForOne) {
    const std::string id = Open();
    const std::string handle = Found(id).handle;
    for (const std::string& other : {id, std::string(), std::string("*"), handle + "x",
                                     handle.substr(1), std::string("../") + id}) {
        EXPECT_FALSE(talo::EndSessionByHandle(other)) << other;
    }
    EXPECT_TRUE(Exists(id));
}

TEST_F(SessionStore, ListsSessionsInTheOrderOfTheirCreation) {
    const struct {
        const char* user;
        long long created;
    } rows[] = {{"third", 300}, {"first", 100}, {"second", 200}};
    for (const auto& row : rows) {
        const std::string id = Open(row.user);
        std::string record = Read(id);
        const std::string member = "\"created\":";
        const size_t begin = record.find(member) + member.size();
        record.replace(begin, record.find(',', begin) - begin, std::to_string(row.created));
        Write(id, record);
    }
    EXPECT_EQ(Users(), (std::vector<std::string>{"first", "second", "third"}));
}

TEST_F(SessionStore, ListsNothingInAnEmptyFolder) {
    EXPECT_TRUE(talo::ListSessions().empty());
}

TEST_F(SessionStore, RemovesTimedOutSessionsWhenItLists) {
    const std::string fresh = Open("fresh");
    const std::string old = Open("old");
    LeaveUnused(old, 31 * 60);
    EXPECT_TRUE(Exists(old));
    EXPECT_EQ(Users(), std::vector<std::string>{"fresh"});
    EXPECT_FALSE(Exists(old));
    EXPECT_EQ(Names(), std::vector<std::string>{fresh});
}

TEST_F(SessionStore, SweepsWhatAWriterLeftAnHourAgo) {
    const std::string id = UnusedId();
    const std::vector<std::string> left = {id + ".abcdef", id + ".XYZ123"};
    const std::vector<std::string> kept = {id + "abcdef", "README", "x" + id.substr(1) + ".abcdef"};
    const std::string young = id + ".young1";
    for (const auto& names : {left, kept}) {
        for (const std::string& name : names) {
            Write(name, "{\"user\":\"ha");
            LeaveUnused(name, 3700);
        }
    }
    Write(young, "{\"us");
    LeaveUnused(young, 3500);
    EXPECT_TRUE(talo::ListSessions().empty());
    std::vector<std::string> expected = kept;
    expected.push_back(young);
    std::sort(expected.begin(), expected.end());
    EXPECT_EQ(Names(), expected);
}

}  // namespace
