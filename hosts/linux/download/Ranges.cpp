#include "hosts/linux/download/Ranges.h"

#include <strings.h>

#include <algorithm>
#include <limits>

namespace host {

namespace {

constexpr char kUnit[] = "bytes=";
constexpr size_t kUnitLength = sizeof kUnit - 1;

// Empty members of the list are allowed; this bounds them, too.
constexpr size_t kMaxHeaderBytes = 8192;

std::string Trimmed(const std::string& text) {
    const size_t first = text.find_first_not_of(" \t");
    return first == std::string::npos
               ? std::string()
               : text.substr(first, text.find_last_not_of(" \t") - first + 1);
}

// Digits only. A number beyond the range is as good as the largest: no file
// reaches either.
bool ReadNumber(const std::string& text, uint64_t* number) {
    constexpr uint64_t kMost = std::numeric_limits<uint64_t>::max();
    uint64_t value = 0;
    for (const char byte : text) {
        if (byte < '0' || byte > '9') {
            return false;
        }
        const uint64_t digit = static_cast<uint64_t>(byte - '0');
        value = value > (kMost - digit) / 10 ? kMost : value * 10 + digit;
    }
    *number = value;
    return !text.empty();
}

// One member of the list. False when it is wrong; a length of 0 when it lies
// behind the end.
bool ReadRange(const std::string& text, uint64_t size, ByteRange* range) {
    const size_t dash = text.find('-');
    if (dash == std::string::npos) {
        return false;
    }
    uint64_t first = 0;
    uint64_t last = std::numeric_limits<uint64_t>::max();
    if (dash == 0) {
        uint64_t fromEnd = 0;
        if (!ReadNumber(text.substr(1), &fromEnd)) {
            return false;
        }
        const uint64_t length = std::min(fromEnd, size);
        *range = {size - length, length};
        return true;
    }
    if (!ReadNumber(text.substr(0, dash), &first) ||
        (dash + 1 < text.size() && !ReadNumber(text.substr(dash + 1), &last)) || last < first) {
        return false;
    }
    *range = {first, first < size ? std::min(last, size - 1) - first + 1 : 0};
    return true;
}

// Whether one ends where the other begins, or later.
bool Touch(const ByteRange& one, const ByteRange& other) {
    return one.first <= other.first + other.length && other.first <= one.first + one.length;
}

// A piece may close the gap between two earlier ones: what it swallows is taken
// out, and the result stands where the first of them stood.
void Add(ByteRange piece, std::vector<ByteRange>* parts) {
    size_t place = parts->size();
    for (size_t index = 0; index < parts->size();) {
        const ByteRange other = (*parts)[index];
        if (!Touch(piece, other)) {
            ++index;
            continue;
        }
        const uint64_t end = std::max(piece.first + piece.length, other.first + other.length);
        piece.first = std::min(piece.first, other.first);
        piece.length = end - piece.first;
        place = std::min(place, index);
        parts->erase(parts->begin() + static_cast<std::ptrdiff_t>(index));
    }
    parts->insert(parts->begin() + static_cast<std::ptrdiff_t>(std::min(place, parts->size())),
                  piece);
}

}  // namespace

RangeAnswer ReadRanges(const std::string& header, uint64_t size, std::vector<ByteRange>* parts) {
    if (header.size() > kMaxHeaderBytes || strncasecmp(header.c_str(), kUnit, kUnitLength) != 0) {
        return RangeAnswer::Whole;
    }
    std::vector<ByteRange> found;
    size_t asked = 0;
    bool anyOfNothing = false;
    for (size_t start = kUnitLength; start <= header.size();) {
        const size_t end = std::min(header.find(',', start), header.size());
        const std::string member = Trimmed(header.substr(start, end - start));
        start = end + 1;
        if (member.empty()) {
            continue;
        }
        ByteRange range = {};
        if (!ReadRange(member, size, &range) || ++asked > kMaxRanges) {
            return RangeAnswer::Whole;
        }
        // The last bytes of nothing are there, but cannot be written as a range.
        anyOfNothing =
            anyOfNothing ||
            (size == 0 && member.find_first_not_of("-0") != member.npos && member[0] == '-');
        if (range.length != 0) {
            Add(range, &found);
        }
    }
    if (asked == 0 || anyOfNothing) {
        return RangeAnswer::Whole;
    }
    if (found.empty()) {
        return RangeAnswer::Unsatisfiable;
    }
    parts->swap(found);
    return RangeAnswer::Parts;
}

}  // namespace host
