#include "hosts/linux/cipher/Base64Url.h"

namespace host {

namespace {

constexpr char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_";

// -1 for what is no digit.
int ValueOf(char digit) {
    if (digit >= 'A' && digit <= 'Z') {
        return digit - 'A';
    }
    if (digit >= 'a' && digit <= 'z') {
        return digit - 'a' + 26;
    }
    if (digit >= '0' && digit <= '9') {
        return digit - '0' + 52;
    }
    return digit == '-' ? 62 : digit == '_' ? 63 : -1;
}

}  // namespace

std::string ToBase64Url(const std::string& bytes) {
    std::string text;
    text.reserve((bytes.size() * 4 + 2) / 3);
    unsigned held = 0;
    unsigned bits = 0;
    for (const char byte : bytes) {
        held = (held << 8 | static_cast<unsigned char>(byte)) & 0xFFFF;
        for (bits += 8; bits >= 6; bits -= 6) {
            text += kAlphabet[held >> (bits - 6) & 63];
        }
    }
    if (bits > 0) {
        text += kAlphabet[held << (6 - bits) & 63];
    }
    return text;
}

bool FromBase64Url(const char* text, size_t size, std::string* bytes) {
    if (size % 4 == 1) {
        return false;
    }
    std::string read;
    read.reserve(size / 4 * 3 + 2);
    unsigned held = 0;
    unsigned bits = 0;
    for (size_t index = 0; index < size; ++index) {
        const int value = ValueOf(text[index]);
        if (value < 0) {
            return false;
        }
        held = (held << 6 | static_cast<unsigned>(value)) & 0xFFFF;
        bits += 6;
        if (bits >= 8) {
            bits -= 8;
            read += static_cast<char>(held >> bits & 0xFF);
        }
    }
    if ((held & ((1u << bits) - 1)) != 0) {
        return false;
    }
    bytes->swap(read);
    return true;
}

}  // namespace host
