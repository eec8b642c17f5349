#ifndef TALO_HOSTS_LINUX_UTIL_PERCENT_H
#define TALO_HOSTS_LINUX_UTIL_PERCENT_H

#include <string>

namespace host {

// Percent encoding, as WebAPIUtil describes it.
std::string PercentDecode(const std::string& text, bool plusIsBlank);
std::string PercentEncode(const std::string& text);

}  // namespace host

#endif
