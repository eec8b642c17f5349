#include "hosts/linux/cgi/ContentDisposition.h"

#include "hosts/linux/cgi/ClientFileName.h"
#include "hosts/linux/cgi/HeaderParameters.h"
#include "hosts/linux/util/Percent.h"

namespace host {

namespace {

enum class Extended { kAbsent, kOtherCharset, kBroken, kRead };

bool IsHex(char byte) {
    return (byte >= '0' && byte <= '9') || (byte >= 'a' && byte <= 'f') ||
           (byte >= 'A' && byte <= 'F');
}

bool HasWholeEscapes(const std::string& text) {
    for (size_t at = text.find('%'); at != std::string::npos; at = text.find('%', at + 3)) {
        if (at + 2 >= text.size() || !IsHex(text[at + 1]) || !IsHex(text[at + 2])) {
            return false;
        }
    }
    return true;
}

// charset'language'percent-encoded text
Extended ReadExtended(const ParametrizedValue& header, std::string* out) {
    const auto found = header.parameters.find("filename*");
    if (found == header.parameters.end()) {
        return Extended::kAbsent;
    }
    const std::string& text = found->second;
    const size_t first = text.find('\'');
    const size_t second = first == std::string::npos ? first : text.find('\'', first + 1);
    if (second == std::string::npos) {
        return Extended::kBroken;
    }
    if (LowerCase(text.substr(0, first)) != "utf-8") {
        return Extended::kOtherCharset;
    }
    const std::string encoded = text.substr(second + 1);
    if (!HasWholeEscapes(encoded)) {
        return Extended::kBroken;
    }
    *out = PercentDecode(encoded, false);
    return Extended::kRead;
}

// filename*0, filename*1*: no browser sends these, and passing over them would
// make a field of a file.
bool HasPieces(const ParametrizedValue& header) {
    const auto next = header.parameters.upper_bound("filename*");
    return next != header.parameters.end() && next->first.compare(0, 9, "filename*") == 0;
}

// False when the part names a file that cannot be accepted.
bool ReadFileName(const ParametrizedValue& header, ContentDisposition* part) {
    std::string raw;
    const Extended extended = ReadExtended(header, &raw);
    const auto plain = header.parameters.find("filename");
    if (extended == Extended::kBroken || HasPieces(header)) {
        return false;
    }
    if (extended != Extended::kRead) {
        if (plain == header.parameters.end()) {
            return extended == Extended::kAbsent;
        }
        raw = plain->second;
    }
    part->isFile = true;
    return raw.empty() || ClientFileName(raw, &part->fileName);
}

}  // namespace

bool ParseContentDisposition(const std::string& text, ContentDisposition* out) {
    ParametrizedValue header;
    if (!ParseParametrizedValue(text, &header) || header.value != "form-data") {
        return false;
    }
    ContentDisposition part;
    part.name = header.parameters["name"];
    if (part.name.empty() || !IsPlainText(part.name) || !ReadFileName(header, &part)) {
        return false;
    }
    *out = part;
    return true;
}

}  // namespace host
