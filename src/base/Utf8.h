#ifndef TALO_SRC_BASE_UTF8_H
#define TALO_SRC_BASE_UTF8_H

#include <cstddef>

namespace TALO {

// The length of the well-formed UTF-8 sequence at `at` (1 to 4 bytes), 0 when
// there is none: a stray or missing continuation byte, an overlong form, a
// surrogate, or a number above U+10FFFF. `at` must be before `end`.
size_t Utf8SequenceLength(const char* at, const char* end);

}  // namespace TALO

#endif
