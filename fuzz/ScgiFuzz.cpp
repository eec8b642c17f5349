#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

#include "programs/webapi_server/Scgi.h"

// The bytes of a connection: what is read is a request by the rules, and nothing
// behind its header block has been taken.

namespace {

constexpr size_t kMostBytes = size_t{32} * 1024;  // that a socket takes at once
constexpr size_t kBlockLimit = 4096;

void Require(bool condition) {
    if (!condition) {
        abort();
    }
}

std::string ReadRest(int connection) {
    std::string rest;
    char block[4096];
    for (ssize_t size = 0; (size = read(connection, block, sizeof block)) > 0;) {
        rest.append(block, static_cast<size_t>(size));
    }
    return rest;
}

// Of a body that is still coming, the length of all of it stands in a variable of its
// own, which is none of an API's.
constexpr char kWholeLength[] = "WEBAPI_CONTENT_LENGTH";

bool TakesWholeLength(const std::vector<std::string>& variables, const std::string& content) {
    const std::string length = variables[0].substr(variables[0].find('=') + 1);
    return content.find(std::string(1, '\0') + kWholeLength + '\0' + length + '\0') !=
           std::string::npos;
}

void CheckVariables(const std::vector<std::string>& variables, const std::string& content) {
    std::string again;
    size_t lengths = 0;
    size_t versions = 0;
    for (const std::string& variable : variables) {
        const size_t equals = variable.find('=');
        Require(equals != std::string::npos && equals > 0);
        Require(variable.find('\0') == std::string::npos);
        again += variable.substr(0, equals) + '\0' + variable.substr(equals + 1) + '\0';
        Require(variable.compare(0, equals, kWholeLength) != 0);
        lengths += variable.compare(0, equals, "CONTENT_LENGTH") == 0 ? 1U : 0U;
        versions += variable == "SCGI=1" ? 1U : 0U;
    }
    Require(again == content || TakesWholeLength(variables, content));
    Require(lengths == 1 && versions == 1);
    Require(variables[0].compare(0, 15, "CONTENT_LENGTH=") == 0);
    Require(variables[0].find_first_not_of("0123456789", 15) == std::string::npos);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string bytes(reinterpret_cast<const char*>(data), std::min(size, kMostBytes));
    int ends[2];
    Require(socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends) == 0);
    Require(write(ends[1], bytes.data(), bytes.size()) == static_cast<ssize_t>(bytes.size()));
    Require(close(ends[1]) == 0);
    ScgiLimits limits;
    limits.headerBytes = kBlockLimit;
    std::vector<std::string> variables;
    std::string reason;
    const ScgiResult result = ReadScgiRequest(ends[0], limits, &variables, &reason);
    const std::string rest = ReadRest(ends[0]);
    Require(close(ends[0]) == 0);
    Require(result != ScgiResult::kTimedOut);
    Require(rest.size() <= bytes.size());
    Require(bytes.compare(bytes.size() - rest.size(), rest.size(), rest) == 0);
    if (result != ScgiResult::kRead) {
        Require(variables.empty() && !reason.empty());
        return 0;
    }
    const size_t colon = bytes.find(':');
    const size_t length = std::stoul(bytes.substr(0, colon));
    Require(length <= kBlockLimit && std::to_string(length) == bytes.substr(0, colon));
    Require(bytes[colon + 1 + length] == ',');
    Require(rest == bytes.substr(colon + 1 + length + 1));
    CheckVariables(variables, bytes.substr(colon + 1, length));
    return 0;
}
