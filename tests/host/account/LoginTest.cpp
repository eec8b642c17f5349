#include "hosts/linux/account/Login.h"

#include <gmock/gmock.h>

#include <filesystem>

#include "AccountRoot.h"
#include "hosts/linux/sdk/Accounts.h"
#include "platform/Paths.h"

namespace fs = std::filesystem;

namespace {

using host::Verdict;
using talo::LoginResult;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

constexpr char kHash[] = "$y$j9T$abcdefgh$0123456789";

struct World {
    long long monotonic = 1000000;
    long long wall = 1700000000;
    bool broken = false;
    std::vector<std::string> hashes;     // each verified against
    std::vector<std::string> passwords;  // and with
};

World world;

long long Monotonic() {
    return world.monotonic;
}

long long Wall() {
    return world.wall;
}

// The dummy matches too: whoever trusts it would let everybody in.
Verdict Verify(const std::string& password, const std::string& hash) {
    world.hashes.push_back(hash);
    world.passwords.push_back(password);
    if (world.broken) {
        return Verdict::kUnknown;
    }
    return hash == host::kDummyHash || password == "right" ? Verdict::kMatches : Verdict::kDiffers;
}

class Login : public AccountRoot {
  public:
    void SetUp() override {
        AccountRoot::SetUp();
        world = World();
    }

    static LoginResult Try(const std::string& name, const std::string& password,
                           const std::string& address = "10.0.0.1", int* wait = nullptr) {
        return host::CheckLoginIn({Monotonic, Wall, Verify}, name, password, address, wait);
    }

