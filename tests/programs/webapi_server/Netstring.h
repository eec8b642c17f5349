#ifndef TESTS_PROGRAMS_WEBAPI_SERVER_NETSTRING_H
#define TESTS_PROGRAMS_WEBAPI_SERVER_NETSTRING_H

#include <initializer_list>
#include <string>
#include <utility>
#include <vector>

namespace support {

using Variables = std::vector<std::pair<std::string, std::string>>;

inline std::string Netstring(const std::string& content) {
    return std::to_string(content.size()) + ":" + content + ",";
}

// The header block of an SCGI request with these variables, as they stand.
inline std::string HeaderBlock(const Variables& variables) {
    std::string content;
    for (const auto& variable : variables) {
        content += variable.first + '\0' + variable.second + '\0';
    }
    return Netstring(content);
}

}  // namespace support

#endif
