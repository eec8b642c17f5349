#include <exception>

#include "hosts/linux/relay/NodeCall.h"
#include "hosts/linux/relay/Performed.h"
#include "hosts/linux/sdk/Nodes.h"
#include "hosts/linux/util/HostLog.h"

namespace talo {

namespace {

constexpr char kSource[] = "Test.cpp";
constexpr long kSeconds = 30;

RelayError Test(long long id, const std::string& user) {
    Node node;
    if (!FindNode(id, &node)) {
        std::vector<Node> all;
        return ListNodes(&all) ? RelayError::kUnknownNode : RelayError::kUnavailable;
    }
    host::NodeRequest request;
    request.target = id;
    host::NodeCall call(request);
    call.SetResponseTimeout(kSeconds);
    if (call.PrepareOpening(node, {user, ""})) {
        host::PerformNodeCalls({&call});
    }
    return call.Error();
}

}  // namespace

RelayError TestNode(long long id, const std::string& user) {
    try {
        return Test(id, user);
    } catch (const std::exception& problem) {
        HOST_LOG("cannot test an appliance: %s", problem.what());
        return RelayError::kUnavailable;
    }
}

}  // namespace talo
