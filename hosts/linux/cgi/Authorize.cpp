#include <string.h>
#include <time.h>

#include <exception>
#include <string>

#include "hosts/linux/cgi/Caller.h"
#include "hosts/linux/cgi/CrossSite.h"
#include "hosts/linux/cgi/RemoteAddress.h"
#include "hosts/linux/cgi/SessionStore.h"
#include "hosts/linux/cgi/State.h"
#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/sdk/Nodes.h"
#include "hosts/linux/util/HostLog.h"
#include "platform/Cgi.h"

namespace {

constexpr char kSource[] = "Authorize.cpp";

// As platform/Cgi.h lists them.
enum Result {
    kUser = 1,
    kAdministrator = 2,
    kTimedOut = -1,
    kNoSession = -2,
    kAddressChanged = -3,
    kOtherSite = -4,
    kNoAccount = -6,
};

enum Check { kCheckExists = 1, kCheckAddress = 2, kCheckTimeout = 4, kCheckSite = 8 };

enum Option {
    kOptionSkipAddress = 1,
    kOptionPrivilege = 6,
    kOptionApplication = 7,
    kOptionTimeout = 10,
};

// The checks of the mask, in this order: who holds a stolen id, or is another
// site's page, does not learn how old the session is.
int CheckSession(const TALOCGI& ctx, const talo::Session& session, int mask, bool allowTimeout) {
    const bool exempt = session.skipAddress || ctx.skipIPCheck == 1;
    if ((mask & kCheckAddress) != 0 && !exempt && session.address != host::ClientAddress()) {
        return kAddressChanged;
    }
    if ((mask & kCheckSite) != 0 && !host::IsOwnSite()) {
        return kOtherSite;
    }
    if ((mask & kCheckTimeout) != 0 && !allowTimeout &&
        host::HasTimedOut(session, ctx.defaultTimeout, time(nullptr))) {
        return kTimedOut;
    }
    talo::Account account;
    if (!talo::FindAccount(session.user, &account) || account.locked ||
        (session.node != 0 && !talo::MayActFor(session.node, account))) {
        return kNoAccount;
    }
    return talo::IsAdministrator(account) ? kAdministrator : kUser;
}

int Authorize(TALOCGI* ctx, const char* sessionId, char* name, size_t size,
              const TALOCGIAUTHREQUEST& request) {
    talo::Session session;
    if (!talo::FindSession(sessionId, &session) || session.user.size() >= size) {
        return kNoSession;
    }
    const std::string file = host::SessionDir() + "/" + sessionId;
    const bool allowTimeout = request.allowTimeout != 0 || ctx->state->allowTimeout;
    const int result = CheckSession(*ctx, session, request.checkMask, allowTimeout);
    if (result < 0 || file.size() >= sizeof ctx->sessionFile) {
        return result < 0 ? result : kNoSession;
    }
    memcpy(name, session.user.c_str(), session.user.size() + 1);
    memcpy(ctx->sessionFile, file.c_str(), file.size() + 1);
    ctx->state->session = session;
    ctx->state->timeoutText = std::to_string(session.timeout);
    host::SetCaller(ctx, session);
    return result;
}

const char* TextOr(const std::string& text, const char* fallback) {
    return text.empty() ? fallback : text.c_str();
}

}  // namespace

extern "C" {

int TaloCgiIsAuthorizedEx(TALOCGI* ctx, const char* sessionId, char* name, size_t size,
                          const TALOCGIAUTHREQUEST* request, int) {
    if (ctx == nullptr || ctx->state == nullptr || sessionId == nullptr || name == nullptr ||
        request == nullptr) {
        return kNoSession;
    }
    try {
        return Authorize(ctx, sessionId, name, size, *request);
    } catch (const std::exception& exception) {
        HOST_LOG("cannot check a session: %s", exception.what());
        return kNoSession;
    }
}

const char* TaloCgiGetOption(TALOCGI* ctx, int option, const char* fallback) {
    if (ctx == nullptr || ctx->state == nullptr) {
        return fallback;
    }
    const talo::Session& session = ctx->state->session;
    switch (option) {
        case kOptionSkipAddress:
            return session.skipAddress ? "1" : fallback;
        case kOptionPrivilege:
            return TextOr(session.privilege, fallback);
        case kOptionApplication:
            return TextOr(session.application, fallback);
        case kOptionTimeout:
            return session.timeout > 0 ? ctx->state->timeoutText.c_str() : fallback;
        default:
            return fallback;
    }
}

const char* TaloCgiGetLang(TALOCGI* ctx) {
    static const char kDefaultLanguage[] = "enu";
    if (ctx == nullptr || ctx->state == nullptr) {
        return kDefaultLanguage;
    }
    return TextOr(ctx->state->session.language, kDefaultLanguage);
}

}  // extern "C"
