#include "StopSignal.h"

namespace {

volatile sig_atomic_t stopAsked = 0;

void Remember(int) {
    stopAsked = 1;
}

sigset_t OnlyTerm() {
    sigset_t signals;
    (void)sigemptyset(&signals);
    (void)sigaddset(&signals, SIGTERM);
    return signals;
}

}  // namespace

HeldStop::HeldStop() {
    const sigset_t term = OnlyTerm();
    (void)pthread_sigmask(SIG_BLOCK, &term, &before_);
}

HeldStop::~HeldStop() {
    (void)pthread_sigmask(SIG_SETMASK, &before_, nullptr);
}

void NoticeStop() {
    struct sigaction action = {};
    action.sa_handler = Remember;
    (void)sigaction(SIGTERM, &action, nullptr);
    const sigset_t term = OnlyTerm();
    (void)pthread_sigmask(SIG_UNBLOCK, &term, nullptr);
}

bool IsStopAsked() {
    return stopAsked != 0;
}
