#include "hosts/linux/relay/NodeCall.h"

#include <string.h>

#include <algorithm>
#include <exception>
#include <iterator>
#include <utility>

#include "hosts/linux/relay/FormText.h"
#include "hosts/linux/relay/Hops.h"
#include "hosts/linux/relay/NodeSessions.h"
#include "hosts/linux/relay/Opening.h"
#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {

constexpr char kSource[] = "NodeCall.cpp";

using talo::RelayError;

// By which an appliance says that it did not take a call under the session.
bool IsSessionRefused(const char* requestError) {
    static const char* const kWords[] = {"noprivilege", "timeout", "unauth"};
    return std::any_of(std::begin(kWords), std::end(kWords),
                       [&](const char* word) { return strcmp(word, requestError) == 0; });
}

// FindNode does not tell a file that cannot be used from an appliance that is not
// in it.
RelayError WhyNotFound() {
    std::vector<talo::Node> all;
    return talo::ListNodes(&all) ? RelayError::kUnknownNode : RelayError::kUnavailable;
}

}  // namespace

NodeCall::NodeCall(NodeRequest request) : request_(std::move(request)), link_() {
    link_.owner = this;
    link_.take = OnTake;
    link_.over = OnOver;
}

NodeCall::~NodeCall() = default;

void NodeCall::SetResponseTimeout(long seconds) {
    link_.seconds = std::max(seconds, 0L);
}

bool NodeCall::Prepare(const Caller& caller, int hops, long long mostBytes) {
    caller_ = caller;
    hops_ = hops;
    mostBytes_ = mostBytes;
    if (!talo::FindNode(request_.target, &node_)) {
        Fail(WhyNotFound());
        return false;
    }
    if (node_.url.empty()) {
        Fail(RelayError::kUnknownNode);
        return false;
    }
    const std::string kept = request_.in == nullptr ? KeptNodeSession(node_, caller_) : "";
    if (kept.empty()) {
        SetUpOpening();
    } else {
        SetUpCall(kept);
    }
    return true;
}

bool NodeCall::PrepareOpening(const talo::Node& node, const Caller& caller) {
    node_ = node;
    caller_ = caller;
    onlyOpens_ = true;
    if (node_.url.empty()) {
        Fail(RelayError::kUnknownNode);
        return false;
    }
    SetUpOpening();
    return true;
}

void NodeCall::Fail(RelayError error, const char* why) {
    done_ = true;
    error_ = error;
    answer_.clear();
    HOST_LOG("call of appliance %lld: %s%s%s", request_.target, talo::RelayErrorText(error),
             *why != '\0' ? ": " : "", why);
}

void NodeCall::Succeed() {
    done_ = true;
    error_ = RelayError::kNone;
}

int NodeCall::OnTake(TaloRelayCall* link, const char* bytes, size_t size) {
    try {
        return static_cast<NodeCall*>(link->owner)->Take(bytes, size) ? 1 : 0;
    } catch (const std::exception&) {
        return 0;
    }
}

int NodeCall::OnOver(TaloRelayCall* link) {
    NodeCall* call = static_cast<NodeCall*>(link->owner);
    try {
        return call->GoOn() ? 1 : 0;
    } catch (const std::exception& problem) {
        call->Fail(RelayError::kUnavailable, problem.what());
        return 0;
    }
}

bool NodeCall::Take(const char* bytes, size_t size) {
    if (!opening_ && request_.out != nullptr) {
        return fwrite(bytes, 1, size, request_.out) == size;
    }
    answer_.append(bytes, size);
    return true;
}

// What follows on an answer, or on none. True when there is more to send.
bool NodeCall::GoOn() {
    const RelayError error = static_cast<RelayError>(link_.error);
    if (opening_) {
        if (error == RelayError::kNone) {
            return GoOnAfterOpening();
        }
        Fail(error, link_.problem);
        return false;
    }
    if (!opened_ && IsSessionRefused(link_.requestError)) {
        ForgetNodeSession(node_, caller_);
        SetUpOpening();
        return true;
    }
    if (error == RelayError::kStatus) {
        Fail(error, std::to_string(link_.status).c_str());
        return false;
    }
    if (error != RelayError::kNone) {
        Fail(error, link_.problem);
        return false;
    }
    if (request_.out != nullptr && fflush(request_.out) != 0) {
        Fail(RelayError::kUnavailable, "the answer cannot be written");
        return false;
    }
    Succeed();
    return false;
}

bool NodeCall::GoOnAfterOpening() {
    const std::string session = SessionOfAnswer(answer_);
    if (session.empty()) {
        Fail(RelayError::kRefused);
        return false;
    }
    if (onlyOpens_) {
        Succeed();
        return false;
    }
    opened_ = true;
    KeepNodeSession(node_, caller_, session);
    SetUpCall(session);
    return true;
}

void NodeCall::SetUpOpening() {
    opening_ = true;
    answer_.clear();
    url_ = WithoutQuery(node_.url);
    body_ = OpeningText(node_, caller_);
    link_.form = body_.c_str();
    link_.bodySize = static_cast<long long>(body_.size());
    link_.most = static_cast<long long>(kMostOpeningBytes);
    SetUpHeaders("");
}

void NodeCall::SetUpCall(const std::string& session) {
    opening_ = false;
    answer_.clear();
    url_ = request_.in != nullptr ? WithQuery(node_.url, request_.call) : node_.url;
    link_.form = request_.in != nullptr ? nullptr : request_.form.c_str();
    link_.in = request_.in;
    link_.bodySize =
        request_.in != nullptr ? request_.bodySize : static_cast<long long>(request_.form.size());
    link_.most = mostBytes_;
    SetUpHeaders(session);
}

void NodeCall::SetUpHeaders(const std::string& session) {
    headers_ = {std::string(kHopsHeader) + ": " + std::to_string(hops_)};
    if (!opening_ && request_.in != nullptr) {
        // With nothing behind the name the line is left out.
        headers_.push_back("Content-Type:" +
                           (request_.contentType.empty() ? "" : " " + request_.contentType));
    }
    if (!session.empty()) {
        headers_.push_back("Cookie: id=" + session);
    }
    headerLines_.clear();
    for (const std::string& line : headers_) {
        headerLines_.push_back(line.c_str());
    }
    headerLines_.push_back(nullptr);
    link_.headers = headerLines_.data();
    link_.url = url_.c_str();
    link_.authority = node_.authority.c_str();
    link_.pin = node_.pin.c_str();
}

}  // namespace host
