#include "hosts/linux/conf/KeyValueFile.h"

#include <charconv>

#include "hosts/linux/conf/KeyValueText.h"
#include "hosts/linux/util/SmallFile.h"
#include "platform/Paths.h"

namespace host {

namespace {

constexpr size_t kMaxBytes = 1u << 20;

bool ReadContent(const char* path, std::string* content) {
    std::string reason;
    return ReadSmallFile(path, kMaxBytes, content, &reason);
}

}  // namespace

std::string ReadKey(const char* path, const std::string& key) {
    std::string content;
    std::string value;
    if (ReadContent(path, &content)) {
        (void)FindKey(content, key, &value);
    }
    return value;
}

bool FileHasKeyValue(const char* path, const std::string& key, const std::string& value) {
    std::string content;
    return ReadContent(path, &content) && HasKeyValue(content, key, value);
}

HostSettings::HostSettings() {
    (void)ReadContent(TALO_HOST_CONF, &content_);
}

std::string HostSettings::Text(const std::string& key, const std::string& fallback) const {
    std::string value;
    (void)FindKey(content_, key, &value);
    return value.empty() ? fallback : value;
}

bool HostSettings::ReadLimit(const std::string& key, unsigned long long most,
                             unsigned long long* value) const {
    const std::string text = Text(key, "");
    const char* end = text.data() + text.size();
    unsigned long long number = 0;
    const auto result = std::from_chars(text.data(), end, number);
    if (result.ec != std::errc() || result.ptr != end || number == 0 || number > most) {
        return false;
    }
    *value = number;
    return true;
}

std::string HostSetting(const std::string& key, const std::string& fallback) {
    return HostSettings().Text(key, fallback);
}

}  // namespace host
