#ifndef TALO_HOSTS_LINUX_RELAY_NODECALL_H
#define TALO_HOSTS_LINUX_RELAY_NODECALL_H

#include <cstdio>
#include <string>
#include <vector>

#include "hosts/linux/cgi/Caller.h"
#include "hosts/linux/relay/RelayModule.h"
#include "hosts/linux/sdk/Nodes.h"
#include "platform/CredRequest.h"

namespace host {

// What is asked of another appliance: a form, or a body that is streamed.
struct NodeRequest {
    long long target = 0;
    std::string call;         // CallText
    std::string form;         // FormText, for a plain call
    std::string contentType;  // of a streamed body
    long long bodySize = 0;   // of a streamed body
    FILE* in = nullptr;       // the streamed body; null for a plain call
    FILE* out = nullptr;      // where the answer goes; null to keep it
};

// One such request on its way. The session at the other appliance is the one that
// is kept or a new one. A plain call that the other appliance did not take under a
// kept session is made once more under a new one; a body cannot be sent twice, so
// its session is opened right before it.
class NodeCall : public TALO::CredRequest {
  public:
    explicit NodeCall(NodeRequest request);
    ~NodeCall() override;
    void SetResponseTimeout(long seconds) override;

    // Makes it ready for the module. False, and the error is set, when it cannot be.
    bool Prepare(const Caller& caller, int hops, long long mostBytes);

    // Makes it ready to open a session only, whose id is dropped.
    bool PrepareOpening(const talo::Node& node, const Caller& caller);

    // For the module.
    TaloRelayCall* Link() {
        return &link_;
    }

    // Ends it; logged.
    void Fail(talo::RelayError error, const char* why = "");

    bool IsDone() const {
        return done_;
    }
    talo::RelayError Error() const {
        return error_;
    }
    const std::string& Answer() const {
        return answer_;
    }

  private:
    static int OnTake(TaloRelayCall* link, const char* bytes, size_t size);
    static int OnOver(TaloRelayCall* link);

    bool Take(const char* bytes, size_t size);
    bool GoOn();
    bool GoOnAfterOpening();
    void SetUpOpening();
    void SetUpCall(const std::string& session);
    void SetUpHeaders(const std::string& session);
    void Succeed();

    NodeRequest request_;
    talo::Node node_;
    Caller caller_;
    int hops_ = 1;
    long long mostBytes_ = 0;

    TaloRelayCall link_;
    std::string url_;
    std::string body_;  // of an opening
    std::vector<std::string> headers_;
    std::vector<const char*> headerLines_;

    bool opening_ = false;
    bool opened_ = false;  // a session, for this call
    bool onlyOpens_ = false;
    bool done_ = false;
    talo::RelayError error_ = talo::RelayError::kNone;
    std::string answer_;
};

}  // namespace host

#endif
