#ifndef TALO_HOSTS_LINUX_FILE_UNFINISHEDNAME_H
#define TALO_HOSTS_LINUX_FILE_UNFINISHEDNAME_H

namespace host {

// What the name of a file begins with that is not whole yet. It lies in the
// folder that it is made for, so that it can be renamed, and is not shown.
constexpr char kUnfinishedPrefix[] = ".talo-new-";

}  // namespace host

#endif
