#include "programs/webapi_server/RestoreStreams.h"

#include <stdio_ext.h>
#include <unistd.h>

#include <cstdio>
#include <cwchar>
#include <iostream>

namespace {

// A reply that fits leaves in one write.
char outputBuffer[64 * 1024];

struct Standard {
    FILE* file;
    int descriptor;
    const char* name;
};

// A wide stream stays one until the process ends.
bool IsSpoilt(const Standard& stream) {
    return fileno(stream.file) != stream.descriptor || fwide(stream.file, 0) > 0;
}

void GiveBuffer() {
    (void)setvbuf(stdout, outputBuffer, _IOFBF, sizeof outputBuffer);
}

bool IsSame(const std::ios& one, const std::ios& other) {
    return one.flags() == other.flags() && one.precision() == other.precision() &&
           one.width() == other.width() && one.fill() == other.fill() &&
           one.exceptions() == other.exceptions() && one.tie() == other.tie() &&
           one.getloc() == other.getloc();
}

}  // namespace

RestoreStreams::RestoreStreams()
    : input_(&std::cin), output_(&std::cout), errors_(&std::cerr), log_(&std::clog) {
    GiveBuffer();
}

void RestoreStreams::Restore(std::vector<std::string>* changes) {
    const Standard kStandard[] = {{stdin, STDIN_FILENO, "input"},
                                  {stdout, STDOUT_FILENO, "output"},
                                  {stderr, STDERR_FILENO, "error"}};
    for (const Standard& stream : kStandard) {
        if (IsSpoilt(stream)) {
            changes->push_back(std::string("standard ") + stream.name + " is spoilt");
            continue;
        }
        __fpurge(stream.file);
        clearerr(stream.file);
    }
    if (fileno(stdout) == STDOUT_FILENO &&
        (__fbufsize(stdout) != sizeof outputBuffer || __flbf(stdout) != 0)) {
        GiveBuffer();
        changes->emplace_back("standard output has another buffer");
    }
    Manner* const manners[] = {&input_, &output_, &errors_, &log_};
    for (Manner* manner : manners) {
        if (manner->Restore()) {
            changes->emplace_back("a standard stream of C++ works otherwise");
        }
    }
}

RestoreStreams::Manner::Manner(std::ios* stream)
    : stream_(stream), manner_(nullptr), buffer_(stream->rdbuf()) {
    manner_.copyfmt(*stream);
}

// The copy has no buffer, which makes its state a bad one: what throws on that is
// left out of it.
bool RestoreStreams::Manner::Restore() {
    const bool changed = stream_->rdbuf() != buffer_ || !IsSame(*stream_, manner_);
    if (changed) {
        stream_->exceptions(std::ios::goodbit);
        (void)stream_->rdbuf(buffer_);
        stream_->copyfmt(manner_);
    }
    if (!stream_->good()) {
        stream_->clear();
    }
    return changed;
}
