#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "hosts/linux/relay/NodeLine.h"
#include "hosts/linux/relay/NodeText.h"
#include "hosts/linux/relay/NodeUrl.h"

// The content of the file of appliances: read, looked up, changed.

namespace {

void Require(bool condition) {
    if (!condition) {
        abort();
    }
}

bool IsSame(const talo::Node& left, const talo::Node& right) {
    return left.id == right.id && left.url == right.url && left.authority == right.authority &&
           left.pin == right.pin && left.self == right.self && left.secret == right.secret &&
           left.secretHash == right.secretHash && left.classes == right.classes;
}

void RequireWhole(const talo::Node& node) {
    const bool called = !node.url.empty();
    Require(node.id > 0 && node.self >= 0);
    Require(called == (node.self != 0) && called == !node.secret.empty());
    Require(called ? host::IsNodeUrl(node.url) : node.authority.empty() && node.pin.empty());
    Require(called || !node.secretHash.empty());
    Require(node.secretHash.empty() ? node.classes.empty() : node.secretHash.size() == 64);
    for (const std::string& granted : node.classes) {
        Require(host::IsUserClass(granted));
    }
}

// Setting what is there already, under whatever comes around it, changes nothing
// that is understood.
void RequireStaysWhenSet(const std::string& content, const std::vector<talo::Node>& nodes) {
    std::string changed = content;
    std::string problem;
    if (!host::SetNodeInText(nodes.front(), &changed, &problem)) {
        Require(changed == content && !problem.empty());
        return;
    }
    const std::vector<talo::Node> again = host::ListNodeText(changed);
    Require(again.size() == nodes.size());
    for (size_t index = 0; index < nodes.size(); ++index) {
        Require(IsSame(nodes[index], again[index]));
    }
}

void RequireGoesWhenRemoved(const std::string& content, const std::vector<talo::Node>& nodes) {
    std::string changed = content;
    std::string problem;
    talo::Node found;
    Require(host::RemoveNodeFromText(nodes.front().id, &changed, &problem));
    Require(changed.size() < content.size());
    // Behind the last line that is looked at another one of that id may have waited.
    Require(!host::FindNodeInText(changed, nodes.front().id, &found) ||
            nodes.size() >= host::kMaxNodes / 2);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string content(reinterpret_cast<const char*>(data), size);
    const std::vector<talo::Node> nodes = host::ListNodeText(content);
    Require(nodes.size() <= host::kMaxNodes);
    long long last = 0;
    for (const talo::Node& node : nodes) {
        talo::Node found;
        RequireWhole(node);
        Require(node.id > last);
        last = node.id;
        Require(host::FindNodeInText(content, node.id, &found) && IsSame(node, found));
    }
    if (!nodes.empty()) {
        RequireStaysWhenSet(content, nodes);
        RequireGoesWhenRemoved(content, nodes);
    }
    return 0;
}
