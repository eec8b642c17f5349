#include "programs/common/CrashReply.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "programs/common/ErrorReply.h"
#include "tests/support/Child.h"
#include "tests/support/Crashes.h"

namespace {

using support::ChildResult;
using support::Crash;
using support::CrashBy;
using support::InChild;

volatile sig_atomic_t begun = 0;

std::string Reply() {
    const ErrorReply reply = ReplyFor(ReplyStatus::kCrashed);
    return std::string(reply.text, reply.size);
}

// A sanitizer takes its own action on some of these signals, and ends the process
// with a status of its own.
bool EndedBy(const ChildResult& result, int signal) {
#ifdef __SANITIZE_ADDRESS__
    return result.status != 0 && (signal == SIGABRT ? result.status == 1000 + signal : true);
#else
    return result.status == 1000 + signal;
#endif
}

int Serve(const std::string& crash) {
    BeginCrashReply(&begun);
    CrashBy(crash);
    return 0;
}

class EveryCrash : public testing::TestWithParam<Crash> {};

TEST_P(EveryCrash, IsAnsweredAndEndsTheProcessAsItWould) {
    const ChildResult result = InChild([] { return Serve(GetParam().name); });
    EXPECT_EQ(result.output, Reply());
    EXPECT_TRUE(EndedBy(result, GetParam().signal)) << result.status;
}

TEST_P(EveryCrash, AddsNothingToAReplyThatHasBegun) {
    const ChildResult result = InChild([] {
        begun = 1;
        (void)write(STDOUT_FILENO, "half", 4);
        return Serve(GetParam().name);
    });
    EXPECT_EQ(result.output, "half");
    EXPECT_TRUE(EndedBy(result, GetParam().signal)) << result.status;
}

TEST_P(EveryCrash, IsNobodysConcernBehindTheEnd) {
    const ChildResult result = InChild([] {
        BeginCrashReply(&begun);
        EndCrashReply();
        CrashBy(GetParam().name);
        return 0;
    });
    EXPECT_EQ(result.output, "");
    EXPECT_TRUE(EndedBy(result, GetParam().signal)) << result.status;
}

TEST_P(EveryCrash, OfAForkedChildIsNotAnswered) {
    const ChildResult result = InChild([] {
        BeginCrashReply(&begun);
        const pid_t child = fork();
        if (child == 0) {
            CrashBy(GetParam().name);
            _exit(0);
        }
        int status = 0;
        const bool crashed = waitpid(child, &status, 0) == child && status != 0;
        EndCrashReply();
        return crashed && begun == 0 ? 7 : 8;
    });
    EXPECT_EQ(result.output, "");
    EXPECT_EQ(result.status, 7);
}

INSTANTIATE_TEST_SUITE_P(CrashReply, EveryCrash, testing::ValuesIn(support::kCrashes),
                         [](const auto& info) { return std::string(info.param.name); });

TEST(CrashReply, LeavesOutWhatTheMethodHasInItsBuffer) {
    const ChildResult result = InChild([] {
        std::printf("unsent");
        return Serve("segfault");
    });
    EXPECT_EQ(result.output, Reply());
}

// Whoever shares the flag must not answer once more.
TEST(CrashReply, SaysThatAReplyHasBegun) {
    void* const page = mmap(nullptr, sizeof(sig_atomic_t), PROT_READ | PROT_WRITE,
                            MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    ASSERT_NE(page, MAP_FAILED);
    volatile sig_atomic_t* const shared = static_cast<volatile sig_atomic_t*>(page);
    const ChildResult result = InChild([&] {
        BeginCrashReply(shared);
        CrashBy("abort");
        return 0;
    });
    EXPECT_EQ(result.output, Reply());
    EXPECT_EQ(*shared, 1);
    (void)munmap(page, sizeof(sig_atomic_t));
}

TEST(CrashReply, AnswersForAMethodThatExits) {
    const ChildResult result = InChild([]() -> int {
        BeginCrashReply(&begun);
        exit(5);
    });
    EXPECT_EQ(result.output, Reply());
    EXPECT_EQ(result.status, 5);
}

TEST(CrashReply, AnswersForAMethodThatEndsPastAllHandlers) {
    void (*const ends[])(int) = {_exit, _Exit};
    for (const auto end : ends) {
        const ChildResult result = InChild([end]() -> int {
            BeginCrashReply(&begun);
            end(5);
            return 6;
        });
        EXPECT_EQ(result.output, Reply());
        EXPECT_EQ(result.status, 5);
    }
}

TEST(CrashReply, LeavesTheEndOfAChildToTheChild) {
    const ChildResult result = InChild([] {
        BeginCrashReply(&begun);
        const pid_t child = fork();
        if (child == 0) {
            _exit(3);
        }
        int status = 0;
        const bool ended = waitpid(child, &status, 0) == child && WEXITSTATUS(status) == 3;
        EndCrashReply();
        return ended ? 7 : 8;
    });
    EXPECT_EQ(result.output, "");
    EXPECT_EQ(result.status, 7);
}

TEST(CrashReply, TakesTheBufferOfAMethodThatExitsForItsReply) {
    const ChildResult result = InChild([]() -> int {
        BeginCrashReply(&begun);
        std::printf("its own");
        exit(5);
    });
    EXPECT_EQ(result.output, "its own");
    EXPECT_EQ(result.status, 5);
}

TEST(CrashReply, AddsNothingAtTheExitOfARequestThatHasEnded) {
    const ChildResult result = InChild([]() -> int {
        BeginCrashReply(&begun);
        EndCrashReply();
        exit(0);
    });
    EXPECT_EQ(result.output, "");
    EXPECT_EQ(result.status, 0);
}

TEST(CrashReply, PutsActionsAndAlternateStackBack) {
    const ChildResult result = InChild([] {
        (void)signal(SIGBUS, SIG_IGN);
        stack_t stackBefore = {};
        (void)sigaltstack(nullptr, &stackBefore);
        struct sigaction before[2] = {};
        (void)sigaction(SIGSEGV, nullptr, &before[0]);
        BeginCrashReply(&begun);
        (void)signal(SIGBUS, SIG_DFL);
        EndCrashReply();
        struct sigaction after = {};
        (void)sigaction(SIGSEGV, nullptr, &after);
        EXPECT_EQ(after.sa_handler, before[0].sa_handler);
        (void)sigaction(SIGBUS, nullptr, &after);
        EXPECT_EQ(after.sa_handler, SIG_IGN);
        stack_t stackAfter = {};
        (void)sigaltstack(nullptr, &stackAfter);
        EXPECT_EQ(stackAfter.ss_flags, stackBefore.ss_flags);
        EXPECT_TRUE(stackAfter.ss_sp == stackBefore.ss_sp ||
                    (stackAfter.ss_flags & SS_DISABLE) != 0);
        return 0;
    });
    EXPECT_EQ(result.status, 0);
}

TEST(CrashReply, AnswersTheNextRequestOfTheSameProcessToo) {
    const ChildResult result = InChild([] {
        BeginCrashReply(&begun);
        EndCrashReply();
        EndCrashReply();
        return Serve("overflow");
    });
    EXPECT_EQ(result.output, Reply());
}

// A pipe that is full, and refuses to wait for its reader.
TEST(CrashReply, WaitsForAReaderWhoIsBusy) {
    const ChildResult result = InChild([] {
        int ends[2];
        if (pipe2(ends, O_NONBLOCK) != 0) {
            return 1;
        }
        const pid_t server = fork();
        if (server == 0) {
            (void)dup2(ends[1], STDOUT_FILENO);
            (void)close(ends[0]);
            (void)close(ends[1]);
            while (write(STDOUT_FILENO, "x", 1) == 1) {
            }
            return Serve("abort");
        }
        (void)close(ends[1]);
        (void)usleep(100 * 1000);
        std::string received;
        char block[4096];
        struct pollfd input = {ends[0], POLLIN, 0};
        for (ssize_t got = 0;
             poll(&input, 1, 10000) > 0 && (got = read(ends[0], block, sizeof block)) > 0;) {
            received.append(block, static_cast<size_t>(got));
        }
        (void)waitpid(server, nullptr, 0);
        received.erase(0, received.find_first_not_of('x'));
        return received == Reply() ? 7 : 8;
    });
    EXPECT_EQ(result.status, 7);
}

}  // namespace
