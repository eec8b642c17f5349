#include <cstdlib>
#include <cstring>
#include <map>
#include <new>
#include <string>

#include "hosts/linux/util/ParameterLine.h"
#include "hosts/linux/util/Percent.h"
#include "platform/Cgi.h"

// The cookies of the request, by name; the last of a name counts.
struct TALOCGIState {
    std::string prefix;
    std::map<std::string, std::string> cookies;
};

namespace {

std::map<std::string, std::string> ParseCookies(const std::string& header) {
    std::map<std::string, std::string> cookies;
    for (const Json::Value& piece : host::SplitTrimmed(header, ";")) {
        const std::string pair = piece.asString();
        const size_t equals = pair.find('=');
        if (equals != std::string::npos) {
            cookies[pair.substr(0, equals)] = host::PercentDecode(pair.substr(equals + 1), true);
        }
    }
    return cookies;
}

}  // namespace

extern "C" {

int TaloCgiInit(const char* prefix, TALOCGI* ctx) {
    if (ctx == nullptr) {
        return -1;
    }
    try {
        ctx->state = new TALOCGIState();
        ctx->state->prefix = prefix != nullptr ? prefix : "";
        return 0;
    } catch (const std::bad_alloc&) {
        return -1;
    }
}

int TaloCgiLoadInCookies(TALOCGI* ctx) {
    if (ctx == nullptr || ctx->state == nullptr) {
        return -1;
    }
    const char* header = std::getenv("HTTP_COOKIE");
    try {
        ctx->state->cookies = ParseCookies(header != nullptr ? header : "");
        return 0;
    } catch (const std::bad_alloc&) {
        return -1;
    }
}

void TaloCgiFree(TALOCGI* ctx) {
    if (ctx == nullptr) {
        return;
    }
    delete ctx->state;
    std::memset(ctx, 0, sizeof *ctx);
}

// No enciphered form of a whole line is known here: every line is a plain one.
int TaloCgiDetectAndDecryptParamLine(char* line) {
    return line != nullptr ? 1 : 0;
}

}  // extern "C"
