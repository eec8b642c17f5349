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
//
// A task user is a login name, "@users" or "@administrators". A task id is 1 to
// 128 letters, digits, "_", "-" and ".". A property's name is 1 to 128 bytes
// without control characters.
namespace ORB {

// A handle on one record, created with the record if it is new. Owned by
// whoever makes it. It answers from what it last read or stored: what others
// have written since shows after reload() or waitForDataReady(). It stays with
// its record: once that is removed, nothing can be stored through the handle
// any more, also when a new record has got the same id. A handle made before a
// fork may be used on both sides of it.
class TALO_PLATFORM Task {
  public:
    Task(const char* user, const char* taskId);
    ~Task();
    Task(const Task&) = delete;
    Task& operator=(const Task&) = delete;

    // False when user or id is none, or the record could neither be opened nor
    // created. Nothing can be stored through such a handle then.
    bool isValid() const;

    const char* getTaskId() const;

    // Names of parameters whose values the store must not keep, beside "_sid" and
    // "passwd", which it never keeps: where the property "info" is stored, its
    // "param" members of these names get the text "*****" for a value. An array
    // of texts; anything else in it is ignored.
    void setSecretParams(const Json::Value& names);

    // A batch: writes between the two reach the store together, and show in this
    // handle, with endUpdate. It is false when they could not be stored, one of
    // them was refused, the record is gone, or no batch had begun; then none of
    // them is stored. A write outside of a batch is stored at once. null is a
    // value too.
    void beginUpdate();
    bool setProperty(const char* name, const Json::Value& value);
    bool endUpdate();

    // What is not there is null. A value that is no bool answers the fallback.
    bool hasProperty(const char* name) const;
    Json::Value getProperty(const char* name) const;
    bool getBoolProperty(const char* name, bool fallback) const;

    // The process that runs the task, stored at once; false when none of that id
    // lives. A pid is answered only while that very process lives (one that has
    // ended and was not waited for does not), else 0, so that a reused pid is
    // never signalled.
    bool setCreatePid(int pid);
    int getCreatePid() const;

    // Reads the record again from storage. False when that fails, which leaves
    // the handle as it was, or when the record is gone, which empties it. Ends a
    // batch that has begun, without storing it.
    bool reload();

    // Blocks until the record has the property or `timeout` seconds have passed;
    // whether it has the property. A finished task is waited for no less; one
    // that is gone, or cannot be had, is not. Reads the record as reload() does.
    bool waitForDataReady(const char* property, unsigned long timeout);

    // Marks the task finished; `autoRemove` lets the manager drop the record soon
    // and is stored as the property "auto_remove" too, so that what a Stop has
    // asked for is what the task's own process reads back. To finish again is no
    // mistake, and the last one counts. False when it could not be stored or the
    // record is gone.
    bool finish(bool autoRemove);
    bool isFinished() const;

    // Deletes the record. True also when it was gone already.
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

    // The user's task ids as a JSON array of texts, the oldest first: all when
    // `prefix` is null, else those that begin with it. An empty array when there
    // are none, or the store cannot be read.
    Json::Value getAllTaskId(const char* prefix) const;

  private:
    struct State;
    std::unique_ptr<State> state;
};

class TALO_PLATFORM TaskUtil {
  public:
    // A new id, unique among the user's tasks, that begins with the prefix: up
    // to 64 letters, digits, "_", "-" and ".", also none at all. "" when the
    // prefix is another, the user none, or the store cannot be reached. Makes no
    // record.
    static std::string getUniqueID(const char* user, const char* prefix);

    // Never makes the record. False for what can be no user or id, too.
    static bool checkTaskExists(const char* user, const char* taskId);
};

}  // namespace ORB

#endif
