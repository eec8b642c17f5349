#include "hosts/linux/relay/Performed.h"

#include "hosts/linux/util/Module.h"

namespace host {

namespace {

// A module that was missing may be there at the next call.
const TaloRelayModule* Module() {
    static thread_local const TaloRelayModule* module = nullptr;
    if (module == nullptr) {
        module = static_cast<const TaloRelayModule*>(
            OpenModule(kRelayModuleFile, kRelayModuleSymbol, "no appliance can be called"));
    }
    return module;
}

}  // namespace

void PerformNodeCalls(const std::vector<NodeCall*>& calls) {
    if (calls.empty()) {
        return;
    }
    const TaloRelayModule* module = Module();
    if (module != nullptr) {
        std::vector<TaloRelayCall*> links;
        links.reserve(calls.size());
        for (NodeCall* call : calls) {
            links.push_back(call->Link());
        }
        module->perform(links.data(), links.size());
    }
    for (NodeCall* call : calls) {
        if (!call->IsDone()) {
            call->Fail(talo::RelayError::kUnavailable);
        }
    }
}

}  // namespace host
