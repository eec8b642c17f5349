#ifndef TALO_SRC_BASE_ANSWERMARK_H
#define TALO_SRC_BASE_ANSWERMARK_H

#include <signal.h>

namespace TALO {

// Lends the mark of a begun answer; null takes it back.
void LendAnswerMark(volatile sig_atomic_t* mark);

// Sets it: from here on bytes of an answer may be with the client.
void MarkAnswerBegun();

}  // namespace TALO

#endif
