#include "hosts/linux/conf/KeyValueFile.h"

#include <time.h>

#include <charconv>

#include "hosts/linux/conf/KeyValueText.h"
#include "hosts/linux/util/FileState.h"
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

namespace {

// The configuration as it was read last, by this thread.
class KeptSettings {
  public:
    // A request asks for settings a dozen times within a millisecond: the file is
    // looked at for the first of them, and read when it has changed.
    const std::string& Content() {
        struct timespec now = {};
        (void)clock_gettime(CLOCK_MONOTONIC_COARSE, &now);
        if (!isSettled_ || now.tv_sec != looked_.tv_sec || now.tv_nsec != looked_.tv_nsec) {
            Look();
            looked_ = now;
        }
        return content_;
    }

  private:
    void Look() {
        const FileState state(TALO_HOST_CONF);
        if (isSettled_ && state == state_) {
            return;
        }
        content_.clear();
        isSettled_ = state.IsKnown() && ReadContent(TALO_HOST_CONF, &content_) && state.IsSettled();
        state_ = state;
    }

    struct timespec looked_ = {};  // in steps of some milliseconds
    bool isSettled_ = false;
    FileState state_;
    std::string content_;
};

}  // namespace

HostSettings::HostSettings() {
    static thread_local KeptSettings kept;
    content_ = kept.Content();
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