    static std::string Account(const std::string& name, const std::string& more = "") {
        return Line(
            name, 1024,
            std::string("\"password\":\"") + kHash + "\"" + (more.empty() ? "" : ",") + more);
    }
};

TEST_F(Login, AcceptsTheRightPasswordOnly) {
    WriteAccounts(Account("anna"));
    EXPECT_EQ(LoginResult::kAccepted, Try("anna", "right"));
    EXPECT_EQ(LoginResult::kWrong, Try("anna", "wrong"));
    EXPECT_THAT(world.hashes, ElementsAre(kHash, kHash));
}

TEST_F(Login, ComputesOneHashForAnUnknownAccountToo) {
    WriteAccounts(Account("anna"));
    EXPECT_EQ(LoginResult::kWrong, Try("nobody", "right"));
    EXPECT_THAT(world.hashes, ElementsAre(host::kDummyHash));
    EXPECT_THAT(world.passwords, ElementsAre("right"));
}

TEST_F(Login, ComputesOneHashForEveryKindOfRefusal) {
    WriteAccounts(Account("anna") + Line("empty", 1025) + Line("none", 1026, "\"password\":\"\"") +
                  "{\"name\":\"broken\",\"uid\":\"x\"}\n");
    const std::string names[] = {"nobody",
                                 "empty",
                                 "none",
                                 "broken",
                                 "",
                                 "a/b",
                                 "a\nb",
                                 std::string("anna\0", 5),
                                 std::string(65, 'x'),
                                 "root"};
    for (const std::string& name : names) {
        world.hashes.clear();
        EXPECT_EQ(LoginResult::kWrong, Try(name, "right", "")) << name;
        EXPECT_THAT(world.hashes, ElementsAre(host::kDummyHash)) << name;
    }
    const std::string passwords[] = {"", std::string("right\0", 6), std::string(512, 'x'),
                                     std::string(1 << 20, 'x')};
    for (const std::string& password : passwords) {
        for (const char* name : {"anna", "nobody"}) {
            world.hashes.clear();
            EXPECT_EQ(LoginResult::kWrong, Try(name, password, "")) << password.size();
            EXPECT_EQ(1u, world.hashes.size()) << password.size();
        }
    }
}

TEST_F(Login, RefusesAPasswordWithANulThoughItsBeginningIsRight) {
    WriteAccounts(Account("anna"));
    EXPECT_EQ(LoginResult::kWrong, Try("anna", std::string("right\0tail", 10)));
}

TEST_F(Login, TellsALockOnlyToWhoKnowsThePassword) {
    WriteAccounts(Account("anna", "\"locked\":true"));
    EXPECT_EQ(LoginResult::kWrong, Try("anna", "wrong"));
    EXPECT_EQ(LoginResult::kLocked, Try("anna", "right"));
}

TEST_F(Login, TellsAnExpiredPasswordOnlyToWhoKnowsIt) {
    WriteAccounts(Account("anna", "\"passwordExpires\":1700000000"));
    world.wall = 1699999999;
    EXPECT_EQ(LoginResult::kAccepted, Try("anna", "right"));
    world.wall = 1700000000;
    EXPECT_EQ(LoginResult::kExpired, Try("anna", "right"));
    EXPECT_EQ(LoginResult::kWrong, Try("anna", "wrong"));
}

TEST_F(Login, TellsTheLockBeforeTheExpiry) {
    WriteAccounts(Account("anna", "\"locked\":true,\"passwordExpires\":1"));
    EXPECT_EQ(LoginResult::kLocked, Try("anna", "right"));
}

TEST_F(Login, DoesNotLookAtThePasswordWhileOneHasToWait) {
    WriteAccounts(Account("anna"));
    for (int failure = 0; failure < 6; ++failure) {
        EXPECT_EQ(LoginResult::kWrong, Try("anna", "wrong"));
    }
    world.hashes.clear();
    int wait = -1;
    for (int attempt = 0; attempt < 50; ++attempt) {
        EXPECT_EQ(LoginResult::kWait, Try("anna", "right", "10.0.0.1", &wait));
        EXPECT_EQ(1, wait);
    }
    EXPECT_EQ(LoginResult::kWait, Try("anna", "right", "10.0.0.2"));
    EXPECT_EQ(LoginResult::kWait, Try("nobody", "right", "10.0.0.1"));
    EXPECT_THAT(world.hashes, IsEmpty());
    // The fifty attempts did not count: one second is all.
    world.monotonic += 1000;
    EXPECT_EQ(LoginResult::kAccepted, Try("anna", "right"));
}

TEST_F(Login, LeavesTheWaitUntouchedWhenThereIsNone) {
    WriteAccounts(Account("anna"));
    int wait = 7;
    EXPECT_EQ(LoginResult::kWrong, Try("anna", "wrong", "", &wait));
    EXPECT_EQ(LoginResult::kAccepted, Try("anna", "right", "", &wait));
    EXPECT_EQ(7, wait);
}

TEST_F(Login, ThrottlesUnknownAccountsLikeKnownOnes) {
    WriteAccounts(Account("anna"));
    for (const char* name : {"anna", "nobody"}) {
        for (int failure = 0; failure < 6; ++failure) {
            EXPECT_EQ(LoginResult::kWrong, Try(name, "wrong", "")) << name;
        }
        int wait = 0;
        EXPECT_EQ(LoginResult::kWait, Try(name, "wrong", "", &wait)) << name;
        EXPECT_EQ(1, wait) << name;
    }
}

TEST_F(Login, CountsHostileNamesAgainstTheAddress) {
    for (int failure = 0; failure < 6; ++failure) {
        EXPECT_EQ(LoginResult::kWrong, Try("../" + std::to_string(failure), "wrong"));
    }
    EXPECT_EQ(LoginResult::kWait, Try("../x", "wrong"));
}

TEST_F(Login, ForgetsTheFailuresOfAnAccountWithItsRightPassword) {
    WriteAccounts(Account("anna"));
    for (int round = 0; round < 3; ++round) {
        for (int failure = 0; failure < 5; ++failure) {
            EXPECT_EQ(LoginResult::kWrong, Try("anna", "wrong", ""));
        }
        EXPECT_EQ(LoginResult::kAccepted, Try("anna", "right", ""));
    }
}

TEST_F(Login, IsUnavailableWithoutAccountsThatCanBeBelieved) {
    WriteAccounts(Account("anna"));
    fs::permissions(TALO_ACCOUNTS_FILE, fs::perms(0666));
    EXPECT_EQ(LoginResult::kUnavailable, Try("anna", "right"));
    EXPECT_THAT(world.hashes, IsEmpty());
    EXPECT_FALSE(Logged().empty());
}

TEST_F(Login, IsUnavailableWithoutCounters) {
    WriteAccounts(Account("anna"));
    WriteFile(TALO_THROTTLE_DIR, "in the way");
    EXPECT_EQ(LoginResult::kUnavailable, Try("anna", "right"));
    EXPECT_THAT(world.hashes, IsEmpty());
}

TEST_F(Login, IsUnavailableWithoutTheModuleAndCountsNothing) {
    WriteAccounts(Account("anna"));
    world.broken = true;
    for (int attempt = 0; attempt < 10; ++attempt) {
        EXPECT_EQ(LoginResult::kUnavailable, Try("anna", "wrong"));
    }
    world.broken = false;
    EXPECT_EQ(LoginResult::kAccepted, Try("anna", "right"));
}

TEST_F(Login, WorksOverRealHashesAndTheRealClock) {
    std::string problem;
    int wait = 0;
    ASSERT_TRUE(talo::AddAccount("anna", "secret", &problem)) << problem;
    EXPECT_EQ(LoginResult::kAccepted, talo::CheckLogin("anna", "secret", "10.0.0.1", &wait));
    EXPECT_EQ(LoginResult::kWrong, talo::CheckLogin("anna", "Secret", "10.0.0.1", &wait));
    EXPECT_EQ(LoginResult::kWrong, talo::CheckLogin("nobody", "secret", "10.0.0.1", &wait));
    ASSERT_TRUE(talo::SetLocked("anna", true, &problem));
    EXPECT_EQ(LoginResult::kLocked, talo::CheckLogin("anna", "secret", "10.0.0.1", &wait));
}

}  // namespace
