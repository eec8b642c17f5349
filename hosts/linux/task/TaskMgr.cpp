#include <vector>

#include "hosts/linux/task/NoThrow.h"
#include "hosts/linux/task/TaskName.h"
#include "hosts/linux/task/TaskStore.h"
#include "platform/Task.h"

namespace ORB {

namespace {

constexpr char kSource[] = "TaskMgr.cpp";

struct Ids {
    Json::Value found = Json::Value(Json::arrayValue);
    bool failed = false;
};

void TakeId(void* context, const char* id) {
    Ids* ids = static_cast<Ids*>(context);
    try {
        (void)ids->found.append(id);
    } catch (const std::exception&) {
        ids->failed = true;
    }
}

}  // namespace

struct TaskMgr::State {
    std::string user;
    const TaloTaskModule* store = nullptr;
};

TaskMgr::TaskMgr(const char* user) {
    (void)host::NoThrow(false, [&] {
        state = std::make_unique<State>();
        state->user = user != nullptr ? user : "";
        if (!host::IsTaskUser(state->user)) {
            HOST_LOG("no tasks can be had: \"%s\" cannot have any", state->user.c_str());
            return false;
        }
        state->store = host::TaskStore();
        return true;
    });
}

TaskMgr::~TaskMgr() {}

bool TaskMgr::isValid() const {
    return state != nullptr && state->store != nullptr;
}

Json::Value TaskMgr::getAllTaskId(const char* prefix) const {
    return host::NoThrow(Json::Value(Json::arrayValue), [&] {
        const std::string wanted = prefix != nullptr ? prefix : "";
        Ids ids;
        // A text that is no id's beginning is the beginning of none.
        if (!isValid() || (!wanted.empty() && !host::IsTaskId(wanted)) ||
            state->store->list(state->user.c_str(), wanted.c_str(), &ids, TakeId) != kTaskDone ||
            ids.failed) {
            return Json::Value(Json::arrayValue);
        }
        return ids.found;
    });
}

std::string TaskUtil::getUniqueID(const char* user, const char* prefix) {
    return host::NoThrow(std::string(), [&] {
        const std::string owner = user != nullptr ? user : "";
        const std::string begin = prefix != nullptr ? prefix : "";
        if (!host::IsTaskUser(owner) || !host::IsTaskPrefix(begin)) {
            HOST_LOG("no task can be named: \"%s...\" of \"%s\" cannot be one", begin.c_str(),
                     owner.c_str());
            return std::string();
        }
        char id[host::kTaskIdRoom];
        const TaloTaskModule* store = host::TaskStore();
        return store != nullptr &&
                       store->newId(owner.c_str(), begin.c_str(), id, sizeof id) == kTaskDone
                   ? std::string(id)
                   : std::string();
    });
}

bool TaskUtil::checkTaskExists(const char* user, const char* taskId) {
    return host::NoThrow(false, [&] {
        const std::string owner = user != nullptr ? user : "";
        const std::string id = taskId != nullptr ? taskId : "";
        long long number = 0;
        const TaloTaskModule* store =
            host::IsTaskUser(owner) && host::IsTaskId(id) ? host::TaskStore() : nullptr;
        return store != nullptr && store->find(owner.c_str(), id.c_str(), 0, &number) == kTaskDone;
    });
}

}  // namespace ORB
