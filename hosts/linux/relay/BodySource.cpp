#include "hosts/linux/relay/BodySource.h"

#include <errno.h>
#include <poll.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>

namespace host {

namespace {

// Bytes that the stream has read ahead, those that were put back included. The C
// library has no function for it. They come first: fread takes as many without
// touching the descriptor.
size_t ReadAhead(const FILE* in) {
    constexpr int kInBackup = 0x100;
    size_t bytes = static_cast<size_t>(in->_IO_read_end - in->_IO_read_ptr);
    if ((in->_flags & kInBackup) != 0) {
        bytes += static_cast<size_t>(in->_IO_save_end - in->_IO_save_base);
    }
    return bytes;
}

bool TakesItsTime(int descriptor) {
    struct stat facts = {};
    return descriptor >= 0 && fstat(descriptor, &facts) == 0 && !S_ISREG(facts.st_mode);
}

bool IsReadable(int descriptor) {
    struct pollfd waiting = {descriptor, POLLIN, 0};
    return poll(&waiting, 1, 0) > 0;
}

}  // namespace

BodySource::BodySource(FILE* in, long long size)
    : in_(in), left_(size), descriptor_(fileno(in)), waits_(TakesItsTime(descriptor_)) {}

long BodySource::Read(char* to, size_t most) {
    size_t wanted = static_cast<size_t>(std::min(left_, static_cast<long long>(most)));
    if (wanted == 0) {
        return kEnd;
    }
    const size_t ahead = ReadAhead(in_);
    long got = kEnd;
    if (!waits_ || ahead > 0) {
        wanted = waits_ ? std::min(wanted, ahead) : wanted;
        got = static_cast<long>(fread(to, 1, wanted, in_));
    } else if (!IsReadable(descriptor_)) {
        return kWait;
    } else {
        got = static_cast<long>(read(descriptor_, to, wanted));
        if (got < 0) {
            return errno == EINTR || errno == EAGAIN ? kWait : kEnd;
        }
    }
    left_ -= got;
    return got;
}

}  // namespace host
