#include "src/base/JsonText.h"

#include <charconv>
#include <cmath>
#include <cstring>

#include "src/base/Utf8.h"

namespace TALO {

namespace {

// Which bytes a JSON string cannot carry as they stand. Bytes of 0x80 and above
// are looked at as UTF-8 sequences.
struct SpecialBytes {
    bool special[256] = {};
    constexpr SpecialBytes() {
        for (int byte = 0; byte < 256; ++byte) {
            special[byte] = byte < 0x20 || byte >= 0x80;
        }
        for (char byte : {'"', '\\', '<', '>', '&'}) {
            special[static_cast<unsigned char>(byte)] = true;
        }
    }
};
constexpr SpecialBytes kBytes;

void AppendUnicodeEscape(std::string& out, unsigned code) {
    constexpr char kDigits[] = "0123456789abcdef";
    const char text[6] = {'\\',
                          'u',
                          kDigits[code >> 12 & 15],
                          kDigits[code >> 8 & 15],
                          kDigits[code >> 4 & 15],
                          kDigits[code & 15]};
    out.append(text, sizeof text);
}

void AppendSpecialAscii(std::string& out, char byte) {
    switch (byte) {
        case '"':
            out += "\\\"";
            break;
        case '\\':
            out += "\\\\";
            break;
        case '\b':
            out += "\\b";
            break;
        case '\f':
            out += "\\f";
            break;
        case '\n':
            out += "\\n";
            break;
        case '\r':
            out += "\\r";
            break;
        case '\t':
            out += "\\t";
            break;
        default:
            AppendUnicodeEscape(out, static_cast<unsigned char>(byte));
    }
}

// Appends what begins at a byte of 0x80 or above; returns where it ends.
const char* AppendSequence(std::string& out, const char* at, const char* end) {
    const size_t length = Utf8SequenceLength(at, end);
    if (length == 0) {
        out += "\xEF\xBF\xBD";
        return at + 1;
    }
    if (length == 3 && std::memcmp(at, "\xE2\x80\xA8", 3) == 0) {
        out += "\\u2028";
    } else if (length == 3 && std::memcmp(at, "\xE2\x80\xA9", 3) == 0) {
        out += "\\u2029";
    } else {
        out.append(at, length);
    }
    return at + length;
}

void AppendString(std::string& out, const char* at, const char* end) {
    out += '"';
    while (at != end) {
        const char* plain = at;
        while (at != end && !kBytes.special[static_cast<unsigned char>(*at)]) {
            ++at;
        }
        out.append(plain, static_cast<size_t>(at - plain));
        if (at == end) {
            break;
        }
        if (static_cast<unsigned char>(*at) < 0x80) {
            AppendSpecialAscii(out, *at++);
        } else {
            at = AppendSequence(out, at, end);
        }
    }
    out += '"';
}

template <typename Number>
void AppendNumber(std::string& out, Number number) {
    char text[32];
    const auto result = std::to_chars(text, text + sizeof text, number);
    out.append(text, result.ptr);
}

void AppendReal(std::string& out, double number) {
    if (!std::isfinite(number)) {
        out += "null";
        return;
    }
    const size_t start = out.size();
    AppendNumber(out, number);
    if (out.find_first_of(".e", start) == std::string::npos) {
        out += ".0";
    }
}

void AppendValue(std::string& out, const Json::Value& value);

void AppendArray(std::string& out, const Json::Value& array) {
    out += '[';
    const char* separator = "";
    for (const Json::Value& element : array) {
        out += separator;
        AppendValue(out, element);
        separator = ",";
    }
    out += ']';
}

void AppendObject(std::string& out, const Json::Value& object) {
    out += '{';
    const char* separator = "";
    for (auto member = object.begin(); member != object.end(); ++member) {
        const char* nameEnd = nullptr;
        const char* name = member.memberName(&nameEnd);
        out += separator;
        AppendString(out, name, nameEnd);
        out += ':';
        AppendValue(out, *member);
        separator = ",";
    }
    out += '}';
}

void AppendValue(std::string& out, const Json::Value& value) {
    switch (value.type()) {
        case Json::nullValue:
            out += "null";
            break;
        case Json::intValue:
            AppendNumber(out, value.asLargestInt());
            break;
        case Json::uintValue:
            AppendNumber(out, value.asLargestUInt());
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
            out += value.asBool() ? "true" : "false";
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
    std::string out;
    AppendValue(out, value);
    return out;
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
