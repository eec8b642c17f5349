#ifndef TALO_HOSTS_LINUX_NET_NAMERULES_H
#define TALO_HOSTS_LINUX_NET_NAMERULES_H

#include <cstddef>

namespace host {

constexpr size_t kMaxNameBytes = 253;
constexpr size_t kMaxLabelBytes = 63;

// Names of RFC 1123: labels of ASCII letters, digits and "-" between dots, none
// empty or longer than 63, none with "-" at an end, all together at most 253. The
// last label is not all digits, so that no address is a name ("10.0.0.1", and
// "10.1", which some resolvers read as one too). A single label will do.
bool IsHostName(const char* text);

// The same; one dot may follow, which says that the name is complete. It does not
// count for the length.
bool IsDomainName(const char* text);

}  // namespace host

#endif
