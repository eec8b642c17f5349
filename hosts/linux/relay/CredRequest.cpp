#include "platform/CredRequest.h"

#include <stdlib.h>

#include <exception>
#include <new>
#include <utility>
#include <vector>

#include "hosts/linux/cgi/Caller.h"
#include "hosts/linux/conf/KeyValueFile.h"
#include "hosts/linux/relay/FormText.h"
#include "hosts/linux/relay/Hops.h"
#include "hosts/linux/relay/NodeCall.h"
#include "hosts/linux/relay/Performed.h"
#include "hosts/linux/util/HostLog.h"

namespace TALO {

struct CredRequestMgr::State {
    std::vector<std::unique_ptr<host::NodeCall>> calls;
    int error = 0;
};

namespace {

constexpr char kSource[] = "CredRequest.cpp";

using host::NodeCall;
using talo::RelayError;

constexpr long long kAnswerLimit = 16LL << 20;
constexpr long long kMostAnswerLimit = 1LL << 30;

long long AnswerLimit() {
    long long limit = kAnswerLimit;
    host::HostSettings().Limit("relay_answer_limit", kMostAnswerLimit, &limit);
    return limit;
}

// A line of its own, whatever the client sent.
bool IsHeaderText(const std::string& text) {
    for (const char byte : text) {
        if (static_cast<unsigned char>(byte) < ' ' || byte == '\x7f') {
            return false;
        }
    }
    return true;
}

bool ReadSize(const std::string& text, long long* size) {
    constexpr size_t kMostDigits = 18;
    if (text.empty() || text.size() > kMostDigits) {
        return false;
    }
    long long value = 0;
    for (const char byte : text) {
        if (byte < '0' || byte > '9') {
            return false;
        }
        value = value * 10 + (byte - '0');
    }
    *size = value;
    return true;
}

std::string TextOf(const Json::Value& headers, const char* name) {
    const Json::Value value = headers.isObject() ? headers[name] : Json::Value();
    return value.isString() || value.isIntegral() ? value.asString() : std::string();
}

bool ReadHeaders(const Json::Value& headers, host::NodeRequest* request) {
    request->contentType = TextOf(headers, "Content-Type");
    if (!IsHeaderText(request->contentType)) {
        HOST_LOG("the type of a body is no header text");
        return false;
    }
    if (!ReadSize(TextOf(headers, "Content-Length"), &request->bodySize)) {
        HOST_LOG("a body that does not tell its length is not sent on");
        return false;
    }
    return true;
}

// What ends all calls of a run, or none.
RelayError CommonError(host::Caller* caller, int* hops) {
    if (!host::NextHop(getenv(host::kHopsVariable), hops)) {
        return RelayError::kTooManyHops;
    }
    return host::FindCaller(caller) ? RelayError::kNone : RelayError::kNoCaller;
}

void Perform(const std::vector<NodeCall*>& calls) {
    host::Caller caller;
    int hops = 0;
    const RelayError error = CommonError(&caller, &hops);
    const long long limit = AnswerLimit();
    std::vector<NodeCall*> ready;
    for (NodeCall* call : calls) {
        if (error != RelayError::kNone) {
            call->Fail(error);
        } else if (call->Prepare(caller, hops, limit)) {
            ready.push_back(call);
        }
    }
    host::PerformNodeCalls(ready);
}

}  // namespace

CredRequest::~CredRequest() = default;

// Without its state a manager queues nothing.
CredRequestMgr::CredRequestMgr() : state(new (std::nothrow) State()) {}

CredRequestMgr::~CredRequestMgr() = default;

int CredRequestMgr::AddWebAPIRequest(long long target, const std::string& api, int version,
                                     const std::string& method, const Json::Value& params) {
    if (state == nullptr || (!params.isObject() && !params.isNull())) {
        return -1;
    }
    try {
        host::NodeRequest request;
        request.target = target;
        request.call = host::CallText(api, version, method);
        request.form = host::FormText(api, version, method, params);
        state->calls.push_back(std::make_unique<NodeCall>(std::move(request)));
        return static_cast<int>(state->calls.size()) - 1;
    } catch (const std::exception& problem) {
        HOST_LOG("cannot queue a call: %s", problem.what());
        return -1;
    }
}

int CredRequestMgr::AddRelayRequest(long long target, const std::string& api, int version,
                                    const std::string& method, const Json::Value& headers, FILE* in,
                                    FILE* out) {
    if (state == nullptr || in == nullptr) {
        return -1;
    }
    try {
        host::NodeRequest request;
        request.target = target;
        request.call = host::CallText(api, version, method);
        request.in = in;
        request.out = out;
        if (!ReadHeaders(headers, &request)) {
            return -1;
        }
        state->calls.push_back(std::make_unique<NodeCall>(std::move(request)));
        return static_cast<int>(state->calls.size()) - 1;
    } catch (const std::exception& problem) {
        HOST_LOG("cannot queue a call: %s", problem.what());
        return -1;
    }
}

CredRequest* CredRequestMgr::GetRequest(int index) {
    const bool known =
        state != nullptr && index >= 0 && static_cast<size_t>(index) < state->calls.size();
    return known ? state->calls[static_cast<size_t>(index)].get() : nullptr;
}

bool CredRequestMgr::Run() {
    if (state == nullptr) {
        return false;
    }
    try {
        std::vector<NodeCall*> calls;
        for (const std::unique_ptr<NodeCall>& call : state->calls) {
            if (!call->IsDone()) {
                calls.push_back(call.get());
            }
        }
        Perform(calls);
    } catch (const std::exception& problem) {
        HOST_LOG("cannot make the calls: %s", problem.what());
        state->error = static_cast<int>(RelayError::kUnavailable);
        return false;
    }
    state->error = 0;
    for (const std::unique_ptr<NodeCall>& call : state->calls) {
        if (call->Error() != RelayError::kNone) {
            state->error = static_cast<int>(call->Error());
            break;
        }
    }
    return state->error == 0;
}

std::string CredRequestMgr::GetResponse(int index) const {
    const bool known =
        state != nullptr && index >= 0 && static_cast<size_t>(index) < state->calls.size();
    try {
        return known ? state->calls[static_cast<size_t>(index)]->Answer() : std::string();
    } catch (const std::exception& problem) {
        HOST_LOG("cannot hand over an answer: %s", problem.what());
        return std::string();
    }
}

int CredRequestMgr::GetError() const {
    return state != nullptr ? state->error : static_cast<int>(RelayError::kUnavailable);
}

}  // namespace TALO
