#include "hosts/linux/conf/KeyValueFile.h"

#include <algorithm>

#include "hosts/linux/util/SmallFile.h"
#include "platform/Paths.h"

namespace host {

namespace {

constexpr size_t kMaxBytes = 1u << 20;

std::string Trimmed(const std::string& text) {
    const size_t first = text.find_first_not_of(" \t\r");
    return first == std::string::npos
               ? std::string()
               : text.substr(first, text.find_last_not_of(" \t\r") - first + 1);
}

std::string Unquoted(const std::string& text) {
    const bool quoted = text.size() >= 2 && text.front() == '"' && text.back() == '"';
    return quoted ? text.substr(1, text.size() - 2) : text;
}

}  // namespace

std::string ReadKey(const char* path, const std::string& key) {
    std::string content;
    std::string reason;
    if (!ReadSmallFile(path, kMaxBytes, &content, &reason)) {
        return std::string();
    }
    std::string value;
    for (size_t start = 0; start < content.size();) {
        const size_t end = std::min(content.find('\n', start), content.size());
        const std::string line = Trimmed(content.substr(start, end - start));
        const size_t equals = line.find('=');
        if (!line.empty() && line[0] != '#' && equals != std::string::npos &&
            Trimmed(line.substr(0, equals)) == key) {
            value = Unquoted(Trimmed(line.substr(equals + 1)));
        }
        start = end + 1;
    }
    return value;
}

std::string HostSetting(const std::string& key, const std::string& fallback) {
    const std::string value = ReadKey(TALO_HOST_CONF, key);
    return value.empty() ? fallback : value;
}

}  // namespace host
