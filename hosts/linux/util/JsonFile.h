#ifndef TALO_HOSTS_LINUX_UTIL_JSONFILE_H
#define TALO_HOSTS_LINUX_UTIL_JSONFILE_H

#include <json/json.h>

#include <string>

namespace host {

// Reads one JSON object or array from a file, as WebAPIUtil describes it. On
// failure `out` stays untouched and `reason` says why.
bool ReadJsonFile(Json::Value& out, const char* path, std::string* reason);

}  // namespace host

#endif
