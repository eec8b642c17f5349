#ifndef APIS_FILE_ENTRY_H
#define APIS_FILE_ENTRY_H

#include <json/json.h>

#include <string>

#include "hosts/linux/sdk/Places.h"

struct Target;

// An entry as a client sees it: "name", "type", "size" and "mtime", and "link"
// for one that is a link.
Json::Value EntryOf(const std::string& name, const talo::FileFacts& facts);

// The entry at a target, with "path" and "writable" besides.
Json::Value EntryAt(const Target& target, const talo::FileFacts& facts);

#endif
