#include "hosts/linux/cgi/HeaderParameters.h"

#include <cstring>
#include <utility>

namespace host {

namespace {

bool IsTokenCharacter(char byte) {
    return (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z') ||
           (byte >= '0' && byte <= '9') ||
           (byte != '\0' && std::strchr("!#$%&'*+-.^_`|~", byte) != nullptr);
}

// A reader that goes through a header value once.
class Cursor {
  public:
    explicit Cursor(const std::string& text) : text_(text) {}

    bool AtEnd() const {
        return at_ == text_.size();
    }
    void SkipBlanks() {
        while (!AtEnd() && (text_[at_] == ' ' || text_[at_] == '\t')) {
            ++at_;
        }
    }
    bool Take(char expected) {
        if (AtEnd() || text_[at_] != expected) {
            return false;
        }
        ++at_;
        return true;
    }
    std::string TakeToken(const char* more = "") {
        const size_t start = at_;
        while (!AtEnd() && (IsTokenCharacter(text_[at_]) ||
                            (text_[at_] != '\0' && std::strchr(more, text_[at_]) != nullptr))) {
            ++at_;
        }
        return text_.substr(start, at_ - start);
    }
    // What stands behind the opening quote, up to and with the closing one.
    bool TakeQuoted(std::string* out) {
        while (!AtEnd() && text_[at_] != '"') {
            const bool escape = text_[at_] == '\\' && at_ + 1 < text_.size() &&
                                (text_[at_ + 1] == '"' || text_[at_ + 1] == '\\');
            at_ += escape ? 1 : 0;
            out->push_back(text_[at_++]);
        }
        return Take('"');
    }

  private:
    const std::string& text_;
    size_t at_ = 0;
};

bool TakeParameter(Cursor* cursor, std::map<std::string, std::string>* parameters) {
    const std::string name = LowerCase(cursor->TakeToken());
    if (name.empty() || !cursor->Take('=')) {
        return false;
    }
    std::string text;
    if (cursor->Take('"')) {
        if (!cursor->TakeQuoted(&text)) {
            return false;
        }
    } else {
        text = cursor->TakeToken();
        if (text.empty()) {
            return false;
        }
    }
    return parameters->emplace(name, text).second;
}

}  // namespace

std::string LowerCase(std::string text) {
    for (char& byte : text) {
        if (byte >= 'A' && byte <= 'Z') {
            byte = static_cast<char>(byte - 'A' + 'a');
        }
    }
    return text;
}

bool IsToken(const std::string& text) {
    for (const char byte : text) {
        if (!IsTokenCharacter(byte)) {
            return false;
        }
    }
    return !text.empty();
}

bool ParseParametrizedValue(const std::string& text, ParametrizedValue* out) {
    ParametrizedValue parsed;
    Cursor cursor(text);
    cursor.SkipBlanks();
    parsed.value = LowerCase(cursor.TakeToken("/"));
    if (parsed.value.empty()) {
        return false;
    }
    cursor.SkipBlanks();
    while (!cursor.AtEnd()) {
        if (!cursor.Take(';')) {
            return false;
        }
        cursor.SkipBlanks();
        // A separator at the end is forgiven.
        if (!cursor.AtEnd() && !TakeParameter(&cursor, &parsed.parameters)) {
            return false;
        }
        cursor.SkipBlanks();
    }
    *out = std::move(parsed);
    return true;
}

}  // namespace host
