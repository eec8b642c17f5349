#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <functional>

#include "tests/host/nodes/NodeRoot.h"

namespace {

class ParallelNodes : public NodeRoot {
  public:
    static pid_t Start(const std::function<bool()>& body) {
        const pid_t child = fork();
        if (child == 0) {
            _exit(body() ? 0 : 1);
        }
        return child;
    }
};

TEST_F(ParallelNodes, LoseNoAppliance) {
    constexpr int kProcesses = 8;
    constexpr int kEach = 25;
    std::vector<pid_t> children;
    for (int process = 0; process < kProcesses; ++process) {
        children.push_back(Start([process] {
            for (int number = 0; number < kEach; ++number) {
                if (!talo::SetNode(Called(1 + process * kEach + number), nullptr)) {
                    return false;
                }
            }
            return true;
        }));
    }
    for (const pid_t child : children) {
        int status = -1;
        ASSERT_EQ(child, waitpid(child, &status, 0));
        EXPECT_EQ(0, status);
    }
    EXPECT_EQ(static_cast<size_t>(kProcesses * kEach), Ids().size());
}

TEST_F(ParallelNodes, LeaveTheOldOrTheNewFileWhenKilled) {
    const std::string rest = "broken line\n# " + std::string(200000, ' ') + "\n" + CallingLine(3);
    const std::string called = CalledLine(2);
    const std::string calling = CallingLine(2);
    WriteNodes(called + rest);
    for (int round = 0; round < 40; ++round) {
        const pid_t child = Start([] {
            for (bool call = false;; call = !call) {
                if (!talo::SetNode(call ? Called(2) : Calling(2, {"normal.local"}), nullptr)) {
                    return false;
                }
            }
        });
        (void)usleep(static_cast<useconds_t>(500 + 211 * round));
        ASSERT_EQ(0, kill(child, SIGKILL));
        int status = 0;
        ASSERT_EQ(child, waitpid(child, &status, 0));
        ASSERT_TRUE(WIFSIGNALED(status)) << "the changes failed before they were killed";
        const std::string content = ReadNodes();
        ASSERT_TRUE(content == called + rest || content == calling + rest) << content.size();
        ASSERT_EQ(2u, Ids().size());
    }
    Set(Called(2));
    EXPECT_EQ(called + rest, ReadNodes());
}

}  // namespace
