#include <sys/wait.h>
#include <unistd.h>

#include <string>

#include "platform/System.h"
#include "tests/contract/World.h"
#include "tests/support/Child.h"

namespace {

std::string Target(int descriptor) {
    char target[4096] = {};
    const std::string link = "/proc/self/fd/" + std::to_string(descriptor);
    return readlink(link.c_str(), target, sizeof target - 1) < 0 ? "" : target;
}

TEST(ProcFork, AnswersZeroInTheChildAndItsIdInTheParent) {
    const support::ChildResult result = support::InChild([] {
        const pid_t parent = getpid();
        const int child = TLIBCProcFork();
        if (child == 0) {
            _exit(getppid() == parent ? 7 : 8);
        }
        int status = 0;
        EXPECT_EQ(waitpid(child, &status, 0), child);
        EXPECT_EQ(WEXITSTATUS(status), 7);
        return 0;
    });
    EXPECT_EQ(result.status, 0) << result.output;
}

TEST(ProcFork, LeadsTheChildsStandardDescriptorsNowhere) {
    const support::ChildResult result = support::InChild([] {
        const int child = TLIBCProcFork();
        if (child == 0) {
            const bool nowhere =
                Target(0) == "/dev/null" && Target(1) == "/dev/null" && Target(2) == "/dev/null";
            _exit(nowhere ? 7 : 8);
        }
        int status = 0;
        EXPECT_EQ(waitpid(child, &status, 0), child);
        EXPECT_EQ(WEXITSTATUS(status), 7);
        EXPECT_NE(Target(1), "/dev/null");
        return 0;
    });
    EXPECT_EQ(result.status, 0) << result.output;
}

}  // namespace
