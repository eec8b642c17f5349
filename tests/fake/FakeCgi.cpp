#include <stdlib.h>
#include <string.h>

#include "platform/Cgi.h"
#include "platform/System.h"
#include "tests/fake/FakePlatform.h"

struct TALOCGIState {
    fake::Session session;
    bool found = false;
};

namespace {

bool WritesText(const std::string& text, char* buffer, size_t size) {
    if (text.size() >= size) {
        return false;
    }
    memcpy(buffer, text.c_str(), text.size() + 1);
    return true;
}

}  // namespace

extern "C" {

int TaloCgiInit(const char*, TALOCGI* ctx) {
    if (fake::Now().Called("TaloCgiInit")) {
        return -1;
    }
    ctx->state = new TALOCGIState();
    (void)WritesText(fake::Now().sessionDir, ctx->sessionDir, sizeof ctx->sessionDir);
    ctx->defaultTimeout = fake::Now().defaultTimeout;
    ctx->skipIPCheck = fake::Now().skipIPCheck;
    ++fake::Now().openContexts;
    return 0;
}

int TaloCgiLoadInCookies(TALOCGI* ctx) {
    if (fake::Now().Called("TaloCgiLoadInCookies") || ctx->state == nullptr) {
        return -1;
    }
    const char* header = getenv("HTTP_COOKIE");
    fake::Now().cookiesRead.push_back(header != nullptr ? header : "");
    return 0;
}

void TaloCgiFree(TALOCGI* ctx) {
    if (ctx == nullptr) {
        return;
    }
    fake::Now().journal.push_back("TaloCgiFree");
    if (ctx->state != nullptr) {
        --fake::Now().openContexts;
    }
    delete ctx->state;
    TLIBCSzHashFree(ctx->paramHash);
    memset(ctx, 0, sizeof *ctx);
}

int TaloCgiInitEx(TALOCGI* ctx, int timeout, int allowTimeout, const char* userClass,
                  const char* prefix) {
    fake::Now().contextCalls.push_back({timeout, allowTimeout, userClass, prefix});
    return fake::Now().Called("TaloCgiInitEx") ? -1 : TaloCgiInit(prefix, ctx);
}

int TaloCgiIsAuthorizedEx(TALOCGI* ctx, const char* sessionId, char* name, size_t size,
                          const TALOCGIAUTHREQUEST* request, int flags) {
    fake::Now().authCalls.push_back(
        {sessionId, request->checkMask, request->allowTimeout, size,
         std::string(name, size).find_first_not_of('\0') == std::string::npos, flags});
    const auto found = fake::Now().sessions.find(sessionId);
    if (fake::Now().Called("TaloCgiIsAuthorizedEx") || found == fake::Now().sessions.end() ||
        ctx->state == nullptr) {
        return -2;
    }
    const fake::Session& session = found->second;
    const int result = request->allowTimeout != 0 ? session.timeoutAllowed : session.result;
    if (result >= 0) {
        (void)WritesText(session.user, name, size);
        (void)WritesText(session.file, ctx->sessionFile, sizeof ctx->sessionFile);
        ctx->state->session = session;
        ctx->state->found = true;
    }
    return result;
}

const char* TaloCgiGetOption(TALOCGI* ctx, int option, const char* fallback) {
    fake::Now().optionCalls.push_back({option, fallback != nullptr ? fallback : "(null)"});
    const auto& options = ctx->state->session.options;
    const auto found = options.find(option);
    return found != options.end() ? found->second.c_str() : fallback;
}

const char* TaloCgiGetLang(TALOCGI* ctx) {
    return ctx->state->session.language.c_str();
}

int TaloCgiGetRemoteIP(char* buffer, size_t size) {
    fake::Now().remoteCalls.push_back(
        {size, std::string(buffer, size).find_first_not_of('\0') == std::string::npos});
    if (fake::Now().Called("TaloCgiGetRemoteIP") || fake::Now().remoteAddress.empty()) {
        return -1;
    }
    return WritesText(fake::Now().remoteAddress, buffer, size) ? 0 : -1;
}

int TaloCgiUIDGet(const char* sessionId, const char* userName) {
    fake::Now().uidCalls.push_back({sessionId, userName});
    const auto found = fake::Now().uids.find(userName);
    return fake::Now().Called("TaloCgiUIDGet") || found == fake::Now().uids.end() ? -1
                                                                                  : found->second;
}

}  // extern "C"
