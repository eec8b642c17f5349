#include "tests/fake/FakeRelay.h"

#include <stdexcept>

#include "platform/CredRequest.h"
#include "tests/fake/FakePlatform.h"

namespace fake {

namespace {

// Whether this operation is to fail.
bool Fails(const std::string& operation) {
    if (Relay().throws == operation) {
        throw std::runtime_error(operation);
    }
    return Now().Called(operation);
}

int Queue(const std::string& operation, const RelayCall& call) {
    if (Fails(operation)) {
        return -1;
    }
    Relay().calls.push_back(call);
    return Relay().index;
}

std::string ReadAll(FILE* in) {
    std::string content;
    for (int byte = fgetc(in); byte != EOF; byte = fgetc(in)) {
        content += static_cast<char>(byte);
    }
    return content;
}

// The call that was queued last.
class Request final : public TALO::CredRequest {
  public:
    void SetResponseTimeout(long seconds) override {
        (void)Fails("CredRequest.SetResponseTimeout");
        Relay().calls.back().timeouts.push_back(seconds);
    }
};

}  // namespace

RelayScript& Relay() {
    static RelayScript script;
    return script;
}

void ResetRelay() {
    Relay() = RelayScript();
}

}  // namespace fake

namespace TALO {

CredRequest::~CredRequest() = default;

struct CredRequestMgr::State {
    fake::Request request;
};

CredRequestMgr::CredRequestMgr() : state(std::make_unique<State>()) {
    (void)fake::Fails("CredRequestMgr.CredRequestMgr");
    ++fake::Relay().openManagers;
}

CredRequestMgr::~CredRequestMgr() {
    --fake::Relay().openManagers;
}

int CredRequestMgr::AddWebAPIRequest(long long target, const std::string& api, int version,
                                     const std::string& method, const Json::Value& params) {
    fake::RelayCall call;
    call.target = target;
    call.api = api;
    call.version = version;
    call.method = method;
    call.params = params;
    return fake::Queue("CredRequestMgr.AddWebAPIRequest", call);
}

int CredRequestMgr::AddRelayRequest(long long target, const std::string& api, int version,
                                    const std::string& method, const Json::Value& headers, FILE* in,
                                    FILE* out) {
    fake::RelayCall call;
    call.streamed = true;
    call.target = target;
    call.api = api;
    call.version = version;
    call.method = method;
    call.headers = headers;
    call.in = in;
    call.out = out;
    return fake::Queue("CredRequestMgr.AddRelayRequest", call);
}

CredRequest* CredRequestMgr::GetRequest(int index) {
    const bool found = !fake::Fails("CredRequestMgr.GetRequest") && fake::Relay().hasRequest &&
                       !fake::Relay().calls.empty() && index == fake::Relay().index;
    return found ? &state->request : nullptr;
}

bool CredRequestMgr::Run() {
    if (fake::Fails("CredRequestMgr.Run")) {
        return false;
    }
    for (fake::RelayCall& call : fake::Relay().calls) {
        if (fake::Relay().readsBody && call.in != nullptr) {
            call.sent = fake::ReadAll(call.in);
        }
    }
    return fake::Relay().succeeds;
}

std::string CredRequestMgr::GetResponse(int index) const {
    const bool found = !fake::Fails("CredRequestMgr.GetResponse") && index == fake::Relay().index;
    return found ? fake::Relay().response : "";
}

int CredRequestMgr::GetError() const {
    return fake::Fails("CredRequestMgr.GetError") ? 0 : fake::Relay().error;
}

}  // namespace TALO
