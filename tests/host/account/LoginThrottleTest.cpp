#include "hosts/linux/account/LoginThrottle.h"

#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <climits>
#include <cstring>
#include <filesystem>

#include "AccountRoot.h"
#include "platform/Paths.h"

namespace fs = std::filesystem;

namespace {

constexpr char kDir[] = TALO_THROTTLE_DIR;
constexpr long long kHour = 3600 * 1000;

class Throttle : public AccountRoot {
  public:
    int Wait(const std::string& account, const std::string& address) const {
        const host::LoginThrottle throttle(kDir, account, address, now);
        EXPECT_TRUE(throttle.IsReady());
        return throttle.WaitSeconds();
    }

    void Fail(const std::string& account, const std::string& address, int times = 1) const {
        for (int time = 0; time < times; ++time) {
            host::LoginThrottle throttle(kDir, account, address, now);
            EXPECT_TRUE(throttle.Fail());
        }
    }

    void Succeed(const std::string& account, const std::string& address) const {
        host::LoginThrottle throttle(kDir, account, address, now);
        EXPECT_TRUE(throttle.Succeed());
    }

    static size_t FilesOfKind(const std::string& kind) {
        size_t files = 0;
        for (const auto& entry : fs::directory_iterator(kDir)) {
            files += entry.path().filename().string().rfind(kind, 0) == 0 ? 1u : 0u;
        }
        return files;
    }

    static std::string BucketOf(const std::string& kind) {
        for (const auto& entry : fs::directory_iterator(kDir)) {
            if (entry.path().filename().string().rfind(kind, 0) == 0) {
                return entry.path();
            }
        }
        return "";
    }

