#ifndef TALO_HOSTS_LINUX_DOWNLOAD_CONDITIONS_H
#define TALO_HOSTS_LINUX_DOWNLOAD_CONDITIONS_H

#include <time.h>

#include <optional>
#include <string>

namespace host {

// What tells one state of a content from another.
struct Validators {
    std::string entityTag;  // strong, with its quotes
    time_t modified = 0;
};

// What a client says it has, as its headers came; none for a header that did not.
struct ConditionHeaders {
    std::optional<std::string> ifMatch;
    std::optional<std::string> ifUnmodifiedSince;
    std::optional<std::string> ifNoneMatch;
    std::optional<std::string> ifModifiedSince;
    std::optional<std::string> ifRange;
};

enum class Condition {
    Met,
    NotModified,  // 304: the client has it already
    Failed,       // 412: the client expects another state
};

// Weighs the headers in the order that HTTP gives them: a tag beats a date. A
// date that is none is as good as no header; so is one compared with a content
// that changed before the year 0 or after 9999.
Condition CheckConditions(const ConditionHeaders& headers, const Validators& content, time_t now);

// Whether a Range header counts: without If-Range, or when that names exactly
// this state. A date names it only when the content has not changed for a second,
// since two states may share that second.
bool RangeCounts(const ConditionHeaders& headers, const Validators& content, time_t now);

}  // namespace host

#endif
