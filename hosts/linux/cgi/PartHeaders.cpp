#include "hosts/linux/cgi/PartHeaders.h"

#include <algorithm>

#include "hosts/linux/cgi/HeaderParameters.h"

namespace host {

namespace {

bool IsBlank(char byte) {
    return byte == ' ' || byte == '\t';
}

std::string Trimmed(const std::string& text) {
    const size_t first = text.find_first_not_of(" \t");
    return first == std::string::npos
               ? std::string()
               : text.substr(first, text.find_last_not_of(" \t") - first + 1);
}

bool AddLine(const std::string& line, PartHeaders* headers) {
    const size_t colon = line.find(':');
    if (colon == std::string::npos || !IsToken(line.substr(0, colon))) {
        return false;
    }
    headers->emplace_back(LowerCase(line.substr(0, colon)), Trimmed(line.substr(colon + 1)));
    return true;
}

}  // namespace

bool ParsePartHeaders(const std::string& block, PartHeaders* headers) {
    PartHeaders parsed;
    for (size_t start = 0; start < block.size();) {
        const size_t end = block.find("\r\n", start);
        if (end == std::string::npos) {
            return false;
        }
        const std::string line = block.substr(start, end - start);
        if (line.find_first_of(std::string("\r\n\0", 3)) != std::string::npos) {
            return false;
        }
        if (!line.empty() && IsBlank(line[0])) {
            if (parsed.empty()) {
                return false;
            }
            parsed.back().second += " " + Trimmed(line);
        } else if (!AddLine(line, &parsed)) {
            return false;
        }
        start = end + 2;
    }
    headers->swap(parsed);
    return true;
}

bool HasHeader(const PartHeaders& headers, const std::string& name) {
    return std::any_of(headers.begin(), headers.end(),
                       [&](const auto& header) { return header.first == name; });
}

bool OnlyHeader(const PartHeaders& headers, const std::string& name, std::string* value) {
    const std::string* found = nullptr;
    for (const auto& header : headers) {
        if (header.first == name) {
            if (found != nullptr) {
                return false;
            }
            found = &header.second;
        }
    }
    if (found == nullptr) {
        return false;
    }
    *value = *found;
    return true;
}

}  // namespace host
