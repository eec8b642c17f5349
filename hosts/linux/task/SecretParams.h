#ifndef TALO_HOSTS_LINUX_TASK_SECRETPARAMS_H
#define TALO_HOSTS_LINUX_TASK_SECRETPARAMS_H

#include <json/json.h>

namespace host {

// A copy of a task's "info" in which the secret parameters have the text "*****"
// for a value: "_sid", "passwd", and the texts in the array `names`. What is no
// object has no parameters.
Json::Value WithoutSecrets(const Json::Value& info, const Json::Value& names);

}  // namespace host

#endif
