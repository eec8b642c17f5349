#include "hosts/linux/account/AccountFile.h"

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>

#include "AccountRoot.h"
#include "platform/Paths.h"

namespace fs = std::filesystem;

namespace {

using host::Lookup;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

class AccountFile : public AccountRoot {
  public:
    static Lookup Find(const std::string& name) {
        host::StoredAccount stored;
        return host::FindInFile(TALO_ACCOUNTS_FILE, name, &stored);
    }

    static unsigned UidOf(const std::string& name) {
        host::StoredAccount stored;
        EXPECT_EQ(Lookup::kFound, host::FindInFile(TALO_ACCOUNTS_FILE, name, &stored)) << name;
        return stored.account.uid;
    }

    static std::vector<std::string> Names() {
        std::vector<talo::Account> accounts;
        std::vector<std::string> names;
        EXPECT_TRUE(host::ListFile(TALO_ACCOUNTS_FILE, &accounts));
        for (const talo::Account& account : accounts) {
            names.push_back(account.name);
        }
        return names;
    }

    static bool Touch(const std::string& name) {
        std::string problem;
        return host::ChangeInFile(
            TALO_ACCOUNTS_FILE, name,
            [](Json::Value* members, std::string*) {
                (*members)["locked"] = true;
                return true;
            },
            &problem);
    }

