#ifndef APIS_FILE_TARGET_H
#define APIS_FILE_TARGET_H

#include <string>

#include "hosts/linux/sdk/Places.h"
#include "hosts/linux/sdk/Shares.h"

namespace TALO {
class APIRequest;
class APIResponse;
}  // namespace TALO

enum class Access {
    kRead,
    kWrite,   // to the share
    kChange,  // to the entry itself, so that a share is none
};

// What a path of the caller's leads to, once his rights are settled.
struct Target {
    std::string path;  // as it was given
    talo::VirtualPath parsed;
    talo::Share share;
    bool writable = false;
    talo::Place place;

    // The last component.
    const std::string& Name() const;
};

// Reads the path in a parameter, and opens its place for the caller. False with
// the error set on the response: a share that is not there and one that the
// caller may not read look the same.
bool OpenTarget(const TALO::APIRequest& request, TALO::APIResponse* response,
                const std::string& parameter, Access access, Target* target);

// The same for a path that stands somewhere else; a wrong one is a wrong
// `parameter`.
bool OpenTargetAt(const TALO::APIRequest& request, TALO::APIResponse* response,
                  const std::string& parameter, const std::string& path, Access access,
                  Target* target);

#endif
