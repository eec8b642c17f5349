#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <string>

#include "platform/System.h"
#include "tests/support/Child.h"

namespace {

std::string Target(int descriptor) {
    char target[4096] = {};
    const std::string link = "/proc/self/fd/" + std::to_string(descriptor);
    return readlink(link.c_str(), target, sizeof target - 1) < 0 ? "" : target;
}

bool LeadsNowhereAlsoAfterExec(int descriptor) {
    return Target(descriptor) == "/dev/null" && (fcntl(descriptor, F_GETFD) & FD_CLOEXEC) == 0;
}

// The status of a child in which a check of the three descriptors was made.
int CheckDescriptorsInAFork() {
    const int child = TLIBCProcFork();
    if (child == 0) {
        bool good = true;
        for (int descriptor = 0; descriptor <= 2; ++descriptor) {
            good = good && LeadsNowhereAlsoAfterExec(descriptor);
        }
        _exit(good ? 7 : 8);
    }
    int status = 0;
    return waitpid(child, &status, 0) == child && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

TEST(Fork, LeadsTheChildsStandardDescriptorsNowhere) {
    const support::ChildResult result = support::InChild([] { return CheckDescriptorsInAFork(); });
    EXPECT_EQ(result.status, 7);
}

TEST(Fork, FillsStandardDescriptorsThatWereClosed) {
    for (const int closed : {0, 1, 2}) {
        const support::ChildResult result = support::InChild([closed] {
            (void)close(closed);
            return CheckDescriptorsInAFork();
        });
        EXPECT_EQ(result.status, 7) << closed;
    }
    const support::ChildResult result = support::InChild([] {
        for (int descriptor = 0; descriptor <= 2; ++descriptor) {
            (void)close(descriptor);
        }
        return CheckDescriptorsInAFork();
    });
    EXPECT_EQ(result.status, 7);
}

TEST(Fork, LeavesTheParentsDescriptorsAndTheChildsOthersAlone) {
    const support::ChildResult result = support::InChild([] {
        const std::string before = Target(1);
        int ends[2];
        (void)!pipe(ends);
        const int child = TLIBCProcFork();
        if (child == 0) {
            (void)!write(ends[1], "x", 1);
            _exit(0);
        }
        char byte = 0;
        const bool passed = read(ends[0], &byte, 1) == 1 && Target(1) == before;
        (void)waitpid(child, nullptr, 0);
        return passed ? 7 : 8;
    });
    EXPECT_EQ(result.status, 7);
}

// InChild waits for the end of the output: it ends while the other process lives.
TEST(Fork, LetsTheReaderOfTheParentsOutputGo) {
    const support::ChildResult result = support::InChild([] {
        const int child = TLIBCProcFork();
        if (child == 0) {
            (void)pause();
            _exit(0);
        }
        (void)printf("%d", child);
        return 0;
    });
    const pid_t child = static_cast<pid_t>(std::stol(result.output));
    EXPECT_EQ(kill(child, SIGKILL), 0);
}

}  // namespace
