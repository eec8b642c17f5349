#include "hosts/linux/relay/NodeText.h"

#include <string.h>

#include <map>

#include "hosts/linux/relay/NodeLine.h"
#include "hosts/linux/relay/NodeUrl.h"
#include "hosts/linux/util/HostLog.h"
#include "hosts/linux/util/LineFile.h"
#include "hosts/linux/util/LineObject.h"

namespace host {

namespace {

constexpr char kSource[] = "NodeText.cpp";

bool Refuse(std::string* problem, const std::string& text) {
    *problem = text;
    return false;
}

// Calls `visit` with the number and the place of each line that could be an
// appliance's, until it answers false.
template <typename Visit>
void ForEachNodeLine(const std::string& content, Visit visit) {
    size_t seen = 0;
    ForEachLine(content, [&](size_t number, size_t start, size_t end) {
        if (content[content.find_first_not_of(" \t\r", start)] == '#') {
            return true;
        }
        if (++seen > kMaxNodes) {
            HOST_LOG("the file of appliances: line %zu and what follows is skipped: more than %zu",
                     number, kMaxNodes);
            return false;
        }
        return visit(number, LinePlace{start, end});
    });
}

bool Understand(const std::string& content, size_t number, const LinePlace& place,
                talo::Node* node) {
    std::string reason = "it is too long";
    if (place.end - place.start <= kMaxNodeLineBytes &&
        ParseNodeLine(content.data() + place.start, content.data() + place.end, node, nullptr,
                      &reason)) {
        return true;
    }
    HOST_LOG("the file of appliances: line %zu is skipped: %s", number, reason.c_str());
    return false;
}

// Spares the parsing of all the others: an integer has only one spelling.
bool MayHave(const std::string& content, const LinePlace& place, const std::string& digits) {
    return memmem(content.data() + place.start, place.end - place.start, digits.data(),
                  digits.size()) != nullptr;
}

// Calls `visit` with each appliance of the id and where it is, until it answers
// false.
template <typename Visit>
void ForEachOf(const std::string& content, long long id, Visit visit) {
    const std::string digits = std::to_string(id);
    ForEachNodeLine(content, [&](size_t number, const LinePlace& place) {
        talo::Node read;
        return !MayHave(content, place, digits) || !Understand(content, number, place, &read) ||
               read.id != id || visit(&read, place);
    });
}

std::vector<LinePlace> PlacesOf(const std::string& content, long long id) {
    std::vector<LinePlace> places;
    ForEachOf(content, id, [&](const talo::Node*, const LinePlace& place) {
        places.push_back(place);
        return true;
    });
    return places;
}

bool IsFull(const std::string& content) {
    size_t lines = 0;
    ForEachNodeLine(content, [&](size_t, const LinePlace&) { return ++lines < kMaxNodes; });
    return lines >= kMaxNodes;
}

// What most often is wrong, in words for who typed it; "" for nothing of that.
std::string Complaint(const talo::Node& node) {
    if (!node.url.empty() && !IsNodeUrl(node.url)) {
        return "that is no URL of an appliance; expected https://HOST[:PORT]/PATH";
    }
    if (!node.pin.empty() && !IsNodePin(node.pin)) {
        return "that is no pin; expected sha256// and the base64 of 32 bytes";
    }
    for (const std::string& granted : node.classes) {
        if (!IsUserClass(granted)) {
            return "that is no class of users; expected admin or normal, a dot, and local, domain "
                   "or ldap";
        }
    }
    return "";
}

// The members of the appliance's line, and what it says now. What would be skipped
// afterwards must not be written.
bool Render(const talo::Node& node, const char* begin, const char* end, std::string* line,
            std::string* problem) {
    Json::Value members(Json::objectValue);
    talo::Node read;
    std::string reason = Complaint(node);
    if (!reason.empty()) {
        return Refuse(problem, reason);
    }
    if (begin != end && !ParseNodeLine(begin, end, &read, &members, &reason)) {
        return Refuse(problem, reason);
    }
    SetNodeMembers(node, &members);
    const std::string text = RenderLineObject(members);
    if (!ParseNodeLine(text.data(), text.data() + text.size(), &read, nullptr, &reason)) {
        return Refuse(problem, reason);
    }
    if (text.size() > kMaxNodeLineBytes) {
        return Refuse(problem, "the line of the appliance is too long");
    }
    *line = text;
    return true;
}

}  // namespace

bool FindNodeInText(const std::string& content, long long id, talo::Node* node) {
    bool found = false;
    ForEachOf(content, id, [&](talo::Node* read, const LinePlace&) {
        *node = std::move(*read);
        found = true;
        return false;
    });
    return found;
}

std::vector<talo::Node> ListNodeText(const std::string& content) {
    std::map<long long, talo::Node> byId;
    ForEachNodeLine(content, [&](size_t number, const LinePlace& place) {
        talo::Node read;
        if (Understand(content, number, place, &read) && !byId.emplace(read.id, read).second) {
            HOST_LOG("the file of appliances: line %zu is skipped: its id has an earlier line",
                     number);
        }
        return true;
    });
    std::vector<talo::Node> listed;
    listed.reserve(byId.size());
    for (auto& entry : byId) {
        listed.push_back(std::move(entry.second));
    }
    return listed;
}

bool SetNodeInText(const talo::Node& node, std::string* content, std::string* problem) {
    std::string line;
    const std::vector<LinePlace> places = PlacesOf(*content, node.id);
    if (places.empty()) {
        if (!Render(node, nullptr, nullptr, &line, problem)) {
            return false;
        }
        if (IsFull(*content)) {
            return Refuse(problem, "the file of appliances has " + std::to_string(kMaxNodes) +
                                       " lines already");
        }
        AppendLine(content, line);
        return true;
    }
    const LinePlace place = places.front();
    if (!Render(node, content->data() + place.start, content->data() + place.end, &line, problem)) {
        return false;
    }
    content->replace(place.start, place.end - place.start, line);
    return true;
}

bool RemoveNodeFromText(long long id, std::string* content, std::string* problem) {
    const std::vector<LinePlace> places = PlacesOf(*content, id);
    if (places.empty()) {
        return Refuse(problem, "there is no appliance " + std::to_string(id));
    }
    for (auto place = places.rbegin(); place != places.rend(); ++place) {
        EraseLine(content, *place);
    }
    return true;
}

}  // namespace host
