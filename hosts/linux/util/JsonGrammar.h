#ifndef TALO_HOSTS_LINUX_UTIL_JSONGRAMMAR_H
#define TALO_HOSTS_LINUX_UTIL_JSONGRAMMAR_H

#include <json/json.h>

#include <cstddef>

namespace host {

// Why a text is no JSON, and where.
struct JsonError {
    size_t offset = 0;
    const char* reason = "";
};

// A value costs some hundred bytes of memory and two of text. A text with more
// of them is refused, so that a body of 16 MiB cannot ask for a gigabyte.
constexpr size_t kMaxJsonValues = 500000;

// Whether the text is exactly one JSON value, white space around it allowed:
// the strict grammar, no comments, no NUL, at most `maxDepth` arrays and objects
// within each other. Needs no memory and no recursion, whatever the text.
// Several texts may share a `budget` of values instead of the limit above: what
// an accepted one takes goes off it.
bool AcceptJson(const char* begin, const char* end, size_t maxDepth, JsonError* error,
                size_t* budget = nullptr);

// Parses what AcceptJson accepts. The library's own reader is laxer and
// recurses, so the grammar is checked first. `out` stays untouched on failure.
bool ParseJson(const char* begin, const char* end, size_t maxDepth, Json::Value* out,
               JsonError* error, size_t* budget = nullptr);

}  // namespace host

#endif
