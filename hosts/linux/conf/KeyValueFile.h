#ifndef TALO_HOSTS_LINUX_CONF_KEYVALUEFILE_H
#define TALO_HOSTS_LINUX_CONF_KEYVALUEFILE_H

#include <string>

namespace host {

// The value of a key in a file of key="value" lines; "" when the file or the
// key is absent. Blanks around key and value, lines that begin with "#", and
// quotes that are missing are forgiven; the last line of a key counts. A file
// of more than 1 MiB is not read.
std::string ReadKey(const char* path, const std::string& key);

// Whether a file has the key with exactly that value; false when it cannot be read.
bool FileHasKeyValue(const char* path, const std::string& key, const std::string& value);

// The host's own configuration as it is now, read once for several keys.
class HostSettings {
  public:
    HostSettings();

    // The fallback for an empty value, too.
    std::string Text(const std::string& key, const std::string& fallback) const;

    // A decimal number from 1 to `most`. What is no such number is passed over:
    // `number` stays untouched.
    template <typename Number>
    void Limit(const std::string& key, Number most, Number* number) const {
        unsigned long long value = 0;
        if (ReadLimit(key, static_cast<unsigned long long>(most), &value)) {
            *number = static_cast<Number>(value);
        }
    }

  private:
    bool ReadLimit(const std::string& key, unsigned long long most,
                   unsigned long long* value) const;

    std::string content_;
};

// One key of it, with a default for an empty value.
std::string HostSetting(const std::string& key, const std::string& fallback);

}  // namespace host

#endif