    long long now = 1000000;
};

struct WaitRow {
    unsigned failures;
    long long milliseconds;
};

TEST(WaitAfter, DoublesFromOneSecondToFiveMinutes) {
    const WaitRow rows[] = {{0, 0},        {1, 0},         {2, 0},
                            {5, 0},        {6, 1000},      {7, 2000},
                            {8, 4000},     {9, 8000},      {10, 16000},
                            {11, 32000},   {12, 64000},    {13, 128000},
                            {14, 256000},  {15, 300000},   {16, 300000},
                            {100, 300000}, {1000, 300000}, {UINT_MAX, 300000}};
    for (const WaitRow& row : rows) {
        EXPECT_EQ(row.milliseconds, host::WaitAfter(row.failures)) << row.failures;
    }
}

TEST_F(Throttle, WalksTheWholeTableWithTheClock) {
    const int waits[] = {0, 0, 0, 0, 0, 1, 2, 4, 8, 16, 32, 64, 128, 256, 300, 300, 300};
    for (const int wait : waits) {
        EXPECT_EQ(0, Wait("anna", ""));
        Fail("anna", "");
        EXPECT_EQ(wait, Wait("anna", ""));
        if (wait > 0) {
            now += wait * 1000 - 1;
            EXPECT_EQ(1, Wait("anna", ""));
            now += 1;
        }
    }
}

TEST_F(Throttle, RoundsTheWaitUp) {
    Fail("anna", "", 8);
    EXPECT_EQ(4, Wait("anna", ""));
    now += 1;
    EXPECT_EQ(4, Wait("anna", ""));
    now += 999;
    EXPECT_EQ(3, Wait("anna", ""));
}

TEST_F(Throttle, CountsAccountAndAddressApart) {
    Fail("anna", "10.0.0.1", 6);
    EXPECT_EQ(1, Wait("anna", "10.0.0.2"));
    EXPECT_EQ(1, Wait("bob", "10.0.0.1"));
    EXPECT_EQ(0, Wait("bob", "10.0.0.2"));
}

TEST_F(Throttle, CountsManyAccountsFromOneAddress) {
    for (int number = 0; number < 6; ++number) {
        Fail("user" + std::to_string(number), "10.0.0.1");
    }
    EXPECT_EQ(1, Wait("other", "10.0.0.1"));
    EXPECT_EQ(0, Wait("user0", "10.0.0.2"));
}

TEST_F(Throttle, AnswersTheLongerWait) {
    Fail("anna", "10.0.0.1", 7);
    Fail("anna", "10.0.0.2", 1);
    EXPECT_EQ(4, Wait("anna", "10.0.0.1"));
    EXPECT_EQ(2, Wait("bob", "10.0.0.1"));
}

TEST_F(Throttle, ForgetsAfterAnHourWithoutFailure) {
    Fail("anna", "10.0.0.1", 20);
    now += kHour - 1;
    Fail("anna", "10.0.0.1");
    EXPECT_EQ(300, Wait("anna", "10.0.0.1"));
    now += kHour;
    EXPECT_EQ(0, Wait("anna", "10.0.0.1"));
    Fail("anna", "10.0.0.1", 5);
    EXPECT_EQ(0, Wait("anna", "10.0.0.1"));
    Fail("anna", "10.0.0.1");
    EXPECT_EQ(1, Wait("anna", "10.0.0.1"));
}

TEST_F(Throttle, SuccessClearsTheAccountButNotTheAddress) {
    Fail("anna", "10.0.0.1", 6);
    now += 1000;
    Succeed("anna", "10.0.0.1");
    Fail("anna", "10.0.0.2", 5);
    EXPECT_EQ(0, Wait("anna", "10.0.0.3"));
    Fail("bob", "10.0.0.1");
    EXPECT_EQ(2, Wait("carl", "10.0.0.1"));
}

TEST_F(Throttle, SuccessOfOneAccountLeavesTheOthers) {
    Fail("anna", "", 6);
    Succeed("bob", "");
    EXPECT_EQ(1, Wait("anna", ""));
}

TEST_F(Throttle, ForgetsWhatTheClockHasNotSeenYet) {
    Fail("anna", "10.0.0.1", 20);
    now -= 1;
    EXPECT_EQ(0, Wait("anna", "10.0.0.1"));
}

TEST_F(Throttle, ForgetsAWholeBucketThatTheClockHasNotSeenYet) {
    const std::string path = ACCOUNT_ROOT "/bucket";
    for (unsigned number = 0; number < host::kKeysPerBucket; ++number) {
        EXPECT_TRUE(host::LoginCounter(path, "user" + std::to_string(number), now).CountFailure());
    }
    now -= 10000;
    EXPECT_EQ(0, host::LoginCounter(path, "new", now).WaitSeconds());
}

TEST_F(Throttle, CountsAnIPv6NetworkAsOneAddress) {
    for (int number = 0; number < 6; ++number) {
        Fail("", "2001:db8:0:7::" + std::to_string(number));
    }
    EXPECT_EQ(1, Wait("", "2001:db8:0:7:ffff::1"));
    EXPECT_EQ(0, Wait("", "2001:db8:0:8::1"));
}

TEST_F(Throttle, CountsEverySpellingOfAnAddressAsOne) {
    Fail("", "10.0.0.1", 3);
    Fail("", "::ffff:10.0.0.1", 3);
    EXPECT_EQ(1, Wait("", "::FFFF:0a00:1"));
}

TEST_F(Throttle, CountsNoAddressThatIsNone) {
    for (const char* address : {"", "unknown", "../../etc/passwd", "10.0.0.1/8"}) {
        Fail("", address, 10);
        EXPECT_EQ(0, Wait("", address)) << address;
    }
    EXPECT_EQ(0u, FilesOfKind(""));
}

TEST_F(Throttle, TakesAnAccountsNameOf64Bytes) {
    const std::string name(64, 'x');
    Fail(name, "", 6);
    EXPECT_EQ(1, Wait(name, ""));
    EXPECT_EQ(0, Wait(std::string(63, 'x'), ""));
}

TEST_F(Throttle, NeverHasMoreFilesThanBuckets) {
    for (int number = 0; number < 12000; ++number) {
        const host::LoginThrottle throttle(kDir, "user" + std::to_string(number), "", now);
        ASSERT_TRUE(throttle.IsReady());
    }
    EXPECT_GT(FilesOfKind("account."), host::kBuckets / 2);
    EXPECT_LE(FilesOfKind("account."), host::kBuckets);
    EXPECT_LE(fs::file_size(BucketOf("account.")), 4096u);
}

TEST_F(Throttle, FloodingABucketLosesNoCount) {
    const std::string path = ACCOUNT_ROOT "/bucket";
    const auto wait = [&](const std::string& key) {
        return host::LoginCounter(path, key, now).WaitSeconds();
    };
    const auto fail = [&](const std::string& key) {
        EXPECT_TRUE(host::LoginCounter(path, key, now).CountFailure());
    };
    for (int failure = 0; failure < 8; ++failure) {
        fail("anna");
    }
    for (int number = 0; number < 500; ++number) {
        fail("filler" + std::to_string(number));
    }
    EXPECT_GE(wait("anna"), 4);
    // Guesses at one account between such floods count on as well.
    int guesses = 0;
    for (; wait("bob") == 0 && guesses < 100; ++guesses) {
        fail("bob");
        for (int number = 0; number < 40; ++number) {
            fail("again" + std::to_string(guesses) + "-" + std::to_string(number));
        }
    }
    EXPECT_LE(guesses, 6);
    EXPECT_LE(fs::file_size(path), 4096u);
    now += kHour;
    EXPECT_EQ(0, wait("anna"));
    EXPECT_EQ(0, wait("new"));
}

TEST_F(Throttle, SurvivesABucketOfNonsense) {
    Fail("anna", "", 6);
    const std::string path = BucketOf("account.");
    WriteFile(path, std::string(100, '\xff'));
    EXPECT_EQ(0, Wait("anna", ""));
    Fail("anna", "", 6);
    EXPECT_EQ(1, Wait("anna", ""));
    WriteFile(path, std::string(8192, '\x01'));
    Fail("anna", "", 6);
    EXPECT_GT(Wait("anna", ""), 0);
}

TEST_F(Throttle, MakesItsFolderForItsOwnerOnly) {
    const mode_t before = umask(0);
    Fail("anna", "10.0.0.1");
    (void)umask(before);
    struct stat facts = {};
    ASSERT_EQ(0, stat(kDir, &facts));
    EXPECT_EQ(0700u, facts.st_mode & 07777);
    ASSERT_EQ(0, stat(BucketOf("account.").c_str(), &facts));
    EXPECT_EQ(0600u, facts.st_mode & 07777);
}

TEST_F(Throttle, IsNotReadyInAFolderThatOthersMayWrite) {
    fs::create_directories(kDir);
    ASSERT_EQ(0, chmod(kDir, 0777));
    EXPECT_FALSE(host::LoginThrottle(kDir, "anna", "", now).IsReady());
    EXPECT_TRUE(WasLogged("others may write there"));
}

TEST_F(Throttle, IsNotReadyWithoutItsFolder) {
    WriteFile(kDir, "a file");
    EXPECT_FALSE(host::LoginThrottle(kDir, "anna", "", now).IsReady());
    EXPECT_TRUE(WasLogged("cannot make"));
}

TEST_F(Throttle, DoesNotFollowALinkInThePlaceOfABucket) {
    Fail("anna", "");
    const std::string path = BucketOf("account.");
    fs::remove(path);
    WriteFile(ACCOUNT_ROOT "/victim", "precious");
    fs::create_symlink(ACCOUNT_ROOT "/victim", path);
    EXPECT_FALSE(host::LoginThrottle(kDir, "anna", "", now).IsReady());
    EXPECT_EQ("precious", ReadFile(ACCOUNT_ROOT "/victim"));
}

TEST_F(Throttle, CountsEveryFailureOfEightProcesses) {
    constexpr int kProcesses = 8;
    constexpr int kEach = 40;
    const std::string path = ACCOUNT_ROOT "/bucket";
    for (int process = 0; process < kProcesses; ++process) {
        if (fork() == 0) {
            for (int failure = 0; failure < kEach; ++failure) {
                host::LoginCounter counter(path, "key", now);
                (void)counter.CountFailure();
            }
            _exit(0);
        }
    }
    for (int process = 0; process < kProcesses; ++process) {
        ASSERT_GT(wait(nullptr), 0);
    }
    const std::string content = ReadFile(path);
    unsigned failures = 0;
    ASSERT_GE(content.size(), 76u);
    memcpy(&failures, content.data() + 72, sizeof failures);
    EXPECT_EQ(static_cast<unsigned>(kProcesses * kEach), failures);
}

}  // namespace
