#include "Entry.h"

#include "Target.h"

namespace {

const char* NameOf(talo::FileType type) {
    switch (type) {
        case talo::FileType::kFile:
            return "file";
        case talo::FileType::kFolder:
            return "folder";
        case talo::FileType::kLink:
            return "link";
        default:
            return "other";
    }
}

}  // namespace

Json::Value EntryOf(const std::string& name, const talo::FileFacts& facts) {
    Json::Value entry(Json::objectValue);
    entry["name"] = name;
    entry["type"] = NameOf(facts.type);
    entry["size"] = static_cast<Json::UInt64>(facts.size);
    entry["mtime"] = static_cast<Json::Int64>(facts.mtime);
    if (facts.isLink) {
        entry["link"] = true;
    }
    return entry;
}

Json::Value EntryAt(const Target& target, const talo::FileFacts& facts) {
    Json::Value entry = EntryOf(target.Name(), facts);
    if (target.parsed.parts.empty()) {
        entry["type"] = "share";
    }
    entry["path"] = target.path;
    entry["writable"] = target.writable;
    return entry;
}
