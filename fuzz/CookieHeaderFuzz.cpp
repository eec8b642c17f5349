#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>

#include "hosts/linux/cgi/State.h"
#include "hosts/linux/sdk/Sessions.h"
#include "platform/Cgi.h"
#include "webapi/APIRequest.h"

// A cookie header, as the host and the framework read it.

namespace {

void Require(bool condition) {
    if (!condition) {
        abort();
    }
}

// What the host makes of it. A context of its own: none of the host's folders is
// touched.
std::map<std::string, std::string> HostCookies(const std::string& header) {
    TALOCGIState state;
    TALOCGI ctx;
    std::memset(&ctx, 0, sizeof ctx);
    ctx.state = &state;
    (void)setenv("HTTP_COOKIE", header.c_str(), 1);
    Require(TaloCgiLoadInCookies(&ctx) == 0);
    auto first = state.cookies;
    Require(TaloCgiLoadInCookies(&ctx) == 0 && state.cookies == first);
    return first;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    // A variable of the environment ends at NUL.
    const std::string bytes(reinterpret_cast<const char*>(data), size);
    const std::string header = bytes.substr(0, bytes.find('\0'));
    Json::Value document;
    document["environ"]["HTTP_COOKIE"] = header;
    const TALO::APIRequest request(document);
    for (const auto& cookie : HostCookies(header)) {
        Require(cookie.first.find(';') == std::string::npos);
        Require(cookie.first.find('=') == std::string::npos);
        // A cookie without a name cannot be asked for.
        if (cookie.first.empty()) {
            continue;
        }
        Require(request.HasCookie(cookie.first));
        Require(request.GetCookie(cookie.first, "") == cookie.second);
    }
    // Whatever it says, an id that passes can be nothing but a file's name.
    const std::string id = request.GetSessionID();
    Require(!talo::IsSessionId(id) ||
            id.find_first_of(std::string("/.%\0", 4)) == std::string::npos);
    return 0;
}
