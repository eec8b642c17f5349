#include "hosts/linux/util/Utf8.h"

namespace host {

size_t Utf8Character(const std::string& text, size_t at) {
    const auto byte = [&](size_t offset) {
        return at + offset < text.size() ? static_cast<unsigned char>(text[at + offset]) : 0u;
    };
    const auto follows = [&](size_t offset) { return (byte(offset) & 0xC0u) == 0x80u; };
    const unsigned lead = byte(0);
    if (lead < 0x80) {
        return 1;
    }
    if (lead >= 0xC2 && lead <= 0xDF && follows(1)) {
        return 2;
    }
    if (lead >= 0xE0 && lead <= 0xEF && follows(1) && follows(2)) {
        const bool overlong = lead == 0xE0 && byte(1) < 0xA0;
        const bool surrogate = lead == 0xED && byte(1) > 0x9F;
        return overlong || surrogate ? 0 : 3;
    }
    if (lead >= 0xF0 && lead <= 0xF4 && follows(1) && follows(2) && follows(3)) {
        const bool overlong = lead == 0xF0 && byte(1) < 0x90;
        const bool tooLarge = lead == 0xF4 && byte(1) > 0x8F;
        return overlong || tooLarge ? 0 : 4;
    }
    return 0;
}

bool IsControlCharacter(const std::string& text, size_t at) {
    const unsigned char first = static_cast<unsigned char>(text[at]);
    return first < 0x20 || first == 0x7F ||
           (first == 0xC2 && at + 1 < text.size() &&
            static_cast<unsigned char>(text[at + 1]) < 0xA0);
}

}  // namespace host
