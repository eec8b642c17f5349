#include "hosts/linux/account/SystemAccounts.h"

#include <gmock/gmock.h>
#include <sched.h>
#include <sys/mount.h>
#include <unistd.h>

#include <functional>

#include "AccountRoot.h"
#include "hosts/linux/account/Password.h"
#include "hosts/linux/sdk/Accounts.h"
#include "platform/Paths.h"
#include "platform/System.h"
#include "tests/support/Child.h"

namespace {

using talo::LoginResult;
using ::testing::UnorderedElementsAre;

struct ShadowRow {
    const char* name;
    const char* hash;
    long changed;
    long maxAge;
    long lastDay;
    const char* usable;
    bool locked;
    bool expired;
};

TEST(ReadShadow, FollowsTheDataBasesRules) {
    constexpr long kToday = 20000;
    const ShadowRow rows[] = {
        {"plain", "$y$h", 19000, 99999, -1, "$y$h", false, false},
        {"without ages", "$y$h", -1, -1, -1, "$y$h", false, false},
        {"locked", "!$y$h", 19000, 99999, -1, "$y$h", true, false},
        {"locked twice", "!!$y$h", 19000, 99999, -1, "$y$h", true, false},
        {"never had a password", "*", 19000, 99999, -1, "", false, false},
        {"locked without a password", "!", 19000, 99999, -1, "", true, false},
        {"locked, never had one", "!*", 19000, 99999, -1, "", true, false},
        {"empty password", "", 19000, 99999, -1, "", false, false},
        {"to be changed at once", "$y$h", 0, 99999, -1, "$y$h", false, true},
        {"greatest age reached", "$y$h", 19900, 100, -1, "$y$h", false, false},
        {"greatest age passed", "$y$h", 19899, 100, -1, "$y$h", false, true},
        {"last day ahead", "$y$h", 19000, 99999, 20001, "$y$h", false, false},
        {"last day passed", "$y$h", 19000, 99999, 20000, "$y$h", true, false},
    };
    for (const ShadowRow& row : rows) {
        const host::ShadowFacts facts =
            host::ReadShadow(row.hash, row.changed, row.maxAge, row.lastDay, kToday);
        EXPECT_EQ(row.usable, facts.hash) << row.name;
        EXPECT_EQ(row.locked, facts.locked) << row.name;
        EXPECT_EQ(row.expired, facts.expired) << row.name;
    }
}

// Users and groups of this test's own, in a view of the machine that only a
// child process has.
class SystemAccounts : public AccountRoot {
  public:
    void SetUp() override {
        AccountRoot::SetUp();
        Configure("accounts=\"system\"");
        std::string hash;
        ASSERT_TRUE(host::HashPassword("secret", &hash));
        WriteFile(ACCOUNT_ROOT "/passwd",
                  "root:x:0:0::/:/bin/sh\n"
                  "anna:x:5001:5001::/:/bin/sh\n"
                  "bob:x:5002:7000::/:/bin/sh\n"
                  "carl:x:5003:5003::/:/bin/sh\n"
                  "dora:x:5004:5004::/:/bin/sh\n"
                  "with$ign:x:5005:5004::/:/bin/sh\n");
        WriteFile(ACCOUNT_ROOT "/group",
                  "root:x:0:\nanna:x:5001:\nstaff:x:6000:carl,anna\n"
                  "administrators:x:7000:anna\ncarl:x:5003:\ndora:x:5004:\n");
        WriteFile(ACCOUNT_ROOT "/shadow", "root:*:19000:0:99999:7:::\nanna:" + hash +
                                              ":19000:0:99999:7:::\nbob:!" + hash +
                                              ":19000:0:99999:7:::\ncarl:" + hash +
                                              ":0:0:99999:7:::\ndora::19000:0:99999:7:::\n");
        WriteFile(ACCOUNT_ROOT "/nsswitch.conf", "passwd: files\ngroup: files\nshadow: files\n");
    }

    static void InOwnView(const std::function<void()>& body) {
        const support::ChildResult result = support::InChild([&] {
            Enter();
            if (!HasFailure()) {
                body();
            }
            return 0;
        });
        EXPECT_EQ(0, result.status) << result.output;
    }

