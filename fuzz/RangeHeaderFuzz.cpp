#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "hosts/linux/download/Answer.h"
#include "hosts/linux/download/Ranges.h"

// Lines: the size of the content, Range, If-Range, If-None-Match,
// If-Modified-Since, If-Match, If-Unmodified-Since.

namespace {

void Require(bool condition) {
    if (!condition) {
        abort();
    }
}

std::string TakeLine(std::string* text) {
    const size_t end = text->find('\n');
    std::string line = text->substr(0, end);
    *text = end == std::string::npos ? "" : text->substr(end + 1);
    return line;
}

// Pieces lie within the content and apart from each other.
void CheckParts(const std::vector<host::ByteRange>& parts, uint64_t size) {
    Require(!parts.empty() && parts.size() <= host::kMaxRanges);
    for (size_t index = 0; index < parts.size(); ++index) {
        const host::ByteRange& part = parts[index];
        Require(part.length > 0 && part.first < size && part.length <= size - part.first);
        for (size_t other = 0; other < index; ++other) {
            Require(part.first > parts[other].first + parts[other].length ||
                    parts[other].first > part.first + part.length);
        }
    }
}

// The announced length is what goes out, and the header is one header.
void CheckAnswer(const host::Answer& answer, uint64_t size) {
    Require(answer.header.find("\r\n\r\n") == answer.header.size() - 4);
    uint64_t length = answer.after.size();
    uint64_t content = 0;
    for (const host::Piece& piece : answer.pieces) {
        length += piece.before.size() + piece.range.length;
        content += piece.range.length;
    }
    Require(content <= size);
    const bool notModified = answer.header.compare(0, 11, "Status: 304") == 0;
    const std::string line = "Content-Length: " + std::to_string(length) + "\r\n";
    Require((answer.header.find(line) != std::string::npos) != notModified);
    Require(!notModified || length == 0);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    std::string text(reinterpret_cast<const char*>(data), size);
    host::Content content;
    content.mimeType = "text/plain";
    content.size = strtoull(TakeLine(&text).c_str(), nullptr, 10) >> 1;
    content.validators = {"\"tag\"", 784111777};
    host::ContentRequest request;
    request.method = "GET";
    request.range = TakeLine(&text);
    const auto optional = [&text]() -> std::optional<std::string> {
        const std::string line = TakeLine(&text);
        return line.empty() ? std::nullopt : std::optional<std::string>(line);
    };
    request.conditions.ifRange = optional();
    request.conditions.ifNoneMatch = optional();
    request.conditions.ifModifiedSince = optional();
    request.conditions.ifMatch = optional();
    request.conditions.ifUnmodifiedSince = optional();
    std::vector<host::ByteRange> parts;
    if (host::ReadRanges(*request.range, content.size, &parts) == host::RangeAnswer::Parts) {
        CheckParts(parts, content.size);
    } else {
        Require(parts.empty());
    }
    CheckAnswer(host::AnswerFor(request, content, 1700000000), content.size);
    return 0;
}
