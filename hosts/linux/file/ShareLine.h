#ifndef TALO_HOSTS_LINUX_FILE_SHARELINE_H
#define TALO_HOSTS_LINUX_FILE_SHARELINE_H

#include <string>

#include "hosts/linux/sdk/Shares.h"

namespace host {

// Understands one line of the file of shares: a strict JSON object with "name",
// "folder", and optional lists "readers" and "writers". A line that is half
// understood would be a right half understood, so one wrong member refuses it
// whole: outputs stay untouched and `reason` says why.
bool ParseShareLine(const char* begin, const char* end, talo::Share* share, std::string* reason);

}  // namespace host

#endif
