#include "hosts/linux/account/AccountName.h"

namespace host {

namespace {

constexpr size_t kMaxName = 64;
constexpr size_t kMaxPrivilege = 128;

// The locale must not decide what a name is.
bool IsLetterOrDigit(char byte) {
    return (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z') ||
           (byte >= '0' && byte <= '9');
}

bool IsNamePart(char byte) {
    return IsLetterOrDigit(byte) || byte == '.' || byte == '_' || byte == '-' || byte == '@' ||
           byte == '\\';
}

}  // namespace

bool IsAccountName(const std::string& name) {
    if (name.empty() || name.size() > kMaxName || !(IsLetterOrDigit(name[0]) || name[0] == '_')) {
        return false;
    }
    for (const char byte : name) {
        if (!IsNamePart(byte)) {
            return false;
        }
    }
    return true;
}

bool IsPrivilegeName(const std::string& name) {
    if (name.empty() || name.size() > kMaxPrivilege) {
        return false;
    }
    for (const char byte : name) {
        if (byte <= ' ' || byte > '~') {
            return false;
        }
    }
    return true;
}

}  // namespace host
