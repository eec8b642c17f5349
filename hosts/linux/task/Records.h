#ifndef TALO_HOSTS_LINUX_TASK_RECORDS_H
#define TALO_HOSTS_LINUX_TASK_RECORDS_H

#include <functional>
#include <string>

#include "hosts/linux/task/Connection.h"
#include "hosts/linux/task/TaskModule.h"

namespace host {

TaloTaskAnswer FindRecord(Connection* connection, const std::string& user, const std::string& id,
                          long long* number);

// One that another process makes at the same time is the same one.
TaloTaskAnswer MakeRecord(Connection* connection, const std::string& user, const std::string& id,
                          long long* number);

// Calls `facts` once, then `property` for each.
TaloTaskAnswer ReadRecord(Connection* connection, long long number,
                          const std::function<void(const TaloTaskFacts&)>& facts,
                          const std::function<void(const TaloTaskText&)>& property);

// Whether the record that is there has the property.
TaloTaskAnswer HasProperty(Connection* connection, long long number, const std::string& name,
                           bool* has);

TaloTaskAnswer ListRecords(Connection* connection, const std::string& user,
                           const std::string& prefix, const std::function<void(const char*)>& id);

}  // namespace host

#endif
