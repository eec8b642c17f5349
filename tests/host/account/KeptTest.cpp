// What a process keeps in memory of the files that every request asks for.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <thread>

#include "AccountRoot.h"
#include "hosts/linux/conf/KeyValueFile.h"
#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/sdk/Sessions.h"
#include "platform/Paths.h"

namespace {

using Milliseconds = std::chrono::milliseconds;

// Only a file that has been as it is for a while is kept.
void LetFilesSettle() {
    std::this_thread::sleep_for(Milliseconds(2050));
}

class Kept : public AccountRoot {
  public:
    static bool IsLocked(const char* name) {
        talo::Account account;
        EXPECT_TRUE(talo::FindAccount(name, &account));
        return account.locked;
    }

    static long long LastUse(const std::string& id) {
        talo::Session session;
        return talo::FindSession(id, &session) ? session.lastUse : -1;
    }
};

TEST_F(Kept, AccountIsTheOneOfTheFile) {
    WriteAccounts(Line("anna", 1024) + Line("bob", 1025, "\"locked\":true"));
    LetFilesSettle();
    for (int round = 0; round < 2; ++round) {
        EXPECT_FALSE(IsLocked("anna"));
        EXPECT_TRUE(IsLocked("bob"));
    }
    WriteAccounts(Line("anna", 1024, "\"locked\":true") + Line("bob", 1025));
    EXPECT_TRUE(IsLocked("anna"));
    EXPECT_FALSE(IsLocked("bob"));
    WriteAccounts("");
    talo::Account account;
    EXPECT_FALSE(talo::FindAccount("bob", &account));
}

TEST_F(Kept, AccountGoesWithTheTrustInTheFile) {
    WriteAccounts(Line("anna", 1024));
    LetFilesSettle();
    EXPECT_FALSE(IsLocked("anna"));
    ASSERT_EQ(chmod(TALO_ACCOUNTS_FILE, 0666), 0);
    talo::Account account;
    EXPECT_FALSE(talo::FindAccount("anna", &account));
}

TEST_F(Kept, SettingIsTheOneOfTheFile) {
    Configure("first=\"1\"");
    LetFilesSettle();
    EXPECT_EQ(host::HostSetting("first", ""), "1");
    Configure("first=\"2\"");
    // It is looked at once in some milliseconds.
    std::this_thread::sleep_for(Milliseconds(50));
    EXPECT_EQ(host::HostSetting("first", ""), "2");
    EXPECT_EQ(host::HostSetting("second", "none"), "none");
}

TEST_F(Kept, SessionIsTheOneOfItsFile) {
    talo::Session session;
    session.user = "anna";
    std::string id;
    std::string other;
    ASSERT_TRUE(talo::CreateSession(session, &id));
    session.user = "bob";
    ASSERT_TRUE(talo::CreateSession(session, &other));
    const auto user = [](const std::string& of) {
        talo::Session found;
        return talo::FindSession(of, &found) ? found.user : "none";
    };
    for (int round = 0; round < 2; ++round) {
        EXPECT_EQ(user(id), "anna");
        EXPECT_EQ(user(id), "anna");
        EXPECT_EQ(user(other), "bob");
    }
    const std::string path = std::string(TALO_SESSION_DIR) + "/" + id;
    const struct timespec earlier[2] = {{1000000, 0}, {1000000, 0}};
    ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), earlier, 0), 0);
    EXPECT_EQ(LastUse(id), 1000000);
    EXPECT_TRUE(talo::RenewSession(id));
    EXPECT_GT(LastUse(id), 1000000);
    EXPECT_EQ(user(id), "anna");
    ASSERT_EQ(unlink(path.c_str()), 0);
    EXPECT_EQ(user(id), "none");
    EXPECT_FALSE(talo::RenewSession(id));
}

}  // namespace
