#include "src/base/JsonText.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <cstring>

#include "src/base/Utf8.h"

namespace TALO {

namespace {

// The text so far. Room is asked for once per piece and then written to without
// further checks, and the room of one text serves the next: growing it anew each
// time would cost a third of the whole.
class Output {
  public:
    Output() {
        text_.swap(kept_);
    }
    ~Output() {
        if (text_.size() <= kMostKept) {
            text_.swap(kept_);
        }
    }
    Output(const Output&) = delete;
    Output& operator=(const Output&) = delete;

    // Where the next `size` bytes may go. The pointer lasts until the next call.
    char* Room(size_t size) {
        if (text_.size() - used_ < size) {
            text_.resize(std::max({kFirstSize, text_.size() * 2, used_ + size}));
        }
        return &text_[used_];
    }

    // Takes over what was written up to `end`.
    void Wrote(const char* end) {
        used_ = static_cast<size_t>(end - text_.data());
    }

    void Append(char byte) {
        char* at = Room(1);
        *at = byte;
        Wrote(at + 1);
    }

    void Append(const char* bytes, size_t size) {
        char* at = Room(size);
        std::memcpy(at, bytes, size);
        Wrote(at + size);
    }

    std::string Text() const {
        return text_.substr(0, used_);
    }

  private:
    static constexpr size_t kFirstSize = 256;
    static constexpr size_t kMostKept = size_t{1} << 20;
    static thread_local std::string kept_;

