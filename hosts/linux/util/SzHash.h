#ifndef TALO_HOSTS_LINUX_UTIL_SZHASH_H
#define TALO_HOSTS_LINUX_UTIL_SZHASH_H

#include <json/json.h>

#include <cstddef>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "platform/System.h"

// Texts by name, walked in the order in which the names first came. The index is
// a tree: no choice of names makes it slow.
struct TALOSZHASH {
    std::vector<std::pair<std::string, std::string>> entries;
    std::map<std::string, size_t> index;  // name to place in `entries`
};

namespace host {

// What a client sends grows a hash: this many entries and no more.
constexpr size_t kMaxHashEntries = 10000;

// Null when memory runs out. A capacity is only a hint, and bounded.
TALOSZHASH* NewHash(int capacity);

// Sets or replaces. False, and nothing is set, for a null hash, a full one, or a
// text with NUL, which would come out cut. May throw std::bad_alloc.
bool HashSet(TALOSZHASH* hash, const std::string& key, const std::string& value);

// Null when there is no such entry.
const std::string* HashGet(const TALOSZHASH* hash, const std::string& key);

void HashClear(TALOSZHASH* hash);

// As TLIBCSzHashNext and SzHashToJsonObj describe it.
int HashNext(const TALOSZHASH* hash, size_t* position, const char** key, const char** value);
bool HashToJson(const TALOSZHASH* hash, Json::Value& out);

}  // namespace host

#endif
