#include "platform/Task.h"
#include "src/base/JsonConvert.h"
#include "src/base/Log.h"
#include "src/polling/APIPollingPrivate.h"
#include "webapi/APIRequest.h"

namespace TALO {

namespace {

constexpr char kSource[] = "APIPolling.cpp";

// The result first, so that nothing in it can pass for the manager's own facts.
void FillStatus(const ORB::Task& task, Json::Value* out) {
    Json::Value status = task.getProperty("body");
    if (!status.isObject()) {
        status = Json::Value(Json::objectValue);
    }
    status["finish"] = task.isFinished();
    status["auto_remove"] = task.getProperty("auto_remove");
    if (task.hasProperty("info")) {
        status["info"] = task.getProperty("info");
    }
    out->swap(status);
}

// What a work function that tells nothing is known to have told.
void FillProgress(const ORB::Task& task, Json::Value* out) {
    const Json::Value told = task.getProperty("progress");
    Json::Value progress(Json::objectValue);
    progress["percent"] = Member(told, "percent");
    progress["text"] = ToText(Member(told, "text"));
    progress["log"] = Member(told, "log");
    if (!progress["log"].isArray()) {
        progress["log"] = Json::Value(Json::arrayValue);
    }
    progress["log_first"] = static_cast<Json::Int64>(ToInt64(Member(told, "log_first"), 0));
    progress["time"] = Member(told, "time");
    progress["finish"] = task.isFinished();
    out->swap(progress);
}

bool Exists(const std::string& user, const std::string& id) {
    return IsWhole(id) && ORB::TaskUtil::checkTaskExists(user.c_str(), id.c_str());
}

}  // namespace

std::unique_ptr<ORB::Task> APIPollingPrivate::OpenTask(const std::string& fullTaskId) {
    if (request == nullptr) {
        LOG_ERROR("unknown request");
        (void)Fail(kPollingBadParameter);
        return nullptr;
    }
    if (fullTaskId.empty()) {
        LOG_ERROR("bad parameters");
        (void)Fail(kPollingBadParameter);
        return nullptr;
    }
    std::string user;
    std::string id;
    if (!GetUserAndTaskID(fullTaskId, user, id) || !CheckTaskUser(user)) {
        LOG_ERROR("Invalid task id[%s]", fullTaskId.c_str());
        (void)Fail(kPollingInvalidId);
        return nullptr;
    }
    if (!Exists(user, id)) {
        LOG_ERROR("No such task id[%s]", fullTaskId.c_str());
        (void)Fail(kPollingNoSuchTask);
        return nullptr;
    }
    std::unique_ptr<ORB::Task> task = std::make_unique<ORB::Task>(user.c_str(), id.c_str());
    if (!task->isValid()) {
        LOG_ERROR("Cannot get task");
        (void)Fail(kPollingNoTask);
        return nullptr;
    }
    return task;
}

bool APIPollingPrivate::Status(const std::string& fullTaskId, Json::Value& out) {
    const std::unique_ptr<ORB::Task> task = OpenTask(fullTaskId);
    if (task == nullptr) {
        return false;
    }
    FillStatus(*task, &out);
    return true;
}

bool APIPollingPrivate::Progress(const std::string& fullTaskId, Json::Value& out) {
    const std::unique_ptr<ORB::Task> task = OpenTask(fullTaskId);
    if (task == nullptr) {
        return false;
    }
    FillProgress(*task, &out);
    return true;
}

bool APIPollingPrivate::Status(const Json::Value& fullTaskIds, Json::Value& out) {
    if (request == nullptr) {
        LOG_ERROR("unknown request");
        return Fail(kPollingBadParameter);
    }
    if (!fullTaskIds.isArray()) {
        LOG_ERROR("bad parameters");
        return Fail(kPollingBadParameter);
    }
    Json::Value states(Json::objectValue);
    for (const Json::Value& element : fullTaskIds) {
        const std::string fullTaskId = ToText(element);
        std::string user;
        std::string id;
        if (!GetUserAndTaskID(fullTaskId, user, id) || !CheckTaskUser(user)) {
            LOG_ERROR("Invalid task id[%s]", fullTaskId.c_str());
            continue;
        }
        Json::Value& state = states[fullTaskId] = Json::Value(Json::objectValue);
        if (!Exists(user, id)) {
            continue;
        }
        const ORB::Task task(user.c_str(), id.c_str());
        if (!task.isValid()) {
            LOG_ERROR("Cannot get task");
            continue;
        }
        FillStatus(task, &state);
    }
    out.swap(states);
    return true;
}

// A malformed id is 502 here and 503 for Status: clients tell the two apart.
bool APIPollingPrivate::Stop(const std::string& fullTaskId, bool remove) {
    if (request == nullptr) {
        LOG_ERROR("unknown request");
        return Fail(kPollingBadParameter);
    }
    std::string user;
    std::string id;
    if (!GetUserAndTaskID(fullTaskId, user, id)) {
        LOG_ERROR("Invalid task id[%s]", fullTaskId.c_str());
        return Fail(kPollingBadParameter);
    }
    if (!CheckTaskUser(user)) {
        return Fail(kPollingInvalidId);
    }
    if (!Exists(user, id)) {
        LOG_ERROR("task id[%s] does not exist", fullTaskId.c_str());
        return Fail(kPollingNoSuchTask);
    }
    ORB::Task task(user.c_str(), id.c_str());
    if (!task.isValid()) {
        LOG_ERROR("cannot get task by task id[%s]", fullTaskId.c_str());
        return Fail(kPollingNoTask);
    }
    const int pid = task.getCreatePid();
    if (pid > 0 && !DoKill(pid)) {
        LOG_ERROR("send SIGTERM to task id[%s] fail", fullTaskId.c_str());
        return Fail(kPollingNotKilled);
    }
    if (!task.finish(remove)) {
        LOG_ERROR("set task id[%s] to finish fail", fullTaskId.c_str());
        return Fail(kPollingNotFinished);
    }
    return true;
}

int APIPollingPrivate::GroupUser(const std::string& group, std::string* user) const {
    if (group == "admin") {
        if (!request->IsAdmin()) {
            return kPollingNotPermitted;
        }
        *user = kAdministratorsUser;
    } else if (group == "everyone") {
        *user = kEveryoneUser;
    } else if (group == "user") {
        *user = request->GetLoginUserName();
    } else {
        return kPollingInvalidId;
    }
    return 0;
}

bool APIPollingPrivate::List(const std::string& prefix, const Json::Value& groups,
                             Json::Value& out) {
    if (request == nullptr) {
        LOG_ERROR("unknown request");
        return Fail(kPollingBadParameter);
    }
    if (!groups.isArray()) {
        LOG_ERROR("bad parameters");
        return Fail(kPollingBadParameter);
    }
    if (!out.isObject()) {
        out = Json::Value(Json::objectValue);
    }
    for (const Json::Value& element : groups) {
        const std::string group = ToText(element);
        std::string user;
        const int refused = GroupUser(group, &user);
        if (refused != 0) {
            return Fail(refused);
        }
        const ORB::TaskMgr manager(user.c_str());
        if (!manager.isValid()) {
            LOG_ERROR("Cannot get task manager");
            return Fail(kPollingNoTask);
        }
        const char* selected = prefix.empty() ? nullptr : prefix.c_str();
        out[group] = IsWhole(prefix) ? ConverToFullTaskId(user, manager.getAllTaskId(selected))
                                     : Json::Value();
    }
    return true;
}

}  // namespace TALO