    // What a file that is not believed looks like from everywhere.
    static void ExpectUnavailable() {
        std::vector<talo::Account> accounts(1);
        std::string problem;
        EXPECT_EQ(Lookup::kUnavailable, Find("anna"));
        EXPECT_FALSE(host::ListFile(TALO_ACCOUNTS_FILE, &accounts));
        EXPECT_EQ(1u, accounts.size());
        EXPECT_FALSE(Touch("anna"));
        EXPECT_FALSE(host::AppendToFile(TALO_ACCOUNTS_FILE, "new", "", &problem));
        EXPECT_NE("", problem);
        EXPECT_TRUE(WasLogged("cannot use " TALO_ACCOUNTS_FILE));
    }
};

TEST_F(AccountFile, HasNoAccountsWhenItIsMissing) {
    EXPECT_EQ(Lookup::kAbsent, Find("anna"));
    EXPECT_THAT(Names(), IsEmpty());
    EXPECT_THAT(Logged(), IsEmpty());
}

TEST_F(AccountFile, FindsTheWholeNameOnly) {
    WriteAccounts(Line("ann", 1) + Line("anna", 2) + Line("ANNA", 3) + Line("D\\\\anna", 4) +
                  "{\"name\":\"b\\u006fb\",\"uid\":5}");
    EXPECT_EQ(1u, UidOf("ann"));
    EXPECT_EQ(2u, UidOf("anna"));
    EXPECT_EQ(3u, UidOf("ANNA"));
    EXPECT_EQ(4u, UidOf("D\\anna"));
    EXPECT_EQ(5u, UidOf("bob"));
    EXPECT_EQ(Lookup::kAbsent, Find("an"));
    EXPECT_EQ(Lookup::kAbsent, Find("uid"));
}

TEST_F(AccountFile, ListsInByteOrder) {
    WriteAccounts(Line("b", 1) + Line("_a", 2) + Line("a", 3) + Line("B", 4));
    EXPECT_THAT(Names(), ElementsAre("B", "_a", "a", "b"));
}

TEST_F(AccountFile, SkipsABrokenLineAndLogsItsNumber) {
    WriteAccounts(Line("anna", 1) + "\n{\"name\":\"eve\",\"uid\":\n" + Line("carl", 3));
    EXPECT_THAT(Names(), ElementsAre("anna", "carl"));
    EXPECT_TRUE(WasLogged("line 3 is skipped"));
    EXPECT_EQ(Lookup::kAbsent, Find("eve"));
}

TEST_F(AccountFile, LogsNoForgedLine) {
    WriteAccounts("{\"name\":\"eve\",\"uid\":\x1b[31m\r}\n");
    (void)Names();
    ASSERT_FALSE(Logged().empty());
    for (const std::string& line : Logged()) {
        EXPECT_EQ(std::string::npos, line.find_first_of("\x1b\r\n")) << line;
    }
}

TEST_F(AccountFile, KeepsBrokenLinesByteForByte) {
    const std::string broken = "  not json at all \r\n" + std::string("nul\0inside\n", 11) +
                               "{\"name\":\"half\",\"uid\":\"x\"}\n\n   \n\xff\xfe\n" +
                               "{\"name\":\"x\",\"uid\":1,}\n";
    const std::string end = "no end of line";
    WriteAccounts(broken + Line("anna", 1024) + broken + end);
    ASSERT_TRUE(Touch("anna"));
    EXPECT_EQ(broken + "{\"locked\":true,\"name\":\"anna\",\"uid\":1024}\n" + broken + end,
              ReadAccounts());
    std::string problem;
    ASSERT_TRUE(host::AppendToFile(TALO_ACCOUNTS_FILE, "bob", "", &problem));
    ASSERT_TRUE(host::RemoveFromFile(TALO_ACCOUNTS_FILE, "anna", &problem));
    EXPECT_EQ(broken + broken + end + "\n{\"name\":\"bob\",\"password\":\"\",\"uid\":1025}\n",
              ReadAccounts());
}

TEST_F(AccountFile, KeepsUnknownMembersOfAChangedLine) {
    WriteAccounts(Line("anna", 1, "\"mail\":\"a@b\",\"quota\":{\"bytes\":9007199254740993}"));
    ASSERT_TRUE(Touch("anna"));
    EXPECT_EQ(
        "{\"locked\":true,\"mail\":\"a@b\",\"name\":\"anna\","
        "\"quota\":{\"bytes\":9007199254740993},\"uid\":1}\n",
        ReadAccounts());
}

TEST_F(AccountFile, CountsTheFirstLineOfANameAndRemovesAll) {
    WriteAccounts(Line("anna", 1) + Line("bob", 2) + Line("anna", 3));
    EXPECT_EQ(1u, UidOf("anna"));
    EXPECT_THAT(Names(), ElementsAre("anna", "bob"));
    EXPECT_TRUE(WasLogged("line 3 is skipped"));
    std::string problem;
    ASSERT_TRUE(host::RemoveFromFile(TALO_ACCOUNTS_FILE, "anna", &problem));
    EXPECT_EQ(Line("bob", 2), ReadAccounts());
}

TEST_F(AccountFile, GivesUidsFrom1024AndNeverAUsedOne) {
    std::string problem;
    WriteAccounts(Line("small", 7));
    ASSERT_TRUE(host::AppendToFile(TALO_ACCOUNTS_FILE, "a", "", &problem));
    EXPECT_EQ(1024u, UidOf("a"));
    ASSERT_TRUE(host::AppendToFile(TALO_ACCOUNTS_FILE, "b", "", &problem));
    EXPECT_EQ(1025u, UidOf("b"));
    ASSERT_TRUE(host::RemoveFromFile(TALO_ACCOUNTS_FILE, "a", &problem));
    ASSERT_TRUE(host::AppendToFile(TALO_ACCOUNTS_FILE, "c", "", &problem));
    EXPECT_EQ(1026u, UidOf("c"));
}

TEST_F(AccountFile, FillsGapsWhenTheHighestUidIsTaken) {
    std::string problem;
    WriteAccounts(Line("top", 2147483647) + Line("first", 1024));
    ASSERT_TRUE(host::AppendToFile(TALO_ACCOUNTS_FILE, "a", "", &problem));
    EXPECT_EQ(1025u, UidOf("a"));
}

TEST_F(AccountFile, IsWrittenForItsOwnerOnly) {
    std::string problem;
    const mode_t before = umask(0);
    ASSERT_TRUE(host::AppendToFile(TALO_ACCOUNTS_FILE, "a", "", &problem)) << problem;
    (void)umask(before);
    for (const char* path : {TALO_ACCOUNTS_FILE, TALO_ACCOUNTS_FILE ".lock"}) {
        struct stat facts = {};
        ASSERT_EQ(0, stat(path, &facts));
        EXPECT_EQ(0600u, facts.st_mode & 07777) << path;
    }
}

TEST_F(AccountFile, RefusesALineThatItWouldNotUnderstand) {
    WriteAccounts(Line("anna", 1));
    std::string problem;
    EXPECT_FALSE(host::ChangeInFile(
        TALO_ACCOUNTS_FILE, "anna",
        [](Json::Value* members, std::string*) {
            (*members)["uid"] = "one";
            return true;
        },
        &problem));
    EXPECT_NE("", problem);
    EXPECT_EQ(Line("anna", 1), ReadAccounts());
}

TEST_F(AccountFile, IsNotBelievedWhenOthersMayWriteIt) {
    for (const mode_t mode : {0620u, 0602u, 0666u}) {
        WriteAccounts(Line("anna", 1));
        ASSERT_EQ(0, chmod(TALO_ACCOUNTS_FILE, mode));
        ExpectUnavailable();
    }
    ASSERT_EQ(0, chmod(TALO_ACCOUNTS_FILE, 0644));
    EXPECT_EQ(Lookup::kFound, Find("anna"));
}

TEST_F(AccountFile, IsNotBelievedWhenItBelongsToAnotherUser) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only the superuser can give a file away";
    }
    WriteAccounts(Line("anna", 1));
    ASSERT_EQ(0, chown(TALO_ACCOUNTS_FILE, 12345, 0));
    ExpectUnavailable();
}

