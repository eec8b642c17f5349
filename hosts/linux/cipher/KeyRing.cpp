#include "hosts/linux/cipher/KeyRing.h"

#include <vector>

#include "hosts/linux/cipher/Base64Url.h"

namespace host {

namespace {

constexpr char kFirstLine[] = "talo-cipher-keys 1";
constexpr char kCurrent[] = "current";
constexpr char kPrevious[] = "previous";
constexpr size_t kMostDigits = 12;

std::vector<std::string> Split(const std::string& text, char separator) {
    std::vector<std::string> parts(1);
    for (const char byte : text) {
        if (byte == separator) {
            parts.emplace_back();
        } else {
            parts.back() += byte;
        }
    }
    return parts;
}

std::string FormatKey(const char* name, const LineKey& key) {
    return std::string(name) + " " + ToBase64Url(key.half.Text()) + " " +
           ToBase64Url(key.secret.Text());
}

bool ParseHalf(const std::string& text, Key* half) {
    std::string bytes;
    return FromBase64Url(text.data(), text.size(), &bytes) && half->Set(bytes);
}

bool ParseKey(const std::vector<std::string>& words, const char* name, size_t count, LineKey* key) {
    return words.size() == count && words[0] == name && ParseHalf(words[1], &key->half) &&
           ParseHalf(words[2], &key->secret);
}

bool ParseTime(const std::string& text, long long* time) {
    if (text.empty() || text.size() > kMostDigits ||
        text.find_first_not_of("0123456789") != std::string::npos) {
        return false;
    }
    long long read = 0;
    for (const char digit : text) {
        read = read * 10 + (digit - '0');
    }
    *time = read;
    return true;
}

}  // namespace

std::string KeyIdOf(const Key& half) {
    return half.Text().substr(0, kKeyIdBytes);
}

const LineKey* FindKey(const KeyRing& ring, const std::string& id, long long now) {
    if (id == KeyIdOf(ring.current.half)) {
        return &ring.current;
    }
    return ring.previous && id == KeyIdOf(ring.previous->half) &&
                   now - ring.since < kPreviousSeconds
               ? &*ring.previous
               : nullptr;
}

std::string FormatKeyRing(const KeyRing& ring) {
    std::string content = std::string(kFirstLine) + "\n" + FormatKey(kCurrent, ring.current) + " " +
                          std::to_string(ring.since) + "\n";
    if (ring.previous) {
        content += FormatKey(kPrevious, *ring.previous) + "\n";
    }
    return content;
}

bool ParseKeyRing(const std::string& content, KeyRing* ring) {
    const std::vector<std::string> lines = Split(content, '\n');
    // The last line is what is behind the last line's end: nothing.
    if (lines.size() < 3 || lines.size() > 4 || lines[0] != kFirstLine || !lines.back().empty()) {
        return false;
    }
    KeyRing read;
    const std::vector<std::string> words = Split(lines[1], ' ');
    if (!ParseKey(words, kCurrent, 4, &read.current) || !ParseTime(words[3], &read.since)) {
        return false;
    }
    if (lines.size() == 4) {
        read.previous.emplace();
        if (!ParseKey(Split(lines[2], ' '), kPrevious, 3, &*read.previous)) {
            return false;
        }
    }
    *ring = read;
    return true;
}

}  // namespace host
