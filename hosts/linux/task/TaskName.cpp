#include "hosts/linux/task/TaskName.h"

#include "hosts/linux/account/AccountName.h"

namespace host {

namespace {

constexpr size_t kMaxId = kTaskIdRoom - 1;
constexpr size_t kMaxPrefix = 64;
constexpr size_t kMaxProperty = 128;

bool IsNameText(const std::string& text) {
    for (const char byte : text) {
        const bool good = (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z') ||
                          (byte >= '0' && byte <= '9') || byte == '_' || byte == '-' || byte == '.';
        if (!good) {
            return false;
        }
    }
    return true;
}

}  // namespace

bool IsTaskUser(const std::string& user) {
    return user == "@users" || user == "@administrators" || IsAccountName(user);
}

bool IsTaskId(const std::string& id) {
    return !id.empty() && id.size() <= kMaxId && IsNameText(id);
}

bool IsTaskPrefix(const std::string& prefix) {
    return prefix.size() <= kMaxPrefix && IsNameText(prefix);
}

bool IsPropertyName(const std::string& name) {
    for (const char byte : name) {
        if (static_cast<unsigned char>(byte) < ' ' || byte == '\x7f') {
            return false;
        }
    }
    return !name.empty() && name.size() <= kMaxProperty;
}

}  // namespace host
