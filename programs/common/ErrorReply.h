#ifndef TALO_PROGRAMS_COMMON_ERRORREPLY_H
#define TALO_PROGRAMS_COMMON_ERRORREPLY_H

#include <cstddef>

// Whole replies for a request that gets none of its own: header block and JSON
// body, as a CGI program writes them. They are constants, so that a process that
// has just crashed can still write them.
struct ErrorReply {
    const char* text;
    size_t size;
};

enum class ReplyStatus {
    kBadRequest,  // 400, code 101: the request cannot be read
    kCrashed,     // 500, code 117: the method ended the process
    kOverloaded,  // 503, code 100: more requests wait than may
    kTimedOut,    // 504, code 117: the method took longer than it may
};

ErrorReply ReplyFor(ReplyStatus status);

#endif
