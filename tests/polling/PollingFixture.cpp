#include "tests/polling/PollingFixture.h"

#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace polling {

namespace {

const char kCall[] = R"({"getParam": {"api": "Acme.Index", "version": 2, "method": "start",
                                      "folder": "/music", "depth": 3}})";

void CallWork(TALO::APIRequest* request, TALO::APIResponse* response, void* work) {
    (*static_cast<std::function<void(TALO::APIRequest*, TALO::APIResponse*)>*>(work))(request,
                                                                                      response);
}

}  // namespace

TALO::APIPollingPrivate* PrivateOf(const TALO::APIPolling& polling) {
    TALO::APIPollingPrivate* d = nullptr;
    std::memcpy(&d, &polling, sizeof d);
    return d;
}

Fixture::Fixture() : request(Parse(kCall)), response(&request), polling(&request) {
    fake::Reset();
    LogIn("ann", false);
}

Fixture::~Fixture() {
    (void)AwaitChildren();
    fake::Reset();
}

void Fixture::LogIn(const std::string& user, bool isAdmin) {
    Json::Value session(Json::objectValue);
    session["username"] = user;
    session["isAdmin"] = isAdmin;
    request.InitSession(session);
}

bool Fixture::Start(const Work& work) {
    Work kept = work;
    return polling.Start(&response, CallWork, &kept);
}

std::string Fixture::RunTask() {
    const bool started = Start([](TALO::APIRequest*, TALO::APIResponse* taskResponse) {
        taskResponse->SetSuccess(Parse(R"({"n": 1})"));
    });
    (void)AwaitChildren();
    return started ? StartedId() : "";
}

std::vector<int> Fixture::AwaitChildren() {
    std::vector<int> statuses;
    int status = 0;
    for (pid_t child = 0; (child = wait(&status)) > 0 || errno == EINTR;) {
        if (child > 0) {
            statuses.push_back(status);
        }
    }
    return statuses;
}

Json::Value Fixture::Record(const std::string& fullTaskId) {
    const size_t slash = fullTaskId.find('/');
    return fake::TaskRecord(fullTaskId.substr(0, slash), fullTaskId.substr(slash + 1));
}

Json::Value Fixture::Reported(const std::string& fullTaskId) {
    return Record(fullTaskId)["properties"]["body"]["data"];
}

std::string Fixture::StartedId() const {
    return response.GetBody()["data"]["task_id"].asString();
}

std::vector<std::string> Fixture::Messages() const {
    std::vector<std::string> messages;
    for (const support::LogLine& line : log.Lines()) {
        messages.push_back(line.text.substr(line.text.find(' ') + 1));
    }
    return messages;
}

std::vector<std::string> Fixture::Operations(bool ofChildren) {
    std::vector<std::string> operations;
    for (const fake::TaskCall& call : fake::TaskCalls()) {
        if ((call.pid != getpid()) == ofChildren) {
            operations.push_back(call.operation);
        }
    }
    return operations;
}

std::string Fixture::LastDetail(const std::string& operation) {
    std::string detail = "never called";
    for (const fake::TaskCall& call : fake::TaskCalls()) {
        if (call.operation == operation) {
            detail = call.detail;
        }
    }
    return detail;
}

}  // namespace polling
