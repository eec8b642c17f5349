#include "hosts/linux/download/Conditions.h"

#include "hosts/linux/download/HttpDate.h"

namespace host {

namespace {

struct EntityTag {
    bool weak = false;
    std::string opaque;  // with its quotes
};

void SkipBlanks(const std::string& text, size_t* at) {
    while (*at < text.size() && (text[*at] == ' ' || text[*at] == '\t')) {
        ++*at;
    }
}

// A tag may hold anything but quotes, blanks and control characters; commas, too.
bool ReadTag(const std::string& text, size_t* at, EntityTag* tag) {
    size_t start = *at;
    const bool weak = text.compare(start, 2, "W/") == 0;
    start += weak ? 2 : 0;
    if (start >= text.size() || text[start] != '"') {
        return false;
    }
    for (size_t end = start + 1; end < text.size(); ++end) {
        const unsigned char byte = static_cast<unsigned char>(text[end]);
        if (byte == '"') {
            *tag = {weak, text.substr(start, end + 1 - start)};
            *at = end + 1;
            return true;
        }
        if (byte <= ' ' || byte == 0x7F) {
            return false;
        }
    }
    return false;
}

// Whether a list of tags has that one. In a list that is wrong somewhere, what
// stands before that place counts. Weak tags count only where the comparison may
// be weak: our own is strong.
bool HasTag(const std::string& list, const std::string& own, bool weakCounts) {
    for (size_t at = 0; at < list.size();) {
        SkipBlanks(list, &at);
        if (at < list.size() && list[at] == ',') {
            ++at;
            continue;
        }
        EntityTag tag;
        if (!ReadTag(list, &at, &tag)) {
            return false;
        }
        SkipBlanks(list, &at);
        if (at < list.size() && list[at] != ',') {
            return false;
        }
        if (tag.opaque == own && (weakCounts || !tag.weak)) {
            return true;
        }
    }
    return false;
}

std::string Trimmed(const std::string& text) {
    size_t start = 0;
    SkipBlanks(text, &start);
    size_t end = text.size();
    while (end > start && (text[end - 1] == ' ' || text[end - 1] == '\t')) {
        --end;
    }
    return text.substr(start, end - start);
}

bool Matches(const std::string& header, const std::string& own, bool weakCounts) {
    return Trimmed(header) == "*" || HasTag(header, own, weakCounts);
}

// A time that no header can carry was never told to a client.
bool ReadDate(const std::optional<std::string>& header, const Validators& content, time_t now,
              time_t* when) {
    return header && !HttpDate(content.modified).empty() &&
           ParseHttpDate(Trimmed(*header), now, when);
}

}  // namespace

Condition CheckConditions(const ConditionHeaders& headers, const Validators& content, time_t now) {
    time_t when = 0;
    if (headers.ifMatch) {
        if (!Matches(*headers.ifMatch, content.entityTag, false)) {
            return Condition::Failed;
        }
    } else if (ReadDate(headers.ifUnmodifiedSince, content, now, &when) &&
               content.modified > when) {
        return Condition::Failed;
    }
    if (headers.ifNoneMatch) {
        return Matches(*headers.ifNoneMatch, content.entityTag, true) ? Condition::NotModified
                                                                      : Condition::Met;
    }
    return ReadDate(headers.ifModifiedSince, content, now, &when) && content.modified <= when
               ? Condition::NotModified
               : Condition::Met;
}

bool RangeCounts(const ConditionHeaders& headers, const Validators& content, time_t now) {
    if (!headers.ifRange) {
        return true;
    }
    const std::string header = Trimmed(*headers.ifRange);
    EntityTag tag;
    size_t at = 0;
    if (ReadTag(header, &at, &tag)) {
        return at == header.size() && !tag.weak && tag.opaque == content.entityTag;
    }
    time_t when = 0;
    return ReadDate(headers.ifRange, content, now, &when) && when == content.modified && when < now;
}

}  // namespace host
