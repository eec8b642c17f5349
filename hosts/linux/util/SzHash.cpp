#include "hosts/linux/util/SzHash.h"

#include <algorithm>
#include <exception>
#include <memory>

namespace host {

TALOSZHASH* NewHash(int capacity) {
    try {
        auto hash = std::make_unique<TALOSZHASH>();
        hash->entries.reserve(std::min(static_cast<size_t>(std::max(capacity, 0)), size_t{1024}));
        return hash.release();
    } catch (const std::exception&) {
        return nullptr;
    }
}

bool HashSet(TALOSZHASH* hash, const std::string& key, const std::string& value) {
    if (hash == nullptr || key.find('\0') != std::string::npos ||
        value.find('\0') != std::string::npos) {
        return false;
    }
    const auto found = hash->index.find(key);
    if (found != hash->index.end()) {
        hash->entries[found->second].second = value;
        return true;
    }
    if (hash->entries.size() >= kMaxHashEntries) {
        return false;
    }
    // The index last: what it names is there.
    hash->entries.emplace_back(key, value);
    try {
        hash->index.emplace(key, hash->entries.size() - 1);
    } catch (...) {
        hash->entries.pop_back();
        throw;
    }
    return true;
}

const std::string* HashGet(const TALOSZHASH* hash, const std::string& key) {
    if (hash == nullptr) {
        return nullptr;
    }
    const auto found = hash->index.find(key);
    return found == hash->index.end() ? nullptr : &hash->entries[found->second].second;
}

void HashClear(TALOSZHASH* hash) {
    if (hash != nullptr) {
        hash->entries.clear();
        hash->index.clear();
    }
}

int HashNext(const TALOSZHASH* hash, size_t* position, const char** key, const char** value) {
    if (hash == nullptr || position == nullptr || *position >= hash->entries.size()) {
        return 0;
    }
    const auto& entry = hash->entries[*position];
    ++*position;
    if (key != nullptr) {
        *key = entry.first.c_str();
    }
    if (value != nullptr) {
        *value = entry.second.c_str();
    }
    return 1;
}

bool HashToJson(const TALOSZHASH* hash, Json::Value& out) {
    if (hash == nullptr || !(out.isObject() || out.isNull())) {
        return false;
    }
    if (out.isNull()) {
        out = Json::Value(Json::objectValue);
    }
    for (const auto& entry : hash->entries) {
        out[entry.first] = entry.second;
    }
    return true;
}

}  // namespace host
