#ifndef TALO_HOSTS_LINUX_TASK_PROPERTYTEXT_H
#define TALO_HOSTS_LINUX_TASK_PROPERTYTEXT_H

#include <json/json.h>

#include <string>

namespace host {

// The text of a value. False when it is none that ReadProperty takes: too large,
// or nested too deep.
bool WriteProperty(const Json::Value& value, std::string* text);

// The value of a text, whoever has written it. False, with `out` untouched, when
// it is no JSON.
bool ReadProperty(const char* text, size_t size, Json::Value* out);

}  // namespace host

#endif
