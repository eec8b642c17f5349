#ifndef TALO_HOSTS_LINUX_SLICE_SWEEP_H
#define TALO_HOSTS_LINUX_SLICE_SWEEP_H

#include <string>

namespace host {

// Whether something last used then has gone unused for too long. A last use in
// the future, after a clock was set back, counts as now.
bool HasExpired(long long lastUse, long long keepSeconds, long long now);

// Removes from an owner's folder what has expired, nothing that somebody holds.
// Writes the number of unfinished uploads that are left.
void SweepOwner(const std::string& folder, long long keepSeconds, long long now,
                size_t* unfinished);

// Forgets the oldest complete uploads of a folder until `most` are left.
void ForgetComplete(const std::string& folder, size_t most);

}  // namespace host

#endif
