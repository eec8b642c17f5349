#include <algorithm>

#include "hosts/linux/file/Guard.h"
#include "hosts/linux/file/UnfinishedName.h"
#include "hosts/linux/sdk/Places.h"
#include "hosts/linux/util/Utf8.h"

namespace {

bool IsUtf8(const std::string& text) {
    for (size_t index = 0; index < text.size();) {
        const size_t length = host::Utf8Character(text, index);
        if (length == 0) {
            return false;
        }
        index += length;
    }
    return true;
}

}  // namespace

namespace talo {

bool IsUnfinishedName(const std::string& name) {
    return name.compare(0, sizeof host::kUnfinishedPrefix - 1, host::kUnfinishedPrefix) == 0;
}

bool IsComponent(const std::string& text) {
    return !text.empty() && text.size() <= kMaxComponentBytes && text != "." && text != ".." &&
           text.find_first_of(std::string("/\0", 2)) == std::string::npos &&
           !IsUnfinishedName(text) && IsUtf8(text);
}

bool ParseVirtualPath(const std::string& text, VirtualPath* path) {
    return host::Guarded(false, [&] {
        if (text.empty() || text[0] != '/' || text.size() > kMaxPathBytes) {
            return false;
        }
        VirtualPath parsed;
        for (size_t start = 1; start < text.size();) {
            const size_t end = std::min(text.find('/', start), text.size());
            const std::string component = text.substr(start, end - start);
            if (!IsComponent(component) || end + 1 == text.size()) {
                return false;
            }
            if (parsed.share.empty()) {
                parsed.share = component;
            } else {
                parsed.parts.push_back(component);
            }
            start = end + 1;
        }
        *path = std::move(parsed);
        return true;
    });
}

}  // namespace talo
