#ifndef TESTS_HOST_TASK_TASKROOT_H
#define TESTS_HOST_TASK_TASKROOT_H

#include <gtest/gtest.h>
#include <json/json.h>

#include <functional>
#include <string>
#include <vector>

#include "platform/Task.h"

// A private root without tasks. What a test stores goes with it again.
class TaskRoot : public ::testing::Test {
  public:
    void SetUp() override;
    void TearDown() override;

    static void Configure(const std::string& lines);  // host.conf

    // The store behind the task manager's back.
    static std::string Database();
    static void Do(const std::string& sql);
    static std::string Ask(const std::string& sql);  // the first column of the first row

    // As if the last sweep were long ago; the next process to come by does it.
    static void MakeSweepDue();

    // Reads with a fresh handle.
    static Json::Value Stored(const std::string& id, const char* property);
    static bool IsFinished(const std::string& id);

    // What a start stores.
    static bool Begin(ORB::Task* task);
    static bool Report(ORB::Task* task);  // the first result

    static std::string Id(const char* prefix = "");
};

// Empties the root's store, and sees to it that the module is in its place.
void ClearTasks();

// In a process of its own, which is waited for; its exit status, or 1000 + the
// signal that ended it.
int InProcess(const std::function<int()>& body);
pid_t StartProcess(const std::function<int()>& body);
int WaitFor(pid_t process);

// What went to the system log of this process since the test began.
bool WasLogged(const std::string& part);
std::string Logged();

#endif
