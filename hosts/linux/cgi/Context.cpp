#include <cstdlib>
#include <cstring>
#include <exception>
#include <string>

#include "hosts/linux/cgi/Caller.h"
#include "hosts/linux/cgi/SessionStore.h"
#include "hosts/linux/cgi/State.h"
#include "hosts/linux/conf/KeyValueFile.h"
#include "hosts/linux/util/ParameterLine.h"
#include "hosts/linux/util/Percent.h"
#include "platform/Cgi.h"
#include "platform/System.h"

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

// Fills a zeroed context; what was made so far hangs on it when this throws.
int Prepare(const char* prefix, TALOCGI* ctx) {
    ctx->state = new TALOCGIState();
    ctx->state->prefix = prefix != nullptr ? prefix : "";
    ctx->defaultTimeout = TLIBCConfGetORBTimeout();
    ctx->skipIPCheck = host::HostSetting("skip_ip_check", "no") == "yes" ? 1 : 0;
    const std::string dir = host::FindSessionDir();
    if (dir.size() >= sizeof ctx->sessionDir) {
        return -1;
    }
    std::memcpy(ctx->sessionDir, dir.c_str(), dir.size() + 1);
    return 0;
}

}  // namespace

extern "C" {

int TaloCgiInit(const char* prefix, TALOCGI* ctx) {
    if (ctx == nullptr) {
        return -1;
    }
    try {
        return Prepare(prefix, ctx);
    } catch (const std::exception&) {
        return -1;
    }
}

int TaloCgiInitEx(TALOCGI* ctx, int timeout, int allowTimeout, const char* userClass,
                  const char* prefix) {
    // The users that are logged in are the only class that there is.
    if (userClass == nullptr || std::strcmp(userClass, "current.users") != 0 ||
        TaloCgiInit(prefix, ctx) != 0) {
        return -1;
    }
    ctx->defaultTimeout = timeout > 0 ? timeout : ctx->defaultTimeout;
    ctx->state->allowTimeout = allowTimeout != 0;
    return 0;
}

int TaloCgiLoadInCookies(TALOCGI* ctx) {
    if (ctx == nullptr || ctx->state == nullptr) {
        return -1;
    }
    const char* header = std::getenv("HTTP_COOKIE");
    try {
        ctx->state->cookies = ParseCookies(header != nullptr ? header : "");
        return 0;
    } catch (const std::exception&) {
        return -1;
    }
}

void TaloCgiFree(TALOCGI* ctx) {
    if (ctx == nullptr) {
        return;
    }
    host::ForgetCaller(ctx);
    delete ctx->state;
    TLIBCSzHashFree(ctx->paramHash);
    std::memset(ctx, 0, sizeof *ctx);
}

}  // extern "C"
