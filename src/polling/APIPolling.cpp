#include "webapi/APIPolling.h"

#include "src/polling/APIPollingPrivate.h"

namespace TALO {

APIPolling::APIPolling(APIRequest* request) : d(new APIPollingPrivate(this, request)) {}

APIPolling::APIPolling() : APIPolling(nullptr) {}

APIPolling::~APIPolling() {
    delete d;
}

void APIPolling::SetRequest(APIRequest* request) {
    d->request = request;
}

bool APIPolling::SetPrefixAttr(const std::string& prefix) {
    return d->SetData("polling_attribute", "task_id_prefix", prefix, true);
}

bool APIPolling::SetRemoveAttr(bool remove) {
    return d->SetData("polling_attribute", "auto_remove", remove, false);
}

bool APIPolling::SetGroupAttr(const std::string& group) {
    return d->SetGroupAttr(group);
}

bool APIPolling::Start(APIResponse* response, Work work, void* argument) {
    return d->Start(response, work, argument);
}

bool APIPolling::Status(const std::string& fullTaskId, Json::Value& out) {
    return d->Status(fullTaskId, out);
}

bool APIPolling::Status(const char* fullTaskId, Json::Value& out) {
    return d->Status(std::string(fullTaskId == nullptr ? "" : fullTaskId), out);
}

bool APIPolling::Status(const Json::Value& fullTaskIds, Json::Value& out) {
    return d->Status(fullTaskIds, out);
}

bool APIPolling::Progress(const std::string& fullTaskId, Json::Value& out) {
    return d->Progress(fullTaskId, out);
}

bool APIPolling::Stop(const std::string& fullTaskId, bool remove) {
    return d->Stop(fullTaskId, remove);
}

bool APIPolling::List(const std::string& prefix, const Json::Value& groups, Json::Value& out) {
    return d->List(prefix, groups, out);
}

void APIPolling::SetError(int code) {
    d->error = code;
}

int APIPolling::GetError() const {
    return d->error;
}

}  // namespace TALO
