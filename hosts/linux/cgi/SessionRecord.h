#ifndef TALO_HOSTS_LINUX_CGI_SESSIONRECORD_H
#define TALO_HOSTS_LINUX_CGI_SESSIONRECORD_H

#include <string>

#include "hosts/linux/sdk/Sessions.h"

namespace host {

// A session as the text of its file, and back. False for a text that is no JSON
// object, or lacks the user or the handle, or has them of another type, or has a
// "node" that is no appliance's number.
std::string FormatSessionRecord(const talo::Session& session);
bool ParseSessionRecord(const std::string& text, talo::Session* session);

}  // namespace host

#endif
