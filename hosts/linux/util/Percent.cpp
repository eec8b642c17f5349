#include "hosts/linux/util/Percent.h"

#include "hosts/linux/util/HexDigit.h"

namespace host {

namespace {

bool IsUnreserved(char byte) {
    return (byte >= '0' && byte <= '9') || (byte >= 'a' && byte <= 'z') ||
           (byte >= 'A' && byte <= 'Z') || byte == '-' || byte == '_' || byte == '.' || byte == '~';
}

}  // namespace

std::string PercentDecode(const std::string& text, bool plusIsBlank) {
    std::string out;
    out.reserve(text.size());
    for (size_t index = 0; index < text.size(); ++index) {
        const char byte = text[index];
        if (byte == '%' && index + 2 < text.size()) {
            const int high = HexValue(text[index + 1]);
            const int low = HexValue(text[index + 2]);
            if (high >= 0 && low >= 0) {
                out += static_cast<char>(high << 4 | low);
                index += 2;
                continue;
            }
        }
        out += byte == '+' && plusIsBlank ? ' ' : byte;
    }
    return out;
}

std::string PercentEncode(const std::string& text) {
    constexpr char kDigits[] = "0123456789ABCDEF";
    std::string out;
    for (const char byte : text) {
        if (IsUnreserved(byte)) {
            out += byte;
            continue;
        }
        out += '%';
        out += kDigits[static_cast<unsigned char>(byte) >> 4];
        out += kDigits[static_cast<unsigned char>(byte) & 15];
    }
    return out;
}

}  // namespace host
