#ifndef TALO_SRC_BASE_USERCLASS_H
#define TALO_SRC_BASE_USERCLASS_H

#include <json/json.h>

#include <string>

namespace TALO {

// The bit of a user class as a description names it ("admin.local"), 0 for any
// other text.
int UserClassBit(const std::string& name);

// The class of a caller: "admin." or "normal.", then "domain" for a name with a
// backslash, "ldap" for one with an at sign, else "local".
std::string UserClass(const std::string& userName, bool administrator);

// Whether a description's list admits the caller. A list that is absent, empty
// or no array admits nobody, and nobody admits a null name.
bool ListAdmits(const Json::Value& list, const char* userName, bool administrator);

}  // namespace TALO

#endif
