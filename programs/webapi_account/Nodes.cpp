#include "Nodes.h"

#include <pwd.h>
#include <unistd.h>

#include <iostream>

#include "NodeListing.h"
#include "PasswordInput.h"
#include "hosts/linux/sdk/Nodes.h"

namespace {

// What an appliance may do that was granted nothing in particular.
constexpr char kDefaultClass[] = "normal.local";

bool Fail(std::string* problem, const std::string& text) {
    *problem = text;
    return false;
}

bool SetReached(const Arguments& arguments, talo::Node* node, std::string* problem) {
    node->url = arguments.url;
    node->authority = arguments.authority;
    node->pin = arguments.pin;
    node->self = arguments.self;
    return ReadSecret(&node->secret, problem);
}

bool SetAccepted(const Arguments& arguments, talo::Node* node, std::string* secret,
                 std::string* problem) {
    node->classes =
        arguments.classes.empty() ? std::vector<std::string>{kDefaultClass} : arguments.classes;
    return talo::NewNodeSecret(secret, &node->secretHash) ||
           Fail(problem, "no secret can be made; the system log says why");
}

// Printed last: a secret that does not count is not shown.
bool Add(const Arguments& arguments, std::string* problem) {
    talo::Node node;
    std::string secret;
    (void)talo::FindNode(arguments.node, &node);
    node.id = arguments.node;
    if ((!arguments.url.empty() && !SetReached(arguments, &node, problem)) ||
        (arguments.accept && !SetAccepted(arguments, &node, &secret, problem)) ||
        !talo::SetNode(node, problem)) {
        return false;
    }
    if (arguments.accept) {
        std::cout << secret << std::endl;
    }
    return true;
}

bool List(const Arguments& arguments, std::string* problem) {
    std::vector<talo::Node> nodes;
    if (!talo::ListNodes(&nodes)) {
        return Fail(problem, "the appliances cannot be read; the system log says why");
    }
    std::cout << (arguments.json ? NodeJson(nodes) : NodeTable(nodes));
    return true;
}

std::string OwnName() {
    const struct passwd* entry = getpwuid(geteuid());
    return entry != nullptr ? entry->pw_name : "root";
}

bool Test(const Arguments& arguments, std::string* problem) {
    const std::string user = arguments.user.empty() ? OwnName() : arguments.user;
    const talo::RelayError error = talo::TestNode(arguments.node, user);
    if (error != talo::RelayError::kNone) {
        return Fail(problem, std::string(talo::RelayErrorText(error)) + " (error " +
                                 std::to_string(static_cast<int>(error)) + ")");
    }
    std::cout << "appliance " << arguments.node << " lets this one act for \"" << user << "\"\n";
    return true;
}

}  // namespace

bool RunNodeCommand(const Arguments& arguments, std::string* problem) {
    if (arguments.command == "node add") {
        return Add(arguments, problem);
    }
    if (arguments.command == "node remove") {
        return talo::RemoveNode(arguments.node, problem);
    }
    if (arguments.command == "node test") {
        return Test(arguments, problem);
    }
    return List(arguments, problem);
}
