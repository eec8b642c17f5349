#ifndef TALO_SRC_ENTRY_ENVIRONMENT_H
#define TALO_SRC_ENTRY_ENVIRONMENT_H

#include <json/json.h>

#include <string>

namespace TALO {

// Sets an environment variable for the length of one request; `changes` remembers
// what it was before the first time.
void SetForRequest(Json::Value* changes, const char* name, const std::string& value);

// Puts the variables back that still are what they were set to: what somebody
// else has made of one meanwhile is his.
void EndEnvironment(const Json::Value& changes);

}  // namespace TALO

#endif
