#include "hosts/linux/net/NameRules.h"

#include <string.h>

#include <string_view>

namespace host {

namespace {

bool IsDigit(char byte) {
    return byte >= '0' && byte <= '9';
}

bool IsLetter(char byte) {
    return (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z');
}

bool IsLabel(std::string_view label) {
    if (label.empty() || label.size() > kMaxLabelBytes || label.front() == '-' ||
        label.back() == '-') {
        return false;
    }
    for (const char byte : label) {
        if (!IsLetter(byte) && !IsDigit(byte) && byte != '-') {
            return false;
        }
    }
    return true;
}

bool IsNumber(std::string_view label) {
    for (const char byte : label) {
        if (!IsDigit(byte)) {
            return false;
        }
    }
    return true;
}

bool IsName(std::string_view name) {
    if (name.size() > kMaxNameBytes) {
        return false;
    }
    for (;;) {
        const size_t dot = name.find('.');
        const std::string_view label = name.substr(0, dot);
        if (!IsLabel(label)) {
            return false;
        }
        if (dot == std::string_view::npos) {
            return !IsNumber(label);
        }
        name.remove_prefix(dot + 1);
    }
}

// A byte more than the longest name with its dot tells that a text is too long;
// the rest need not be counted.
std::string_view Bounded(const char* text) {
    return text == nullptr ? std::string_view()
                           : std::string_view(text, strnlen(text, kMaxNameBytes + 2));
}

}  // namespace

bool IsHostName(const char* text) {
    return IsName(Bounded(text));
}

bool IsDomainName(const char* text) {
    std::string_view name = Bounded(text);
    if (!name.empty() && name.back() == '.') {
        name.remove_suffix(1);
    }
    return IsName(name);
}

}  // namespace host
