#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <functional>
#include <set>

#include "AccountRoot.h"
#include "hosts/linux/account/AccountFile.h"
#include "hosts/linux/sdk/Accounts.h"
#include "platform/Paths.h"

namespace {

constexpr int kProcesses = 8;

class ParallelChanges : public AccountRoot {
  public:
    static pid_t Start(const std::function<bool()>& body) {
        const pid_t child = fork();
        if (child == 0) {
            _exit(body() ? 0 : 1);
        }
        return child;
    }

    // In as many processes at once; true when all of them say so.
    static bool InAll(const std::function<bool(int process)>& body) {
        std::vector<pid_t> children;
        for (int process = 0; process < kProcesses; ++process) {
            children.push_back(Start([&] { return body(process); }));
        }
        bool all = true;
        for (const pid_t child : children) {
            int status = -1;
            all = waitpid(child, &status, 0) == child && status == 0 && all;
        }
        return all;
    }

    static std::string NameOf(int process, int number) {
        return "user" + std::to_string(process) + "-" + std::to_string(number);
    }
};

TEST_F(ParallelChanges, LoseNoAccountAndGiveNoUidTwice) {
    constexpr int kEach = 25;
    ASSERT_TRUE(InAll([](int process) {
        std::string problem;
        for (int number = 0; number < kEach; ++number) {
            if (!host::AppendToFile(TALO_ACCOUNTS_FILE, NameOf(process, number), "", &problem)) {
                return false;
            }
        }
        return true;
    }));
    std::vector<talo::Account> accounts;
    ASSERT_TRUE(talo::ListAccounts(&accounts));
    EXPECT_EQ(static_cast<size_t>(kProcesses * kEach), accounts.size());
    std::set<unsigned> uids;
    for (const talo::Account& account : accounts) {
        uids.insert(account.uid);
    }
    EXPECT_EQ(accounts.size(), uids.size());
    EXPECT_EQ(1024u, *uids.begin());
}

TEST_F(ParallelChanges, LoseNoGrantToOneAccount) {
    constexpr int kEach = 25;
    WriteAccounts(Line("anna", 1024));
    ASSERT_TRUE(InAll([](int process) {
        std::string problem;
        for (int number = 0; number < kEach; ++number) {
            if (!talo::GrantPrivilege("anna", NameOf(process, number), "", &problem)) {
                return false;
            }
        }
        return true;
    }));
    talo::Account account;
    ASSERT_TRUE(talo::FindAccount("anna", &account));
    EXPECT_EQ(static_cast<size_t>(kProcesses * kEach), account.privileges.size());
}

TEST_F(ParallelChanges, LeaveTheOldOrTheNewFileWhenKilled) {
    const std::string locked = "{\"locked\":true,\"name\":\"anna\",\"uid\":1024}\n";
    const std::string open = "{\"locked\":false,\"name\":\"anna\",\"uid\":1024}\n";
    const std::string rest = "broken line\n" + std::string(200000, ' ') + "\n" + Line("bob", 1025);
    WriteAccounts(open + rest);
    for (int round = 0; round < 60; ++round) {
        const pid_t child = Start([] {
            std::string problem;
            for (bool lock = true;; lock = !lock) {
                if (!talo::SetLocked("anna", lock, &problem)) {
                    return false;
                }
            }
        });
        (void)usleep(static_cast<useconds_t>(500 + 211 * round));
        ASSERT_EQ(0, kill(child, SIGKILL));
        int status = 0;
        ASSERT_EQ(child, waitpid(child, &status, 0));
        ASSERT_TRUE(WIFSIGNALED(status)) << "the changes failed before they were killed";
        const std::string content = ReadAccounts();
        ASSERT_TRUE(content == locked + rest || content == open + rest) << content.size();
    }
    std::string problem;
    EXPECT_TRUE(talo::SetLocked("anna", true, &problem)) << problem;
    EXPECT_EQ(locked + rest, ReadAccounts());
}

}  // namespace
