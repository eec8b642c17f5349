#include "hosts/linux/relay/NodeFile.h"

#include "hosts/linux/relay/NodeText.h"
#include "hosts/linux/util/LineFile.h"
#include "hosts/linux/util/TrustedFile.h"

namespace host {

namespace {

bool Edit(const std::string& path, const ContentChange& change, std::string* problem) {
    return ChangeLineFile({path.c_str(), "file of appliances", kMaxNodesBytes, ReadSecretFile},
                          change, problem);
}

}  // namespace

bool FindNodeInFile(const std::string& path, long long id, talo::Node* node) {
    std::string content;
    return ReadSecretFile(path, kMaxNodesBytes, &content) && FindNodeInText(content, id, node);
}

bool ListNodeFile(const std::string& path, std::vector<talo::Node>* nodes) {
    std::string content;
    if (!ReadSecretFile(path, kMaxNodesBytes, &content)) {
        return false;
    }
    *nodes = ListNodeText(content);
    return true;
}

bool SetNodeInFile(const std::string& path, const talo::Node& node, std::string* problem) {
    return Edit(
        path,
        [&](std::string* content, std::string* why) { return SetNodeInText(node, content, why); },
        problem);
}

bool RemoveNodeFromFile(const std::string& path, long long id, std::string* problem) {
    return Edit(
        path,
        [&](std::string* content, std::string* why) {
            return RemoveNodeFromText(id, content, why);
        },
        problem);
}

}  // namespace host
