#include "NodeListing.h"

#include "Format.h"

namespace {

// A system's authorities, one's own, and a key on top of either.
std::string CheckedBy(const talo::Node& node) {
    if (node.url.empty()) {
        return "-";
    }
    const std::string authority = node.authority.empty() ? "system" : node.authority;
    return node.pin.empty() ? authority : authority + " " + node.pin;
}

std::string MayActFor(const talo::Node& node) {
    return node.secretHash.empty() ? "-" : OrDash(Joined(node.classes));
}

}  // namespace

std::string NodeTable(const std::vector<talo::Node>& nodes) {
    std::vector<TextRow> rows = {{"ID", "ACTS HERE FOR", "NUMBER THERE", "URL", "CHECKED BY"}};
    for (const talo::Node& node : nodes) {
        rows.push_back({std::to_string(node.id), MayActFor(node),
                        node.self == 0 ? "-" : std::to_string(node.self), OrDash(node.url),
                        CheckedBy(node)});
    }
    return TextTable(rows);
}

std::string NodeJson(const std::vector<talo::Node>& nodes) {
    Json::Value list(Json::arrayValue);
    for (const talo::Node& node : nodes) {
        Json::Value entry(Json::objectValue);
        entry["id"] = Json::Int64(node.id);
        entry["url"] = node.url;
        entry["authority"] = node.authority;
        entry["pin"] = node.pin;
        entry["self"] = Json::Int64(node.self);
        entry["accepted"] = !node.secretHash.empty();
        entry["classes"] = JsonTexts(node.classes);
        list.append(entry);
    }
    return JsonLines(list);
}
