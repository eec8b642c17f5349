#include "hosts/linux/util/JsonGrammar.h"

#include <cstring>
#include <memory>
#include <string>

namespace host {

namespace {

bool IsDigit(char byte) {
    return byte >= '0' && byte <= '9';
}

bool IsHexDigit(char byte) {
    return IsDigit(byte) || (byte >= 'a' && byte <= 'f') || (byte >= 'A' && byte <= 'F');
}

// Walks a text once. Each step answers false and leaves the reason; the place is
// where the walk stopped.
class Walk {
  public:
    Walk(const char* begin, const char* end, size_t maxDepth, size_t maxValues)
        : begin_(begin),
          at_(begin),
          end_(end),
          maxDepth_(maxDepth < kSlots ? maxDepth : kSlots),
          maxValues_(maxValues) {}

    bool Document() {
        SkipSpace();
        bool more = true;
        while (more) {
            if (!Value(&more)) {
                return false;
            }
        }
        SkipSpace();
        return at_ == end_ || Fail("text behind the value");
    }

    size_t Values() const {
        return values_;
    }

    JsonError Error() const {
        return {static_cast<size_t>(at_ - begin_), reason_};
    }

  private:
    static constexpr size_t kSlots = 256;

    bool Fail(const char* reason) {
        reason_ = reason;
        return false;
    }

    bool At(char byte) const {
        return at_ != end_ && *at_ == byte;
    }

    void SkipSpace() {
        while (at_ != end_ && (*at_ == ' ' || *at_ == '\t' || *at_ == '\n' || *at_ == '\r')) {
            ++at_;
        }
    }

    // One value, or the opening of a container, and all that closes behind it.
    // `more` says whether another value has to follow.
    bool Value(bool* more) {
        if (++values_ > maxValues_) {
            return Fail("too many values");
        }
        if (At('[') || At('{')) {
            bool opened = false;
            if (!Open(&opened)) {
                return false;
            }
            if (opened) {
                *more = true;
                return true;
            }
        } else if (!Scalar()) {
            return false;
        }
        return Close(more);
    }

    // Enters a container up to its first value. An empty one is passed whole.
    bool Open(bool* opened) {
        if (depth_ == maxDepth_) {
            return Fail("nested too deep");
        }
        const bool object = *at_++ == '{';
        SkipSpace();
        if (At(object ? '}' : ']')) {
            ++at_;
            return true;
        }
        object_[depth_++] = object;
        *opened = true;
        return !object || Name();
    }

    // Behind a value: ends containers, or goes on to the next value.
    bool Close(bool* more) {
        while (depth_ > 0) {
            const bool object = object_[depth_ - 1];
            SkipSpace();
            if (At(',')) {
                ++at_;
                SkipSpace();
                *more = true;
                return !object || Name();
            }
            if (!At(object ? '}' : ']')) {
                return Fail(object ? "expected \",\" or \"}\"" : "expected \",\" or \"]\"");
            }
            ++at_;
            --depth_;
        }
        *more = false;
        return true;
    }

    bool Name() {
        if (!At('"')) {
            return Fail("expected a member's name");
        }
        if (!String()) {
            return false;
        }
        SkipSpace();
        if (!At(':')) {
            return Fail("expected \":\"");
        }
        ++at_;
        SkipSpace();
        return true;
    }

    bool Scalar() {
        if (at_ == end_) {
            return Fail("expected a value");
        }
        switch (*at_) {
            case '"':
                return String();
            case 't':
                return Literal("true");
            case 'f':
                return Literal("false");
            case 'n':
                return Literal("null");
            default:
                return Number();
        }
    }

    bool Literal(const char* text) {
        const size_t length = std::strlen(text);
        if (static_cast<size_t>(end_ - at_) < length || std::memcmp(at_, text, length) != 0) {
            return Fail("expected a value");
        }
        at_ += length;
        return true;
    }

    bool String() {
        ++at_;
        while (at_ != end_ && *at_ != '"') {
            if (static_cast<unsigned char>(*at_) < 0x20) {
                return Fail("control character in a string");
            }
            if (*at_ == '\\' && !Escape()) {
                return false;
            }
            ++at_;
        }
        if (at_ == end_) {
            return Fail("string without an end");
        }
        ++at_;
        return true;
    }

    // Leaves the walk on the escape's last byte.
    bool Escape() {
        ++at_;
        if (at_ == end_ || *at_ == '\0' || std::strchr("\"\\/bfnrtu", *at_) == nullptr) {
            return Fail("unknown escape");
        }
        for (int digits = *at_ == 'u' ? 4 : 0; digits > 0; --digits) {
            ++at_;
            if (at_ == end_ || !IsHexDigit(*at_)) {
                return Fail("unknown escape");
            }
        }
        return true;
    }

    bool Digits() {
        if (at_ == end_ || !IsDigit(*at_)) {
            return Fail("expected a value");
        }
        while (at_ != end_ && IsDigit(*at_)) {
            ++at_;
        }
        return true;
    }

    bool Number() {
        if (At('-')) {
            ++at_;
        }
        if (At('0')) {
            ++at_;
        } else if (!Digits()) {
            return false;
        }
        if (At('.')) {
            ++at_;
            if (!Digits()) {
                return false;
            }
        }
        if (At('e') || At('E')) {
            ++at_;
            if (At('+') || At('-')) {
                ++at_;
            }
            return Digits();
        }
        return true;
    }

    const char* begin_;
    const char* at_;
    const char* end_;
    size_t maxDepth_;
    size_t maxValues_;
    size_t depth_ = 0;
    size_t values_ = 0;
    const char* reason_ = "";
    bool object_[kSlots] = {};
};

// Built once: making a reader costs more than reading a short value. For each thread,
// since a reader keeps where it is in itself.
Json::CharReader& Reader() {
    static thread_local const std::unique_ptr<Json::CharReader> reader([] {
        Json::CharReaderBuilder builder;
        Json::CharReaderBuilder::strictMode(&builder.settings_);
        builder["strictRoot"] = false;
        builder["rejectDupKeys"] = false;
        builder["skipBom"] = false;
        return builder.newCharReader();
    }());
    return *reader;
}

}  // namespace

bool AcceptJson(const char* begin, const char* end, size_t maxDepth, JsonError* error,
                size_t* budget) {
    Walk walk(begin, end, maxDepth, budget != nullptr ? *budget : kMaxJsonValues);
    if (!walk.Document()) {
        *error = walk.Error();
        return false;
    }
    if (budget != nullptr) {
        *budget -= walk.Values();
    }
    return true;
}

bool ParseJson(const char* begin, const char* end, size_t maxDepth, Json::Value* out,
               JsonError* error, size_t* budget) {
    if (!AcceptJson(begin, end, maxDepth, error, budget)) {
        return false;
    }
    Json::Value value;
    if (!Reader().parse(begin, end, &value, nullptr)) {
        *error = {0, "number out of range or half a surrogate pair"};
        return false;
    }
    out->swap(value);
    return true;
}

}  // namespace host
