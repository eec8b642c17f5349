#ifndef APIS_COMMON_SAFEHEADER_H
#define APIS_COMMON_SAFEHEADER_H

#include <string>

namespace TALO {
class APIResponse;
}

// Sets a header from text that may come from a client. Header values are printed
// as they stand, so a line end in one would begin a header of the client's own:
// a name or value with CR, LF or NUL is refused, and nothing is set.
bool SetSafeHeader(TALO::APIResponse* response, const std::string& name, const std::string& value);

#endif
