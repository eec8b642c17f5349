#include <charconv>
#include <exception>
#include <string>

#include "hosts/linux/conf/KeyValueFile.h"
#include "platform/System.h"

namespace {

constexpr int kDefaultTimeoutMinutes = 30;
constexpr int kMaxTimeoutMinutes = 366 * 24 * 60;

int TimeoutSetting() {
    const std::string text = host::HostSetting("session_timeout", "");
    int minutes = 0;
    const char* end = text.data() + text.size();
    const auto result = std::from_chars(text.data(), end, minutes);
    const bool sensible = result.ec == std::errc() && result.ptr == end && minutes > 0 &&
                          minutes <= kMaxTimeoutMinutes;
    return sensible ? minutes : kDefaultTimeoutMinutes;
}

}  // namespace

extern "C" {

int TLIBCConfGetORBTimeout(void) {
    try {
        return TimeoutSetting();
    } catch (const std::exception&) {
        return kDefaultTimeoutMinutes;
    }
}

int TLIBCFileCheckKeyValue(const char* file, const char* key, const char* value, int) {
    if (file == nullptr || key == nullptr || *key == '\0' || value == nullptr) {
        return 0;
    }
    try {
        return host::FileHasKeyValue(file, key, value) ? 1 : 0;
    } catch (const std::exception&) {
        return 0;
    }
}

void TLIBCStrCaseLower(char* text, size_t size) {
    if (text == nullptr) {
        return;
    }
    for (size_t index = 0; (size == 0 || index < size) && text[index] != '\0'; ++index) {
        if (text[index] >= 'A' && text[index] <= 'Z') {
            text[index] = static_cast<char>(text[index] - 'A' + 'a');
        }
    }
}

}  // extern "C"
