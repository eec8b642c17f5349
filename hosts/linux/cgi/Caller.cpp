#include "hosts/linux/cgi/Caller.h"

namespace host {

namespace {

struct Accepted {
    const TALOCGI* context = nullptr;
    Caller caller;
};

// Of the thread: what one accepts must not speak for another.
Accepted& Last() {
    static thread_local Accepted last;
    return last;
}

}  // namespace

void SetCaller(const TALOCGI* context, const talo::Session& session) {
    const Caller caller = {session.user, session.language};
    Last() = {context, caller};
}

void ForgetCaller(const TALOCGI* context) {
    if (Last().context == context) {
        Last() = Accepted();
    }
}

void ForgetCaller() {
    Last() = Accepted();
}

bool FindCaller(Caller* caller) {
    if (Last().context == nullptr) {
        return false;
    }
    *caller = Last().caller;
    return true;
}

}  // namespace host
