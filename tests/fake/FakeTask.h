#ifndef TESTS_FAKE_FAKETASK_H
#define TESTS_FAKE_FAKETASK_H

#include <json/json.h>

#include <string>
#include <vector>

// The stand-in's task manager. Its records lie in memory that this process and
// the children it forks later share, as an appliance's lie in its storage; the
// script below is each process's own, handed down at the fork. An operation is
// made to fail by fake::Now().FailCall(its name, nth), or by its number among all
// operations on the task manager.
namespace fake {

// One operation that some process asked for, such as "Task.waitForDataReady" with
// the detail "task_run 60".
struct TaskCall {
    int pid;
    std::string operation;
    std::string detail;
};

struct TaskScript {
    bool waitsPassAtOnce = false;  // the fake clock: no time-out costs any time
    bool answersDeadPids = false;  // as if the process died right after the look
    int failOperation = 0;         // the operation that fails, counted from 1; 0 none
    int killOperation = 0;         // the operation at which the process is killed; 0 none
    int operations = 0;            // how many there were
};

// The script of this process.
TaskScript& Tasks();

// All operations so far, of all processes, in their order.
std::vector<TaskCall> TaskCalls();

// A record as it is stored: "properties", "pid" (0 for none), "finished"; null
// when there is none.
Json::Value TaskRecord(const std::string& user, const std::string& id);

// Stores a record past the task manager. The pid counts as a live process's.
void PutTask(const std::string& user, const std::string& id, const Json::Value& properties,
             int pid = 0, bool finished = false);

// The ids of a task user's records, the oldest first.
std::vector<std::string> TaskIds(const std::string& user);

// Forgets records, operations and script. Reset() does it too.
void ResetTasks();

}  // namespace fake

#endif
