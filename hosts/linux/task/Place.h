#ifndef TALO_HOSTS_LINUX_TASK_PLACE_H
#define TALO_HOSTS_LINUX_TASK_PLACE_H

#include <string>

namespace host {

// Makes the folder (0700) and in it the database's file (0600, empty), where
// they are missing. False, logged, when that fails or others may write there.
bool MakeTaskPlace(const std::string& folder, const std::string& file);

}  // namespace host

#endif
