#ifndef TALO_HOSTS_LINUX_RELAY_FORMTEXT_H
#define TALO_HOSTS_LINUX_RELAY_FORMTEXT_H

#include <json/json.h>

#include <string>

namespace host {

// What names a call: "api=..&version=..&method=..".
std::string CallText(const std::string& api, int version, const std::string& method);

// A call as a form: behind its name one field per parameter, whose text is the
// JSON text of the value. Left out is what belongs to the way over this appliance:
// the session here, the target and the time limit, and whatever would name another
// call. A null object has no parameters.
std::string FormText(const std::string& api, int version, const std::string& method,
                     const Json::Value& params);

// A URL without its query, and one with a further one behind its own.
std::string WithoutQuery(const std::string& url);
std::string WithQuery(const std::string& url, const std::string& query);

}  // namespace host

#endif
