#ifndef TALO_HOSTS_LINUX_SLICE_BODY_H
#define TALO_HOSTS_LINUX_SLICE_BODY_H

#include <string>

#include "hosts/linux/sdk/Slices.h"

namespace host {

// Copies exactly that many bytes of `from` to a place in the file `to`, in large
// blocks. Writes how many it copied, whatever the result: kDone, kCut, kNoSpace,
// kFailed, kNoDigest. `digest` (may be null) gets the SHA-256 of what was copied,
// when all was.
talo::SliceResult CopyBody(int from, int to, unsigned long long offset, unsigned long long bytes,
                           std::string* digest, unsigned long long* copied);

// The SHA-256 of the first `bytes` bytes of a file: kDone, kFailed, kNoDigest.
talo::SliceResult DigestFile(int file, unsigned long long bytes, std::string* digest);

// kNoSpace or kFailed, which is logged, for an errno.
talo::SliceResult ResultOf(int error);

}  // namespace host

#endif
