#include "hosts/linux/slice/Limits.h"

#include <limits>

#include "hosts/linux/conf/KeyValueFile.h"

namespace host {

namespace {

constexpr long long kMaxKeepSeconds = 3650LL * 86400;
constexpr size_t kMaxPerUser = 10000;
// What a file can have.
constexpr unsigned long long kMaxFileBytes = std::numeric_limits<long long>::max();

}  // namespace

SliceLimits ConfiguredSliceLimits() {
    const HostSettings settings;
    SliceLimits limits;
    settings.Limit("slice_keep", kMaxKeepSeconds, &limits.keepSeconds);
    settings.Limit("slice_per_user", kMaxPerUser, &limits.perUser);
    settings.Limit("slice_max_bytes", kMaxFileBytes, &limits.maxBytes);
    return limits;
}

}  // namespace host
