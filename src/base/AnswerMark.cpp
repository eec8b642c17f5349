#include "src/base/AnswerMark.h"

#include <unistd.h>

namespace TALO {

namespace {

volatile sig_atomic_t* lent = nullptr;
pid_t owner = 0;

}  // namespace

void LendAnswerMark(volatile sig_atomic_t* mark) {
    lent = mark;
    owner = getpid();
}

// The mark may lie in memory that a forked child shares. What a background task
// or a callback runs is nobody's answer, and by then the mark may stand for the
// next request.
void MarkAnswerBegun() {
    if (lent != nullptr && owner == getpid()) {
        *lent = 1;
    }
}

}  // namespace TALO
