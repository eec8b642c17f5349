#ifndef TALO_PLATFORM_TASK_H
#define TALO_PLATFORM_TASK_H

#include <json/json.h>

#include <memory>
#include <string>

#include "platform/Platform.h"

// The task manager: persistent records of background tasks, one per task user
// and task id, each a set of JSON properties with the process that runs it and
// a finished flag. A batch of writes is stored whole or not at all. Records are
// shared between processes; nothing throws.
namespace ORB {

// A handle on one record, created with the record if it is new. Owned by
// whoever makes it; it must not be used across a fork without reload().
class TALO_PLATFORM Task {
  public:
    Task(const char* user, const char* taskId);
    ~Task();
    Task(const Task&) = delete;
    Task& operator=(const Task&) = delete;

    // False when the record could neither be opened nor created.
    bool isValid() const;

    const char* getTaskId() const;

    // A batch: writes between the two reach the store together. endUpdate is
    // false when they could not be stored.
    void beginUpdate();
    bool setProperty(const char* name, const Json::Value& value);
    bool endUpdate();

    bool hasProperty(const char* name) const;
    Json::Value getProperty(const char* name) const;
    bool getBoolProperty(const char* name, bool fallback) const;

    // The process that runs the task. A pid is answered only while that very
    // process lives, else 0, so that a reused pid is never signalled.
    bool setCreatePid(int pid);
    int getCreatePid() const;

    // Reads the record again from storage.
    bool reload();

    // Blocks until the record has the property or `timeout` seconds have passed.
    bool waitForDataReady(const char* property, unsigned long timeout);

    // Marks the task finished; `autoRemove` lets the manager drop the record.
    bool finish(bool autoRemove);
    bool isFinished() const;

    // Deletes the record.
    bool remove();

  private:
    struct State;
    std::unique_ptr<State> state;
};

// The records of one task user.
class TALO_PLATFORM TaskMgr {
  public:
    explicit TaskMgr(const char* user);
    ~TaskMgr();
    TaskMgr(const TaskMgr&) = delete;
    TaskMgr& operator=(const TaskMgr&) = delete;

    bool isValid() const;

    // The user's task ids as a JSON array of texts: all when `prefix` is null,
    // else those that begin with it.
    Json::Value getAllTaskId(const char* prefix) const;

  private:
    struct State;
    std::unique_ptr<State> state;
};

class TALO_PLATFORM TaskUtil {
  public:
    // A new id, unique among the user's tasks, that begins with the prefix; ""
    // when the prefix is no name or the store cannot be reached.
    static std::string getUniqueID(const char* user, const char* prefix);
    static bool checkTaskExists(const char* user, const char* taskId);
};

}  // namespace ORB

#endif
