#include "src/polling/APIPollingPrivate.h"

#include <signal.h>

#include <cerrno>
#include <cstring>

#include "src/base/JsonConvert.h"
#include "src/base/Log.h"
#include "webapi/APIRequest.h"

namespace TALO {

namespace {

constexpr char kSource[] = "APIPolling.cpp";

}  // namespace

const char kAdministratorsUser[] = "@administrators";
const char kEveryoneUser[] = "@users";

bool IsWhole(const std::string& text) {
    return text.find('\0') == std::string::npos;
}

APIPollingPrivate::APIPollingPrivate(APIPolling* owner, APIRequest* request)
    : owner(owner), request(request) {
    store["polling_attribute"] = Json::Value(Json::objectValue);
}

APIPollingPrivate::~APIPollingPrivate() = default;

bool APIPollingPrivate::Fail(int code) {
    error = code;
    return false;
}

bool APIPollingPrivate::SetGroupAttr(const std::string& group) {
    if (!group.empty() && group != "admin" && group != "everyone") {
        LOG_ERROR("bad parameters");
        return Fail(kPollingBadParameter);
    }
    if (group == "admin" && (request == nullptr || !request->IsAdmin())) {
        LOG_ERROR("No permission");
        return Fail(kPollingNotPermitted);
    }
    return SetData("polling_attribute", "share_to_group", group, true);
}

bool APIPollingPrivate::DoKill(int pid) {
    if (pid <= 0) {
        LOG_ERROR("invalid process id");
        return false;
    }
    if (kill(pid, SIGTERM) == 0 || errno == ESRCH) {
        return true;
    }
    const int reason = errno;
    LOG_ERROR("Failed to kill %d, reason=%s(%d)", pid, strerror(reason), reason);
    return false;
}

Json::Value APIPollingPrivate::ConverToFullTaskId(const std::string& user, const Json::Value& ids) {
    Json::Value full;
    if (user.empty()) {
        return full;
    }
    if (ids.isString()) {
        return ids.asString().empty() ? full : Json::Value(user + "/" + ids.asString());
    }
    if (ids.isObject()) {
        for (const std::string& name : ids.getMemberNames()) {
            full[name] = user + "/" + ToText(ids[name]);
        }
    } else if (ids.isArray()) {
        for (const Json::Value& id : ids) {
            full.append(user + "/" + ToText(id));
        }
    }
    return full;
}

bool APIPollingPrivate::GetUserAndTaskID(const std::string& full, std::string& user,
                                         std::string& id) {
    const size_t slash = full.find('/');
    if (slash == std::string::npos) {
        return false;
    }
    // Cut before either is stored: `full` may be one of the two.
    std::string rest = full.substr(slash + 1);
    user = full.substr(0, slash);
    id.swap(rest);
    return true;
}

bool APIPollingPrivate::CheckTaskUser(const std::string& user) const {
    if (user == request->GetLoginUserName() || user == kEveryoneUser) {
        return true;
    }
    if (user == kAdministratorsUser) {
        if (request->IsAdmin()) {
            return true;
        }
        LOG_ERROR("Permission denied");
        return false;
    }
    // Another user's task is not even admitted to exist, whoever asks.
    LOG_ERROR("Invalid task id");
    return false;
}

}  // namespace TALO
