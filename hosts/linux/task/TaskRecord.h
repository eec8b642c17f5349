#ifndef TALO_HOSTS_LINUX_TASK_TASKRECORD_H
#define TALO_HOSTS_LINUX_TASK_TASKRECORD_H

#include <json/json.h>

#include <map>
#include <string>

#include "hosts/linux/task/TaskModule.h"

namespace host {

// What a handle knows of a record.
struct TaskRecord {
    std::map<std::string, Json::Value> properties;
    TaloTaskProcess process = {};
    bool finished = false;
};

// Reads a record. `record` stays untouched unless the answer is kTaskDone. A
// property whose text is no JSON is left out, logged.
int ReadTaskRecord(const TaloTaskModule& store, long long number, TaskRecord* record);

}  // namespace host

#endif
