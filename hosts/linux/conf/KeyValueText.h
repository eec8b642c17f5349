#ifndef TALO_HOSTS_LINUX_CONF_KEYVALUETEXT_H
#define TALO_HOSTS_LINUX_CONF_KEYVALUETEXT_H

#include <string>

namespace host {

// The content of a configuration file with one key="value" a line; the last line
// of a key counts, and lines that begin with "#" are comments. False, and `value`
// untouched, when no line has the key.
bool FindKey(const std::string& content, const std::string& key, std::string* value);

// Whether the key has exactly that value.
bool HasKeyValue(const std::string& content, const std::string& key, const std::string& value);

}  // namespace host

#endif
