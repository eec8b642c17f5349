#ifndef TALO_HOSTS_LINUX_RELAY_NODETEXT_H
#define TALO_HOSTS_LINUX_RELAY_NODETEXT_H

#include <cstddef>
#include <string>
#include <vector>

#include "hosts/linux/sdk/Nodes.h"

// The content of the file of appliances: one strict JSON object a line. Comments
// ("#") and blank lines are skipped; a line that is not understood is logged and
// skipped. All of them stay byte for byte when something else changes.
namespace host {

constexpr size_t kMaxNodeLineBytes = size_t{16} * 1024;

// Of more lines than this, comments and blank ones left out, the rest is skipped.
constexpr size_t kMaxNodes = 1000;

// Of several lines with one id the first counts.
bool FindNodeInText(const std::string& content, long long id, talo::Node* node);

// In the order of the ids.
std::vector<talo::Node> ListNodeText(const std::string& content);

// What is understood of an appliance's line is replaced, other members stay;
// removing takes all lines of the id away. False with `problem` in words.
bool SetNodeInText(const talo::Node& node, std::string* content, std::string* problem);
bool RemoveNodeFromText(long long id, std::string* content, std::string* problem);

}  // namespace host

#endif
