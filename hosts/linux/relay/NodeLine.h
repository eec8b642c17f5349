#ifndef TALO_HOSTS_LINUX_RELAY_NODELINE_H
#define TALO_HOSTS_LINUX_RELAY_NODELINE_H

#include <json/json.h>

#include <cstddef>
#include <string>

#include "hosts/linux/sdk/Nodes.h"

namespace host {

constexpr size_t kMaxNodeSecretBytes = 256;

// Understands one line of the file of appliances:
//
//     {"id": 2, "url": "https://nas2.local/webapi/entry.cgi",
//      "authority": "/etc/talo/nas2.pem", "pin": "sha256//...=", "self": 1,
//      "secret": "...", "accepts": {"secret_hash": "...", "classes": ["normal.local"]}}
//
// "url", "self" and "secret" go together, "authority" and "pin" only with them; they
// or "accepts" may be left out, not both. One wrong member refuses the line whole:
// outputs stay untouched and `reason` says why. `members` (may be null) gets the line
// as it is.
bool ParseNodeLine(const char* begin, const char* end, talo::Node* node, Json::Value* members,
                   std::string* reason);

// Puts what an appliance is into the members of its line; others stay.
void SetNodeMembers(const talo::Node& node, Json::Value* members);

// Whether a text can be a secret: some visible ASCII characters.
bool IsNodeSecret(const std::string& text);

// Whether a text pins a key: "sha256//" and the base64 of 32 bytes.
bool IsNodePin(const std::string& text);

// Whether a text names a class of users, "normal.local" or one of the five others.
bool IsUserClass(const std::string& text);

}  // namespace host

#endif
