#include "hosts/linux/download/Send.h"

#include <errno.h>
#include <fcntl.h>
#include <poll.h>
#include <pthread.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <iostream>

#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {

constexpr char kSource[] = "Send.cpp";

// Large enough that system calls cost nothing beside the copying, small enough
// for a processor's cache.
constexpr size_t kBlock = 256u << 10;

bool IsPending(int signal) {
    sigset_t pending;
    return sigpending(&pending) == 0 && sigismember(&pending, signal) == 1;
}

// Somebody who shares the descriptor may make it refuse to wait.
void WaitForRoom() {
    struct pollfd output = {STDOUT_FILENO, POLLOUT, 0};
    (void)poll(&output, 1, -1);
}

}  // namespace

// A SIGPIPE that was already on its way is not ours to take.
ClientStream::ClientStream() {
    sigset_t pipe;
    (void)sigemptyset(&pipe);
    (void)sigaddset(&pipe, SIGPIPE);
    (void)sigemptyset(&before_);
    blocked_ = !IsPending(SIGPIPE) && pthread_sigmask(SIG_BLOCK, &pipe, &before_) == 0;
    const int flags = fcntl(STDOUT_FILENO, F_GETFL);
    if (flags >= 0 && (flags & O_NONBLOCK) != 0 &&
        fcntl(STDOUT_FILENO, F_SETFL, flags & ~O_NONBLOCK) == 0) {
        flags_ = flags;
    }
}

ClientStream::~ClientStream() {
    const int kept = errno;
    if (flags_ >= 0) {
        (void)fcntl(STDOUT_FILENO, F_SETFL, flags_);
    }
    if (blocked_) {
        sigset_t pipe;
        (void)sigemptyset(&pipe);
        (void)sigaddset(&pipe, SIGPIPE);
        const struct timespec atOnce = {0, 0};
        while (IsPending(SIGPIPE) && sigtimedwait(&pipe, nullptr, &atOnce) < 0 && errno == EINTR) {
        }
        (void)pthread_sigmask(SIG_SETMASK, &before_, nullptr);
    }
    errno = kept;
}

// Through stdio, which has the header lines in front of these: all of them leave
// together.
bool ClientStream::WriteHeader(const std::string& text) {
    std::cout.flush();
    return std::fwrite(text.data(), 1, text.size(), stdout) == text.size() &&
           std::fflush(stdout) == 0;
}

bool ClientStream::Write(const char* bytes, size_t size) {
    for (size_t written = 0; written < size;) {
        const ssize_t put = write(STDOUT_FILENO, bytes + written, size - written);
        if (put >= 0) {
            written += static_cast<size_t>(put);
        } else if (errno == EAGAIN) {
            WaitForRoom();
        } else if (errno != EINTR) {
            return false;
        }
    }
    return true;
}

// Copies, although the kernel could pass on the pages of the file itself: a page
// that waits in a pipe or a socket is still the file's. When the file is cut off
// meanwhile, the kernel clears the page's rest, and the client gets zeros that
// never were in the file. With a pipe of a few blocks the copy is fast enough.
bool ClientStream::WriteFile(int file, uint64_t first, uint64_t length) {
    if (length > kBlock) {
        // Refused for what is no pipe, and beyond the user's share of memory.
        if (fcntl(STDOUT_FILENO, F_GETPIPE_SZ) < static_cast<int>(kBlock)) {
            (void)fcntl(STDOUT_FILENO, F_SETPIPE_SZ, static_cast<int>(kBlock));
        }
        (void)posix_fadvise(file, static_cast<off_t>(first), static_cast<off_t>(length),
                            POSIX_FADV_SEQUENTIAL);
    }
    while (length > 0) {
        const size_t wanted = static_cast<size_t>(std::min<uint64_t>(length, kBlock));
        const ssize_t got = pread(file, Block(), wanted, static_cast<off_t>(first));
        if (got < 0 && errno == EINTR) {
            continue;
        }
        if (got <= 0) {
            HOST_LOG("download ended %llu bytes early: %s", static_cast<unsigned long long>(length),
                     got == 0 ? "the file has shrunk" : "it cannot be read");
            return false;
        }
        if (!Write(Block(), static_cast<size_t>(got))) {
            return false;
        }
        first += static_cast<uint64_t>(got);
        length -= static_cast<uint64_t>(got);
    }
    return true;
}

bool ClientStream::WriteRest(FILE* file) {
    for (;;) {
        const size_t got = std::fread(Block(), 1, kBlock, file);
        if (!Write(Block(), got)) {
            return false;
        }
        if (got == kBlock) {
            continue;
        }
        if (std::ferror(file) == 0 || errno != EINTR) {
            return std::ferror(file) == 0;
        }
        std::clearerr(file);
    }
}

// Only a content needs it.
char* ClientStream::Block() {
    if (!block_) {
        block_.reset(new char[kBlock]);
    }
    return block_.get();
}

}  // namespace host
