#include "src/base/Utf8.h"

namespace TALO {

size_t Utf8SequenceLength(const char* at, const char* end) {
    const auto byte = [at](size_t index) { return static_cast<unsigned char>(at[index]); };
    const unsigned char lead = byte(0);
    if (lead < 0x80) {
        return 1;
    }
    // The lead byte settles the length; the second byte's range excludes
    // overlong forms, surrogates and what lies above U+10FFFF.
    size_t length = 0;
    unsigned char low = 0x80;
    unsigned char high = 0xBF;
    if (lead >= 0xC2 && lead <= 0xDF) {
        length = 2;
    } else if (lead >= 0xE0 && lead <= 0xEF) {
        length = 3;
        low = lead == 0xE0 ? 0xA0 : low;
        high = lead == 0xED ? 0x9F : high;
    } else if (lead >= 0xF0 && lead <= 0xF4) {
        length = 4;
        low = lead == 0xF0 ? 0x90 : low;
        high = lead == 0xF4 ? 0x8F : high;
    } else {
        return 0;
    }
    if (static_cast<size_t>(end - at) < length || byte(1) < low || byte(1) > high) {
        return 0;
    }
    for (size_t index = 2; index < length; ++index) {
        if ((byte(index) & 0xC0) != 0x80) {
            return 0;
        }
    }
    return length;
}

}  // namespace TALO
