#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "platform/System.h"
#include "platform/Task.h"
#include "src/base/ErrorCode.h"
#include "src/base/Guarded.h"
#include "src/base/JsonConvert.h"
#include "src/base/Log.h"
#include "src/polling/APIPollingPrivate.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

namespace TALO {

namespace {

constexpr char kSource[] = "APIPolling.cpp";

// Seconds that the client waits for the work's first result.
constexpr unsigned long kFirstResultTimeout = 60;

// A work function that threw before it reported anything leaves what a method
// leaves that reports nothing.
void RecordNoResult(ORB::Task* task) {
    Json::Value body(Json::objectValue);
    body["success"] = false;
    body["error"]["code"] = static_cast<int>(kErrorNoResult);
    task->beginUpdate();
    (void)task->setProperty("body", body);
    (void)task->setProperty("task_run", true);
    (void)task->endUpdate();
}

// The child's whole life. What it shares with its parent is the record alone:
// buffers, temporary files and the answer are the parent's, hence no unwinding
// out of here and no clean-up at the end.
[[noreturn]] void RunWork(ORB::Task* task, const Json::Value& environ, APIRequest* request,
                          APIResponse* response, APIPolling::Work work, void* argument) noexcept {
    (void)setsid();
    request->InitEnv(environ);
    (void)task->setCreatePid(getpid());
    const bool returned = Guarded(kSource, __LINE__, [&]() { work(request, response, argument); });
    (void)task->reload();
    if (!returned && !task->hasProperty("body")) {
        RecordNoResult(task);
    }
    // Read back: whoever stopped the task may have settled it otherwise.
    (void)task->finish(task->getBoolProperty("auto_remove", false));
    _exit(0);
}

}  // namespace

bool APIPollingPrivate::ChooseTaskUser(const std::string& group, APIResponse* response,
                                       std::string* user) const {
    if (group.empty()) {
        *user = request->GetLoginUserName();
    } else if (group == "everyone") {
        *user = kEveryoneUser;
    } else if (group != "admin") {
        response->SetError(kErrorShareGroup, Json::Value());
        return false;
    } else if (request->IsAdmin()) {
        *user = kAdministratorsUser;
    } else {
        response->SetError(kErrorPermission, Json::Value());
        return false;
    }
    return true;
}

bool APIPollingPrivate::StoreInfo(ORB::Task* task, const std::string& group,
                                  const std::string& prefix, bool autoRemove) const {
    Json::Value info(Json::objectValue);
    info["api"] = request->GetAPIClass();
    info["version"] = request->GetAPIVersion();
    info["method"] = request->GetAPIMethod();
    info["param"] = request->GetParam("", Json::Value(Json::objectValue));
    for (const char* identity : {"api", "version", "method"}) {
        info["param"].removeMember(identity);
    }
    info["group"] = group;
    info["prefix"] = prefix;

    task->setSecretParams(request->GetAPIInfo("secret", Json::Value()));
    task->beginUpdate();
    (void)task->setProperty("info", info);
    (void)task->setProperty("auto_remove", autoRemove);
    return task->endUpdate();
}

bool APIPollingPrivate::Start(APIResponse* response, APIPolling::Work work, void* argument) {
    if (request == nullptr) {
        LOG_ERROR("unknown request");
        return Fail(kPollingBadParameter);
    }
    if (response == nullptr || work == nullptr) {
        LOG_ERROR("bad parameters");
        return Fail(kPollingBadParameter);
    }
    const std::string prefix = ToText(GetData("polling_attribute", "task_id_prefix", ""));
    const std::string group = ToText(GetData("polling_attribute", "share_to_group", ""));
    const bool autoRemove = ToBool(GetData("polling_attribute", "auto_remove", true));

    std::string taskUser;
    if (!ChooseTaskUser(group, response, &taskUser)) {
        return false;
    }
    const std::string taskId =
        IsWhole(prefix) ? ORB::TaskUtil::getUniqueID(taskUser.c_str(), prefix.c_str()) : "";
    ORB::Task task(taskUser.c_str(), taskId.c_str());
    if (!task.isValid()) {
        response->SetError(kErrorNoResult, Json::Value());
        return false;
    }
    if (!StoreInfo(&task, group, prefix, autoRemove)) {
        // The response stays as it is: the method decides what the client hears.
        LOG_ERROR("Failed to set property.");
        return false;
    }

    Json::Value environ(Json::objectValue);
    environ["task_id"] = task.getTaskId();
    environ["task_user"] = taskUser;
    environ["full_task_id"] = taskUser + "/" + task.getTaskId();
    const int child = TLIBCProcFork();
    if (child < 0) {
        const int reason = errno;
        (void)task.remove();
        LOG_ERROR("Failed to fork(). %s", strerror(reason));
        response->SetError(kErrorCompoundOrFork, Json::Value());
        return false;
    }
    if (child == 0) {
        RunWork(&task, environ, request, response, work, argument);
    }
    (void)task.waitForDataReady("task_run", kFirstResultTimeout);
    Json::Value data(Json::objectValue);
    data["task_id"] = environ["full_task_id"];
    response->SetSuccess(data);
    return true;
}

}  // namespace TALO
