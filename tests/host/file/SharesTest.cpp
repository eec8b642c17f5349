#include "hosts/linux/sdk/Shares.h"

#include <gtest/gtest.h>
#include <stdarg.h>
#include <sys/stat.h>
#include <syslog.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>

#include "platform/Paths.h"

namespace {

namespace fs = std::filesystem;

std::string logged;

}  // namespace

// Stands before the C library's: what the host logs comes here.
extern "C" void syslog(int, const char* format, ...) {
    char line[2048];
    va_list arguments;
    va_start(arguments, format);
    (void)vsnprintf(line, sizeof line, format, arguments);
    va_end(arguments);
    logged += std::string(line) + "\n";
}

namespace {

class Shares : public ::testing::Test {
  public:
    void SetUp() override {
        TearDown();
        fs::create_directories(fs::path(TALO_SHARES_FILE).parent_path());
        logged.clear();
    }

    void TearDown() override {
        for (const char* path : {TALO_SHARES_FILE, TALO_ACCOUNTS_FILE, TALO_HOST_CONF}) {
            fs::remove(path);
        }
    }

    static void Write(const std::string& content, mode_t mode = 0644,
                      const char* path = TALO_SHARES_FILE) {
        std::ofstream(path, std::ios::binary) << content;
        ASSERT_EQ(0, chmod(path, mode));
    }

    // The names of all shares, each with a blank behind it.
    static std::string Names() {
        std::vector<talo::Share> shares;
        EXPECT_TRUE(talo::ListShares(&shares));
        std::string names;
        for (const talo::Share& share : shares) {
            names += share.name + " ";
        }
        return names;
    }