  private:
    static void Enter() {
        const int uid = static_cast<int>(getuid());
        ASSERT_EQ(0, unshare(uid == 0 ? CLONE_NEWNS : CLONE_NEWNS | CLONE_NEWUSER));
        if (uid != 0) {
            WriteFile("/proc/self/uid_map", "0 " + std::to_string(uid) + " 1");
        }
        ASSERT_EQ(0, mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr));
        for (const std::string name : {"passwd", "group", "shadow", "nsswitch.conf"}) {
            const std::string source = ACCOUNT_ROOT "/" + name;
            const std::string target = "/etc/" + name;
            ASSERT_EQ(0, mount(source.c_str(), target.c_str(), nullptr, MS_BIND, nullptr)) << name;
        }
    }
};

TEST_F(SystemAccounts, AreTheMachinesUsersWithTheirGroups) {
    InOwnView([] {
        talo::Account account;
        ASSERT_TRUE(talo::FindAccount("anna", &account));
        EXPECT_EQ("anna", account.name);
        EXPECT_EQ(5001u, account.uid);
        EXPECT_THAT(account.groups, UnorderedElementsAre("anna", "staff", "administrators"));
        EXPECT_TRUE(account.privileges.empty());
        EXPECT_FALSE(talo::FindAccount("nobody-here", &account));
        EXPECT_FALSE(talo::FindAccount("with$ign", &account));
        EXPECT_FALSE(talo::FindAccount("", &account));
        EXPECT_EQ("anna", account.name);
    });
}

TEST_F(SystemAccounts, AreListedInByteOrder) {
    InOwnView([] {
        std::vector<talo::Account> accounts;
        ASSERT_TRUE(talo::ListAccounts(&accounts));
        std::vector<std::string> names;
        for (const talo::Account& account : accounts) {
            names.push_back(account.name);
        }
        EXPECT_THAT(names, ::testing::ElementsAre("anna", "bob", "carl", "dora", "root"));
    });
}

TEST_F(SystemAccounts, HaveTheirAdministratorsInTheGroup) {
    // A file of accounts says nothing here.
    WriteAccounts(Line("carl", 1, "\"groups\":[\"administrators\"]") + Line("root", 2));
    InOwnView([] {
        struct Row {
            const char* user;
            int administrator;
        };
        for (const Row& row :
             {Row{"root", 1}, {"anna", 1}, {"bob", 1}, {"carl", 0}, {"nobody-here", 0}}) {
            EXPECT_EQ(row.administrator, TLIBGroupIsAdminGroupMem(row.user, 0)) << row.user;
            talo::Account account;
            if (talo::FindAccount(row.user, &account)) {
                EXPECT_EQ(row.administrator == 1, talo::IsAdministrator(account)) << row.user;
            }
            EXPECT_EQ(row.administrator, TLIBAppPrivUserHas(row.user, "Acme.Light", "10.0.0.1"))
                << row.user;
        }
    });
}

TEST_F(SystemAccounts, LogInWithTheShadowPassword) {
    InOwnView([] {
        const auto login = [](const char* name, const char* password) {
            return talo::CheckLogin(name, password, "", nullptr);
        };
        EXPECT_EQ(LoginResult::kAccepted, login("anna", "secret"));
        EXPECT_EQ(LoginResult::kWrong, login("anna", "wrong"));
        EXPECT_EQ(LoginResult::kLocked, login("bob", "secret"));
        EXPECT_EQ(LoginResult::kWrong, login("bob", "!secret"));
        EXPECT_EQ(LoginResult::kExpired, login("carl", "secret"));
        EXPECT_EQ(LoginResult::kWrong, login("dora", ""));
        EXPECT_EQ(LoginResult::kWrong, login("root", "*"));
        EXPECT_EQ(LoginResult::kWrong, login("root", ""));
        EXPECT_EQ(LoginResult::kWrong, login("nobody-here", "secret"));
        EXPECT_EQ(LoginResult::kWrong, login("with$ign", "secret"));
    });
}

}  // namespace
