#include "src/base/JsonConvert.h"

#include <charconv>
#include <limits>

namespace TALO {

namespace {

// Whether a real number, cut towards zero, fits. The upper bound is compared as
// a power of two, which a double holds exactly, unlike the largest integer.
bool CutReal(double real, long long* out) {
    constexpr double kLimit = 9223372036854775808.0;
    if (!(real >= -kLimit && real < kLimit)) {
        return false;
    }
    *out = static_cast<long long>(real);
    return true;
}

bool ReadInt64(const Json::Value& value, long long* out) {
    switch (value.type()) {
        case Json::nullValue:
            *out = 0;
            return true;
        case Json::intValue:
            *out = value.asInt64();
            return true;
        case Json::uintValue:
            if (!value.isInt64()) {
                return false;
            }
            *out = value.asInt64();
            return true;
        case Json::realValue:
            return CutReal(value.asDouble(), out);
        case Json::booleanValue:
            *out = value.asBool() ? 1 : 0;
            return true;
        case Json::stringValue:
            return ParseInt64(value.asString(), out);
        default:
            return false;
    }
}

bool FitsInt(long long number) {
    return number >= std::numeric_limits<int>::min() && number <= std::numeric_limits<int>::max();
}

}  // namespace

const Json::Value* FindMember(const Json::Value* value, const std::string& name) {
    if (value == nullptr || !value->isObject()) {
        return nullptr;
    }
    return value->find(name.data(), name.data() + name.size());
}

const Json::Value& Member(const Json::Value& value, const std::string& name) {
    const Json::Value* found = FindMember(&value, name);
    return found != nullptr ? *found : Json::Value::nullSingleton();
}

int ToInt(const Json::Value& value, int fallback) {
    long long number = 0;
    return ReadInt64(value, &number) && FitsInt(number) ? static_cast<int>(number) : fallback;
}

long long ToInt64(const Json::Value& value, long long fallback) {
    long long number = 0;
    return ReadInt64(value, &number) ? number : fallback;
}

unsigned int ToUInt(const Json::Value& value, unsigned int fallback) {
    long long number = 0;
    const bool fits = ReadInt64(value, &number) && number >= std::numeric_limits<int>::min() &&
                      number <= std::numeric_limits<unsigned int>::max();
    return fits ? static_cast<unsigned int>(number) : fallback;
}

bool ToBool(const Json::Value& value) {
    switch (value.type()) {
        case Json::stringValue:
        case Json::arrayValue:
        case Json::objectValue: {
            const char* begin = nullptr;
            const char* end = nullptr;
            return value.getString(&begin, &end) ? begin != end : value.size() > 0;
        }
        case Json::realValue:
            return value.asDouble() != 0.0;
        case Json::intValue:
        case Json::uintValue:
        case Json::booleanValue:
            return value.asBool();
        default:
            return false;
    }
}

std::string ToText(const Json::Value& value) {
    return value.isArray() || value.isObject() ? std::string() : value.asString();
}

int RequireInt(const Json::Value& value) {
    long long number = 0;
    const bool whole = !value.isDouble() || value.isInt();
    if (!whole || !ReadInt64(value, &number) || !FitsInt(number)) {
        Json::throwLogicError("not an integer");
    }
    return static_cast<int>(number);
}

std::string RequireText(const Json::Value& value) {
    if (value.isArray() || value.isObject()) {
        Json::throwLogicError("not a text");
    }
    return value.asString();
}

bool ParseInt64(const std::string& text, long long* out) {
    long long number = 0;
    const char* end = text.data() + text.size();
    const auto result = std::from_chars(text.data(), end, number);
    if (text.empty() || result.ec != std::errc() || result.ptr != end) {
        return false;
    }
    *out = number;
    return true;
}

}  // namespace TALO