    // "r" and "w" for what an account may do to a share.
    static std::string Rights(const std::string& name, const talo::Share& share) {
        talo::ShareUser user;
        if (!talo::FindShareUser(name, &user)) {
            return "nobody";
        }
        return std::string(talo::MayRead(user, share) ? "r" : "") +
               (talo::MayWrite(user, share) ? "w" : "");
    }
};

TEST_F(Shares, AreListedByName) {
    Write(R"({"name":"b","folder":"/srv/b"})"
          "\n\n"
          R"({"name":"a","folder":"/srv/a","readers":["anna","@staff"],"writers":["@users"]})"
          "\n");
    EXPECT_EQ("a b ", Names());
    talo::Share share;
    ASSERT_TRUE(talo::FindShare("a", &share));
    EXPECT_EQ("/srv/a", share.folder);
    EXPECT_EQ((std::vector<std::string>{"anna", "@staff"}), share.readers);
    EXPECT_EQ((std::vector<std::string>{"@users"}), share.writers);
    EXPECT_FALSE(talo::FindShare("c", &share));
    EXPECT_EQ("a", share.name);
    EXPECT_EQ("", logged);
}

TEST_F(Shares, AreNoneWithoutAFile) {
    EXPECT_EQ("", Names());
    EXPECT_EQ("", logged);
}

TEST_F(Shares, AreNotBelievedFromAFileThatOthersMayWrite) {
    const std::string line = R"({"name":"a","folder":"/"})";
    for (const mode_t mode : {0664U, 0646U, 0666U}) {
        Write(line, mode);
        std::vector<talo::Share> shares(1);
        EXPECT_FALSE(talo::ListShares(&shares));
        EXPECT_EQ(1, shares.size());
        EXPECT_NE(std::string::npos, logged.find("others than its owner may write it"));
    }
    Write(line);
    ASSERT_EQ(0, rename(TALO_SHARES_FILE, (TALO_SHARES_FILE + std::string(".real")).c_str()));
    ASSERT_EQ(0, symlink("shares.real", TALO_SHARES_FILE));
    std::vector<talo::Share> shares;
    EXPECT_FALSE(talo::ListShares(&shares));
    fs::remove(TALO_SHARES_FILE + std::string(".real"));
}

TEST_F(Shares, SkipALineThatIsNotUnderstood) {
    const struct {
        const char* name;
        std::string line;
        const char* reason;
    } rows[] = {
        {"no JSON", "shares", "at byte 0"},
        {"cut off", R"({"name":"x","folder":"/x")", "at byte"},
        {"array", R"(["x","/x"])", "no object"},
        {"no name", R"({"folder":"/x"})", "\"name\" is missing"},
        {"no folder", R"({"name":"x"})", "\"folder\" is missing"},
        {"number for a name", R"({"name":1,"folder":"/x"})", "\"name\" is not valid"},
        {"empty name", R"({"name":"","folder":"/x"})", "\"name\" is not valid"},
        {"slash in the name", R"({"name":"a/b","folder":"/x"})", "\"name\" is not valid"},
        {"parent for a name", R"({"name":"..","folder":"/x"})", "\"name\" is not valid"},
        {"NUL in the name", R"({"name":"a\u0000","folder":"/x"})", "\"name\" is not valid"},
        {"relative folder", R"({"name":"x","folder":"x"})", "\"folder\" is not valid"},
        {"empty folder", R"({"name":"x","folder":""})", "\"folder\" is not valid"},
        {"NUL in the folder", R"({"name":"x","folder":"/\u0000"})", "\"folder\" is not valid"},
        {"text for readers", R"({"name":"x","folder":"/x","readers":"@users"})", "\"readers\""},
        {"number for a reader", R"({"name":"x","folder":"/x","readers":[1]})", "\"readers\""},
        {"empty reader", R"({"name":"x","folder":"/x","readers":[""]})", "\"readers\""},
        {"group without name", R"({"name":"x","folder":"/x","writers":["@"]})", "\"writers\""},
        {"star for a writer", R"({"name":"x","folder":"/x","writers":["*"]})", "\"writers\""},
        {"second of its name", R"({"name":"last","folder":"/x"})", "has an earlier line"},
    };
    for (const auto& row : rows) {
        logged.clear();
        Write("{\"name\":\"last\",\"folder\":\"/last\"}\n" + row.line + "\n");
        EXPECT_EQ("last ", Names()) << row.name;
        EXPECT_NE(std::string::npos, logged.find("line 2 is skipped: ")) << row.name << logged;
        EXPECT_NE(std::string::npos, logged.find(row.reason)) << row.name << logged;
        talo::Share share;
        ASSERT_TRUE(talo::FindShare("last", &share));
        EXPECT_EQ("/last", share.folder) << row.name;
    }
}

TEST_F(Shares, GiveRightsByUserAndGroup) {
    Write(R"({"name":"anna","uid":1024,"groups":["staff"]})"
          "\n"
          R"({"name":"bert","uid":1025})"
          "\n"
          R"({"name":"boss","uid":1026,"groups":["administrators"]})"
          "\n",
          0600, TALO_ACCOUNTS_FILE);
    talo::Share share;
    const struct {
        const char* name;
        std::vector<std::string> readers;
        std::vector<std::string> writers;
        const char* anna;
        const char* bert;
    } rows[] = {
        {"nobody", {}, {}, "", ""},
        {"a user reads", {"bert"}, {}, "", "r"},
        {"a user writes", {}, {"bert"}, "", "rw"},
        {"a group reads", {"@staff"}, {}, "r", ""},
        {"a group writes", {}, {"@staff"}, "rw", ""},
        {"every account", {"@users"}, {"anna"}, "rw", "r"},
        {"administrators", {"@administrators"}, {}, "", ""},
        {"a group is no user", {"staff"}, {"@anna", "@bert"}, "", ""},
        {"a part of a name", {"ann", "ber"}, {"annaa", "bertb"}, "", ""},
    };
    for (const auto& row : rows) {
        share.readers = row.readers;
        share.writers = row.writers;
        EXPECT_EQ(row.anna, Rights("anna", share)) << row.name;
        EXPECT_EQ(row.bert, Rights("bert", share)) << row.name;
        EXPECT_EQ("rw", Rights("boss", share)) << row.name;
        EXPECT_EQ("nobody", Rights("carl", share)) << row.name;
        EXPECT_EQ("nobody", Rights("", share)) << row.name;
    }
}

}  // namespace
