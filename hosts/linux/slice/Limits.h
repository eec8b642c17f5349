#ifndef TALO_HOSTS_LINUX_SLICE_LIMITS_H
#define TALO_HOSTS_LINUX_SLICE_LIMITS_H

#include <cstddef>

namespace host {

// What uploads in slices may ask for. Each is a key of the host's configuration,
// given behind it; a value that is no decimal number from 1 to the largest is
// passed over.
struct SliceLimits {
    // Seconds without use after which an upload is gone, at most ten years: what
    // is abandoned fills the disk. "slice_keep"
    long long keepSeconds = 172800;
    // Unfinished uploads of one user, at most 10,000: each is a file, and they are
    // counted whenever one begins. "slice_per_user"
    size_t perUser = 100;
    // Bytes of one file. "slice_max_bytes"
    unsigned long long maxBytes = 1ull << 42;
};

SliceLimits ConfiguredSliceLimits();

}  // namespace host

#endif
