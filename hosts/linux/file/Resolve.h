#ifndef TALO_HOSTS_LINUX_FILE_RESOLVE_H
#define TALO_HOSTS_LINUX_FILE_RESOLVE_H

#include <string>
#include <vector>

namespace host {

// Opens what lies at `parts` below an open folder, never anything else whatever
// links there are and whoever swaps them: a descriptor, close-on-exec, or -1
// with errno. Links that stay below the folder are followed, others fail with
// ELOOP. `parts` hold no "/", no "." and no ".."; none at all mean the folder
// itself. `flags` as of open.
int OpenBeneath(int folder, const std::vector<std::string>& parts, int flags);

// The same for a kernel that cannot do it by itself (openat2 came with 5.6):
// component by component, and every link fails with ELOOP.
int OpenByWalk(int folder, const std::vector<std::string>& parts, int flags);

// Makes OpenBeneath walk, whatever the kernel can do. For tests.
void AlwaysWalk(bool always);

}  // namespace host

#endif
