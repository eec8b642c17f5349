#include "hosts/linux/cgi/EndSignal.h"

namespace host {

namespace {

volatile sig_atomic_t come = 0;

void Note(int) {
    come = 1;
}

}  // namespace

// Without SA_RESTART: a read that waits for the client has to return.
EndSignal::EndSignal() : before_(), taken_(false) {
    come = 0;
    if (sigaction(SIGTERM, nullptr, &before_) != 0 || before_.sa_handler != SIG_DFL) {
        return;
    }
    struct sigaction action = {};
    action.sa_handler = Note;
    (void)sigemptyset(&action.sa_mask);
    taken_ = sigaction(SIGTERM, &action, nullptr) == 0;
}

EndSignal::~EndSignal() {
    if (taken_ && sigaction(SIGTERM, &before_, nullptr) == 0 && come != 0) {
        (void)raise(SIGTERM);
    }
}

bool EndSignal::HasCome() {
    return come != 0;
}

}  // namespace host
