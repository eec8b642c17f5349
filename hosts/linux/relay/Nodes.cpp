#include "hosts/linux/sdk/Nodes.h"

#include <algorithm>

#include "hosts/linux/cgi/SessionStore.h"
#include "hosts/linux/file/Guard.h"
#include "hosts/linux/relay/NodeFile.h"
#include "platform/Paths.h"

namespace {

// As the framework sorts callers for the descriptions of APIs.
std::string ClassOf(const talo::Account& account) {
    const std::string rank = talo::IsAdministrator(account) ? "admin." : "normal.";
    if (account.name.find('\\') != std::string::npos) {
        return rank + "domain";
    }
    return rank + (account.name.find('@') != std::string::npos ? "ldap" : "local");
}

template <typename Body>
bool Change(std::string* problem, Body body) {
    std::string unwanted;
    return host::Guarded(false, [&] { return body(problem != nullptr ? problem : &unwanted); });
}

}  // namespace

namespace talo {

bool FindNode(long long id, Node* node) {
    return host::Guarded(false,
                         [&] { return id > 0 && host::FindNodeInFile(TALO_NODES_FILE, id, node); });
}

bool ListNodes(std::vector<Node>* nodes) {
    return host::Guarded(false, [&] { return host::ListNodeFile(TALO_NODES_FILE, nodes); });
}

// The sessions that the secret before has opened end with it: it may have been
// somebody else's, too.
bool SetNode(const Node& node, std::string* problem) {
    return Change(problem, [&](std::string* why) {
        Node before;
        (void)FindNode(node.id, &before);
        if (!host::SetNodeInFile(TALO_NODES_FILE, node, why)) {
            return false;
        }
        if (before.secretHash != node.secretHash) {
            host::EndSessionsOfNode(node.id);
        }
        return true;
    });
}

bool RemoveNode(long long id, std::string* problem) {
    return Change(problem, [&](std::string* why) {
        if (!host::RemoveNodeFromFile(TALO_NODES_FILE, id, why)) {
            return false;
        }
        host::EndSessionsOfNode(id);
        return true;
    });
}

bool MayActFor(long long id, const Account& account) {
    return host::Guarded(false, [&] {
        Node node;
        return !account.locked && FindNode(id, &node) && !node.secretHash.empty() &&
               std::find(node.classes.begin(), node.classes.end(), ClassOf(account)) !=
                   node.classes.end();
    });
}

}  // namespace talo
