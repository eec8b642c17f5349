#ifndef TALO_HOSTS_LINUX_RELAY_NODEFILE_H
#define TALO_HOSTS_LINUX_RELAY_NODEFILE_H

#include <cstddef>
#include <string>
#include <vector>

#include "hosts/linux/sdk/Nodes.h"

// The file of appliances. A missing one has none. One that somebody else than its
// owner could have read or written is not believed at all.
namespace host {

constexpr size_t kMaxNodesBytes = 4u << 20;

// What NodeText.h offers, for a file. False also when it cannot be used.
bool FindNodeInFile(const std::string& path, long long id, talo::Node* node);
bool ListNodeFile(const std::string& path, std::vector<talo::Node>* nodes);

// Changes, one after the other whoever makes them. False with `problem` in words.
bool SetNodeInFile(const std::string& path, const talo::Node& node, std::string* problem);
bool RemoveNodeFromFile(const std::string& path, long long id, std::string* problem);

}  // namespace host

#endif
