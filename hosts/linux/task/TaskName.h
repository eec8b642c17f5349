#ifndef TALO_HOSTS_LINUX_TASK_TASKNAME_H
#define TALO_HOSTS_LINUX_TASK_TASKNAME_H

#include <string>

namespace host {

// What platform/Task.h calls by these names. The locale has no say in it.
bool IsTaskUser(const std::string& user);
bool IsTaskId(const std::string& id);
bool IsTaskPrefix(const std::string& prefix);
bool IsPropertyName(const std::string& name);

// The longest id that is made of a prefix, with its NUL, fits in here.
constexpr unsigned long kTaskIdRoom = 129;

}  // namespace host

#endif
