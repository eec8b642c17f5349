#ifndef TALO_SRC_POLLING_APIPOLLINGPRIVATE_H
#define TALO_SRC_POLLING_APIPOLLINGPRIVATE_H

#include <memory>
#include <string>

#include "webapi/APIBase.h"
#include "webapi/APIPolling.h"

namespace ORB {
class Task;
}

namespace TALO {

// The polling error codes. 507 is not used.
enum PollingError {
    kPollingNone = 500,
    kPollingNotFinished = 501,
    kPollingBadParameter = 502,
    kPollingInvalidId = 503,
    kPollingNoTask = 504,
    kPollingNotPermitted = 505,
    kPollingNotKilled = 506,
    kPollingNoSuchTask = 508,
};

// The task manager takes C strings: what holds a NUL would be cut, so it names nothing.
bool IsWhole(const std::string& text);

// Task users that are no login names.
extern const char kAdministratorsUser[];
extern const char kEveryoneUser[];

class APIPollingPrivate : public APIBase {
  public:
    APIPollingPrivate(APIPolling* owner, APIRequest* request);
    virtual ~APIPollingPrivate();

    bool SetGroupAttr(const std::string& group);
    bool Start(APIResponse* response, APIPolling::Work work, void* argument);
    bool Status(const std::string& fullTaskId, Json::Value& out);
    bool Status(const Json::Value& fullTaskIds, Json::Value& out);
    bool Progress(const std::string& fullTaskId, Json::Value& out);
    bool Stop(const std::string& fullTaskId, bool remove);
    bool List(const std::string& prefix, const Json::Value& groups, Json::Value& out);

    // Sends SIGTERM. A process that is not there any more counts as done.
    static bool DoKill(int pid);

    // One id, an object or an array of ids with "user/" in front of each; null
    // when there is nothing to convert.
    static Json::Value ConverToFullTaskId(const std::string& user, const Json::Value& ids);

    // Splits at the first slash. The outputs stay untouched when there is none.
    static bool GetUserAndTaskID(const std::string& full, std::string& user, std::string& id);

    // Whether the caller may see the tasks of a task user.
    bool CheckTaskUser(const std::string& user) const;

    APIPolling* owner;
    APIRequest* request;
    int error = kPollingNone;

  private:
    bool Fail(int code);
    // The task that the caller asks about, after all checks; null with the error.
    std::unique_ptr<ORB::Task> OpenTask(const std::string& fullTaskId);
    bool ChooseTaskUser(const std::string& group, APIResponse* response, std::string* user) const;
    bool StoreInfo(ORB::Task* task, const std::string& group, const std::string& prefix,
                   bool autoRemove) const;
    // Checks a group name of List and names its task user; 0 or the polling error.
    int GroupUser(const std::string& group, std::string* user) const;
};

}  // namespace TALO

#endif