TEST_F(AccountFile, IsNotReadThroughALinkOrFromSomethingElse) {
    WriteFile(ACCOUNT_ROOT "/elsewhere", Line("anna", 1));
    fs::create_directories(fs::path(TALO_ACCOUNTS_FILE).parent_path());
    fs::create_symlink(ACCOUNT_ROOT "/elsewhere", TALO_ACCOUNTS_FILE);
    ExpectUnavailable();
    fs::remove(TALO_ACCOUNTS_FILE);
    ASSERT_EQ(0, mkfifo(TALO_ACCOUNTS_FILE, 0600));
    ExpectUnavailable();
    fs::remove(TALO_ACCOUNTS_FILE);
    fs::create_directory(TALO_ACCOUNTS_FILE);
    ASSERT_EQ(0, chmod(TALO_ACCOUNTS_FILE, 0700));
    ExpectUnavailable();
}

TEST_F(AccountFile, MayHaveFourMebibytesAndNoByteMore) {
    const std::string anna = Line("anna", 1);
    const std::string full = anna + std::string(host::kMaxAccountsBytes - anna.size(), '\n');
    WriteAccounts(full);
    EXPECT_EQ(Lookup::kFound, Find("anna"));
    std::string problem;
    EXPECT_FALSE(host::AppendToFile(TALO_ACCOUNTS_FILE, "bob", "", &problem));
    EXPECT_EQ("the file of accounts is full", problem);
    EXPECT_EQ(full.size(), ReadAccounts().size());
    WriteAccounts(full + "\n");
    ExpectUnavailable();
}

TEST_F(AccountFile, DoesNotFollowALinkInThePlaceOfItsLock) {
    WriteAccounts(Line("anna", 1));
    fs::create_symlink(ACCOUNT_ROOT "/elsewhere", TALO_ACCOUNTS_FILE ".lock");
    EXPECT_FALSE(Touch("anna"));
    EXPECT_FALSE(fs::exists(ACCOUNT_ROOT "/elsewhere"));
}

}  // namespace
