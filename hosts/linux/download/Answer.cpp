#include "hosts/linux/download/Answer.h"

#include <errno.h>
#include <stdlib.h>
#include <sys/random.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>

#include "hosts/linux/download/HttpDate.h"

namespace host {

namespace {

constexpr char kEnd[] = "\r\n";

std::string Line(const char* name, const std::string& value) {
    return value.empty() ? std::string() : std::string(name) + ": " + value + kEnd;
}

std::optional<std::string> FromEnvironment(const char* name) {
    const char* const value = getenv(name);
    return value != nullptr ? std::optional<std::string>(value) : std::nullopt;
}

// A content from the future would be newer than the answer that carries it.
std::string ValidatorLines(const Validators& validators, time_t now) {
    return Line("Last-Modified", HttpDate(std::min(validators.modified, now))) +
           Line("ETag", validators.entityTag);
}

std::string ContentLines(const Content& content) {
    return Line("Content-Type", content.mimeType) +
           Line("Content-Disposition", content.disposition);
}

std::string LengthLine(uint64_t length) {
    return Line("Content-Length", std::to_string(length));
}

std::string RangeText(const ByteRange& range, uint64_t size) {
    return "bytes " + std::to_string(range.first) + "-" +
           std::to_string(range.first + range.length - 1) + "/" + std::to_string(size);
}

// Nobody who writes a file can know the text that will part it.
std::string RandomBoundary() {
    unsigned char bytes[16] = {};
    size_t filled = 0;
    while (filled < sizeof bytes) {
        const ssize_t got = getrandom(bytes + filled, sizeof bytes - filled, 0);
        if (got < 0 && errno != EINTR) {
            abort();  // a kernel without random numbers
        }
        filled += got > 0 ? static_cast<size_t>(got) : 0;
    }
    std::string text;
    for (const unsigned char byte : bytes) {
        char digits[3];
        (void)std::snprintf(digits, sizeof digits, "%02x", byte);
        text += digits;
    }
    return text;
}

Answer Whole(const Content& content, time_t now) {
    Answer answer;
    answer.header = ContentLines(content) + LengthLine(content.size) +
                    ValidatorLines(content.validators, now) + Line("Accept-Ranges", "bytes") + kEnd;
    if (content.size > 0) {
        answer.pieces.push_back({"", {0, content.size}});
    }
    return answer;
}

Answer OnePart(const Content& content, const ByteRange& part, time_t now) {
    Answer answer;
    answer.header = Line("Status", "206 Partial Content") + ContentLines(content) +
                    Line("Content-Range", RangeText(part, content.size)) + LengthLine(part.length) +
                    ValidatorLines(content.validators, now) + Line("Accept-Ranges", "bytes") + kEnd;
    answer.pieces.push_back({"", part});
    return answer;
}

Answer ManyParts(const Content& content, const std::vector<ByteRange>& parts, time_t now) {
    Answer answer;
    const std::string boundary = RandomBoundary();
    uint64_t length = 0;
    for (const ByteRange& part : parts) {
        const std::string before = (answer.pieces.empty() ? "--" : "\r\n--") + boundary + kEnd +
                                   Line("Content-Type", content.mimeType) +
                                   Line("Content-Range", RangeText(part, content.size)) + kEnd;
        length += before.size() + part.length;
        answer.pieces.push_back({before, part});
    }
    answer.after = "\r\n--" + boundary + "--\r\n";
    length += answer.after.size();
    answer.header = Line("Status", "206 Partial Content") +
                    Line("Content-Type", "multipart/byteranges; boundary=" + boundary) +
                    Line("Content-Disposition", content.disposition) + LengthLine(length) +
                    ValidatorLines(content.validators, now) + Line("Accept-Ranges", "bytes") + kEnd;
    return answer;
}

Answer Without(const std::string& header) {
    Answer answer;
    answer.header = header + kEnd;
    return answer;
}

}  // namespace

ContentRequest CurrentRequest() {
    ContentRequest request;
    request.method = FromEnvironment("REQUEST_METHOD").value_or("");
    request.range = FromEnvironment("HTTP_RANGE");
    request.conditions.ifMatch = FromEnvironment("HTTP_IF_MATCH");
    request.conditions.ifUnmodifiedSince = FromEnvironment("HTTP_IF_UNMODIFIED_SINCE");
    request.conditions.ifNoneMatch = FromEnvironment("HTTP_IF_NONE_MATCH");
    request.conditions.ifModifiedSince = FromEnvironment("HTTP_IF_MODIFIED_SINCE");
    request.conditions.ifRange = FromEnvironment("HTTP_IF_RANGE");
    return request;
}

Validators ValidatorsOf(const struct stat& facts, uint64_t start) {
    char tag[192];
    (void)std::snprintf(tag, sizeof tag, "\"%llx-%llx-%llx-%llx.%lx-%llx.%lx",
                        static_cast<unsigned long long>(facts.st_dev),
                        static_cast<unsigned long long>(facts.st_ino),
                        static_cast<unsigned long long>(facts.st_size),
                        static_cast<unsigned long long>(facts.st_mtim.tv_sec),
                        static_cast<unsigned long>(facts.st_mtim.tv_nsec),
                        static_cast<unsigned long long>(facts.st_ctim.tv_sec),
                        static_cast<unsigned long>(facts.st_ctim.tv_nsec));
    Validators validators;
    validators.entityTag = tag;
    validators.entityTag += start > 0 ? "-" + std::to_string(start) + "\"" : "\"";
    validators.modified = facts.st_mtim.tv_sec;
    return validators;
}

// HEAD answers what GET without a range would: ranges are GET's alone.
Answer AnswerFor(const ContentRequest& request, const Content& content, time_t now) {
    if (!request.MayBeConditional()) {
        return Whole(content, now);
    }
    switch (CheckConditions(request.conditions, content.validators, now)) {
        case Condition::NotModified:
            return Without(Line("Status", "304 Not Modified") +
                           ValidatorLines(content.validators, now));
        case Condition::Failed:
            return Without(Line("Status", "412 Precondition Failed") + LengthLine(0) +
                           ValidatorLines(content.validators, now));
        case Condition::Met:
            break;
    }
    if (request.method == "HEAD") {
        Answer answer = Whole(content, now);
        answer.pieces.clear();
        return answer;
    }
    std::vector<ByteRange> parts;
    const bool counts = request.range && RangeCounts(request.conditions, content.validators, now);
    switch (counts ? ReadRanges(*request.range, content.size, &parts) : RangeAnswer::Whole) {
        case RangeAnswer::Unsatisfiable:
            return Without(Line("Status", "416 Range Not Satisfiable") +
                           Line("Content-Range", "bytes */" + std::to_string(content.size)) +
                           LengthLine(0) + ValidatorLines(content.validators, now));
        case RangeAnswer::Parts:
            return parts.size() == 1 ? OnePart(content, parts[0], now)
                                     : ManyParts(content, parts, now);
        case RangeAnswer::Whole:
            break;
    }
    return Whole(content, now);
}

std::string StreamHeader(const Content& content) {
    return ContentLines(content) + Line("Accept-Ranges", "none") + kEnd;
}

std::string RedirectHeader(const Content& content, const std::string& line) {
    return ContentLines(content) + line + kEnd;
}

std::string ErrorAnswer(const ContentRequest& request, int status) {
    const std::string text = status == 403   ? "403 Forbidden"
                             : status == 404 ? "404 Not Found"
                                             : "500 Internal Server Error";
    const std::string body = text + "\n";
    return Line("Status", text) + Line("Content-Type", "text/plain") + LengthLine(body.size()) +
           kEnd + (request.method == "HEAD" ? "" : body);
}

}  // namespace host
