#include "programs/common/CrashReply.h"

#include <errno.h>
#include <poll.h>
#include <stdio.h>
#include <stdio_ext.h>
#include <stdlib.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <atomic>

#include "programs/common/ErrorReply.h"

namespace {

constexpr int kSignals[] = {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT};
constexpr size_t kSignalCount = sizeof kSignals / sizeof kSignals[0];

// A full stack is a crash too. The frame that the kernel puts here holds all
// registers of the processor, and outgrows SIGSTKSZ on new ones.
alignas(16) char stack[64 * 1024];

struct sigaction actionsBefore[kSignalCount];
bool stackIsOurs = false;
volatile sig_atomic_t* replyBegun = nullptr;
volatile pid_t servingProcess = 0;
std::atomic<bool> armed(false);  // lock-free, as a signal handler needs it
static_assert(std::atomic<bool>::is_always_lock_free, "used by a signal handler");

// Somebody who shares the descriptor may have made it refuse to wait.
void WriteWhole(const char* text, size_t size) {
    constexpr int kPatience = 1000;  // milliseconds
    while (size > 0) {
        const ssize_t put = write(STDOUT_FILENO, text, size);
        if (put > 0) {
            text += put;
            size -= static_cast<size_t>(put);
            continue;
        }
        struct pollfd output = {STDOUT_FILENO, POLLOUT, 0};
        if (put == 0 || (errno != EINTR && errno != EAGAIN) ||
            (errno == EAGAIN && poll(&output, 1, kPatience) <= 0)) {
            return;
        }
    }
}

// Once, whatever else goes wrong on the way down.
void ReplyIfNothingHasLeft() {
    if (!armed || getpid() != servingProcess || !armed.exchange(false) || *replyBegun != 0) {
        return;
    }
    *replyBegun = 1;
    const ErrorReply reply = ReplyFor(ReplyStatus::kCrashed);
    WriteWhole(reply.text, reply.size);
}

// Then the signal strikes again, with the action that it had before: a fault by
// itself, when the instruction is tried once more, so that a core file shows the
// place.
void AnswerAndFall(int number, siginfo_t* facts, void*) {
    const int kept = errno;
    ReplyIfNothingHasLeft();
    for (size_t index = 0; index < kSignalCount; ++index) {
        if (kSignals[index] == number) {
            (void)sigaction(number, &actionsBefore[index], nullptr);
        }
    }
    if (facts->si_code <= 0) {
        (void)raise(number);
    }
    errno = kept;
}

// What a method has left in the buffer of standard output it meant as its reply:
// it leaves as soon as we return.
void AnswerAtExit() {
    if (__fpending(stdout) == 0) {
        ReplyIfNothingHasLeft();
    }
}

// The system's own, which calls no handlers.
[[noreturn]] void EndAtOnce(int status) {
    for (;;) {
        (void)syscall(SYS_exit_group, status);
    }
}

void InstallStack() {
    stack_t ours = {};
    ours.ss_sp = stack;
    ours.ss_size = sizeof stack;
    stack_t before = {};
    stackIsOurs = sigaltstack(&ours, &before) == 0;
    if (stackIsOurs && (before.ss_flags & SS_DISABLE) == 0) {
        (void)sigaltstack(&before, nullptr);
        stackIsOurs = false;
    }
}

void RemoveStack() {
    stack_t none = {};
    none.ss_flags = SS_DISABLE;
    if (stackIsOurs) {
        (void)sigaltstack(&none, nullptr);
    }
}

}  // namespace

void BeginCrashReply(volatile sig_atomic_t* begun) {
    static const bool registered = atexit(AnswerAtExit) == 0;
    (void)registered;
    replyBegun = begun;
    servingProcess = getpid();
    InstallStack();
    struct sigaction action = {};
    action.sa_sigaction = AnswerAndFall;
    action.sa_flags = SA_SIGINFO | SA_ONSTACK;
    (void)sigemptyset(&action.sa_mask);
    for (size_t index = 0; index < kSignalCount; ++index) {
        (void)sigaction(kSignals[index], &action, &actionsBefore[index]);
    }
    armed = true;
}

// The program comes before the C library where a method's call is bound.
__attribute__((visibility("default"))) void _exit(int status) {
    AnswerAtExit();
    EndAtOnce(status);
}

__attribute__((visibility("default"))) void _Exit(int status) noexcept {
    AnswerAtExit();
    EndAtOnce(status);
}

// Also the action that a method has put in place of ours goes.
void EndCrashReply() {
    if (!armed.exchange(false)) {
        return;
    }
    for (size_t index = 0; index < kSignalCount; ++index) {
        (void)sigaction(kSignals[index], &actionsBefore[index], nullptr);
    }
    RemoveStack();
}
