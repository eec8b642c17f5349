#ifndef TALO_PROGRAMS_WEBAPI_SERVER_SCGI_H
#define TALO_PROGRAMS_WEBAPI_SERVER_SCGI_H

#include <string>
#include <vector>

enum class ScgiResult {
    kRead,
    kGone,  // the web server closed the connection
    kMalformed,
    kTooLarge,
    kTimedOut,
};

struct ScgiLimits {
    size_t headerBytes = size_t{64} * 1024;
    int milliseconds = 10000;  // for the whole header block
};

// Reads the header block of an SCGI request off a connection, and not a byte of
// the body behind it: that stays for whoever reads the connection next. Each
// variable is "NAME=value", the first of them CONTENT_LENGTH: with the value of
// WEBAPI_CONTENT_LENGTH, which is not among them, where the web server sent one.
// `reason` says in words what is wrong.
ScgiResult ReadScgiRequest(int connection, const ScgiLimits& limits,
                           std::vector<std::string>* variables, std::string* reason);

#endif
