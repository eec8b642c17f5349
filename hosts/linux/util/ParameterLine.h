#ifndef TALO_HOSTS_LINUX_UTIL_PARAMETERLINE_H
#define TALO_HOSTS_LINUX_UTIL_PARAMETERLINE_H

#include <json/json.h>

#include <string>

namespace host {

// Text into JSON, as WebAPIUtil describes it.
Json::Value SplitTrimmed(const std::string& text, const std::string& separator);
bool MergeParameterLine(const std::string& line, Json::Value& out, bool decode, bool parseJson);

}  // namespace host

#endif