    std::string text_;
    size_t used_ = 0;
};

thread_local std::string Output::kept_;

// The longest form of one source byte: "\u001f".
constexpr size_t kLongestEscape = 6;

// A long string is written in slices, so that room for the worst case stays small.
constexpr size_t kSlice = 4096;

constexpr std::uint64_t Each(unsigned char byte) {
    return byte * 0x0101010101010101u;
}

// Of eight bytes at once: non-zero when one of them equals `byte`.
constexpr std::uint64_t AnyEquals(std::uint64_t bytes, unsigned char byte) {
    const std::uint64_t zeroWhereEqual = bytes ^ Each(byte);
    return (zeroWhereEqual - Each(0x01)) & ~zeroWhereEqual & Each(0x80);
}

// Whether one of eight bytes cannot stand in a JSON string as it is. Two bytes
// that differ in one bit are looked for together: "<" and ">", the quote and "&".
bool AnySpecial(std::uint64_t bytes) {
    const std::uint64_t controls = (bytes - Each(0x20)) & ~bytes;
    const std::uint64_t angles = AnyEquals(bytes | Each('<' ^ '>'), '<' | '>');
    const std::uint64_t quotes = AnyEquals(bytes | Each('"' ^ '&'), '"' | '&');
    return ((controls | bytes) & Each(0x80)) != 0 ||
           (angles | quotes | AnyEquals(bytes, '\\')) != 0;
}

// The same for one byte, as a table.
struct SpecialBytes {
    bool special[256] = {};
    constexpr SpecialBytes() {
        for (int byte = 0; byte < 256; ++byte) {
            special[byte] = byte < 0x20 || byte >= 0x80 || byte == '"' || byte == '\\' ||
                            byte == '<' || byte == '>' || byte == '&';
        }
    }
};
constexpr SpecialBytes kSpecialBytes;

bool IsSpecial(char byte) {
    return kSpecialBytes.special[static_cast<unsigned char>(byte)];
}

char* WriteUnicodeEscape(char* to, unsigned code) {
    constexpr char kDigits[] = "0123456789abcdef";
    *to++ = '\\';
    *to++ = 'u';
    for (int shift = 12; shift >= 0; shift -= 4) {
        *to++ = kDigits[code >> shift & 15];
    }
    return to;
}

char* WriteAsciiEscape(char* to, char byte) {
    constexpr char kShort[] = "\"\"\\\\\bb\ff\nn\rr\tt";
    for (const char* pair = kShort; *pair != '\0'; pair += 2) {
        if (*pair == byte) {
            *to++ = '\\';
            *to++ = pair[1];
            return to;
        }
    }
    return WriteUnicodeEscape(to, static_cast<unsigned char>(byte));
}

// Writes what begins at a byte of 0x80 or above and moves `at` behind it.
char* WriteSequence(char* to, const char** at, const char* end) {
    const size_t length = Utf8SequenceLength(*at, end);
    const char* bytes = *at;
    *at += std::max<size_t>(length, 1);
    if (length == 0) {
        std::memcpy(to, "\xEF\xBF\xBD", 3);
        return to + 3;
    }
    if (length == 3 && std::memcmp(bytes, "\xE2\x80", 2) == 0 &&
        (bytes[2] == '\xA8' || bytes[2] == '\xA9')) {
        return WriteUnicodeEscape(to, bytes[2] == '\xA8' ? 0x2028 : 0x2029);
    }
    std::memcpy(to, bytes, length);
    return to + length;
}

// Writes up to `stop`; a sequence that begins before it is written whole.
char* WriteSlice(char* to, const char** at, const char* stop, const char* end) {
    const char* from = *at;
    while (from < stop) {
        std::uint64_t bytes = 0;
        if (stop - from >= 8) {
            std::memcpy(&bytes, from, 8);
            if (!AnySpecial(bytes)) {
                std::memcpy(to, &bytes, 8);
                from += 8;
                to += 8;
                continue;
            }
        }
        if (!IsSpecial(*from)) {
            *to++ = *from++;
        } else if (static_cast<unsigned char>(*from) < 0x80) {
            to = WriteAsciiEscape(to, *from++);
        } else {
            to = WriteSequence(to, &from, end);
        }
    }
    *at = from;
    return to;
}

void AppendString(Output& out, const char* at, const char* end) {
    out.Append('"');
    while (at != end) {
        const size_t slice = std::min(static_cast<size_t>(end - at), kSlice);
        // A sequence over the slice's end adds at most three bytes.
        char* to = out.Room(slice * kLongestEscape + 3);
        out.Wrote(WriteSlice(to, &at, at + slice, end));
    }
    out.Append('"');
}

constexpr size_t kLongestNumber = 32;

template <typename Integer>
void AppendInteger(Output& out, Integer number) {
    char* to = out.Room(kLongestNumber);
    out.Wrote(std::to_chars(to, to + kLongestNumber, number).ptr);
}

void AppendReal(Output& out, double number) {
    if (!std::isfinite(number)) {
        out.Append("null", 4);
        return;
    }
    char* to = out.Room(kLongestNumber);
    char* end = std::to_chars(to, to + kLongestNumber - 2, number).ptr;
    if (std::none_of(to, end, [](char byte) { return byte == '.' || byte == 'e'; })) {
        *end++ = '.';
        *end++ = '0';
    }
    out.Wrote(end);
}

void AppendValue(Output& out, const Json::Value& value);

void AppendArray(Output& out, const Json::Value& array) {
    char before = '[';
    Json::ArrayIndex next = 0;
    const auto end = array.end();
    for (auto element = array.begin(); element != end; ++element, ++next) {
        // The library keeps no element for an index that an assignment skipped.
        for (; next < element.index(); ++next) {
            out.Append(before);
            out.Append("null", 4);
            before = ',';
        }
        out.Append(before);
        AppendValue(out, *element);
        before = ',';
    }
    out.Append(before == '[' ? "[]" : "]", before == '[' ? 2 : 1);
}

void AppendObject(Output& out, const Json::Value& object) {
    char before = '{';
    const auto end = object.end();
    for (auto member = object.begin(); member != end; ++member) {
        const char* nameEnd = nullptr;
        const char* name = member.memberName(&nameEnd);
        out.Append(before);
        AppendString(out, name, nameEnd);
        out.Append(':');
        AppendValue(out, *member);
        before = ',';
    }
    out.Append(before == '{' ? "{}" : "}", before == '{' ? 2 : 1);
}

void AppendValue(Output& out, const Json::Value& value) {
    switch (value.type()) {
        case Json::nullValue:
            out.Append("null", 4);
            break;
        case Json::intValue:
            AppendInteger(out, value.asLargestInt());
            break;
        case Json::uintValue:
            AppendInteger(out, value.asLargestUInt());
            break;
        case Json::realValue:
            AppendReal(out, value.asDouble());
            break;
        case Json::stringValue: {
            const char* begin = nullptr;
            const char* end = nullptr;
            value.getString(&begin, &end);
            AppendString(out, begin, end);
            break;
        }
        case Json::booleanValue:
            value.asBool() ? out.Append("true", 4) : out.Append("false", 5);
            break;
        case Json::arrayValue:
            AppendArray(out, value);
            break;
        case Json::objectValue:
            AppendObject(out, value);
            break;
    }
}

}  // namespace

std::string toString(const Json::Value& value) {
    Output out;
    AppendValue(out, value);
    return out.Text();
}

Json::ArrayIndex searchArrayIndex(const Json::Value& array, const Json::Value& wanted) {
    if (!array.isArray()) {
        return Json::Value::maxUInt;
    }
    for (Json::ArrayIndex index = 0; index < array.size(); ++index) {
        if (array[index] == wanted) {
            return index;
        }
    }
    return Json::Value::maxUInt;
}

}  // namespace TALO
