#ifndef TALO_HOSTS_LINUX_CONF_KEYVALUEFILE_H
#define TALO_HOSTS_LINUX_CONF_KEYVALUEFILE_H

#include <string>

namespace host {

// The value of a key in a file of key="value" lines; "" when the file or the
// key is absent. Blanks around key and value, lines that begin with "#", and
// quotes that are missing are forgiven; the last line of a key counts. A file
// of more than 1 MiB is not read.
std::string ReadKey(const char* path, const std::string& key);

// The same in the host's own configuration, with a default for an empty value.
std::string HostSetting(const std::string& key, const std::string& fallback);

}  // namespace host

#endif
