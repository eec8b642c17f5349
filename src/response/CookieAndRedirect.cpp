#include <algorithm>
#include <ctime>

#include "platform/WebAPIUtil.h"
#include "src/base/JsonConvert.h"
#include "src/base/Log.h"
#include "src/response/APIResponsePrivate.h"
#include "webapi/APIRequest.h"

namespace TALO {

namespace {

constexpr char kCookieSource[] = "APIResponse.cpp";

// Letters and digits of ASCII, whatever the locale.
bool IsNameCharacter(char byte) {
    return (byte >= '0' && byte <= '9') || (byte >= 'a' && byte <= 'z') ||
           (byte >= 'A' && byte <= 'Z') || byte == '_' || byte == '-';
}

bool IsCookieName(const std::string& name) {
    for (const char byte : name) {
        if (!IsNameCharacter(byte)) {
            return false;
        }
    }
    return !name.empty();
}

// An expiry follows the clock of the browser where it tells its time.
std::string ExpiryText(const APIRequest* request, long minutes) {
    constexpr long kSecondsPerMinute = 60;
    constexpr long kMaxMinutes = 1000L * 366 * 24 * 60;  // a thousand years: no overflow
    if (minutes < 0) {
        return "; expires=Thu, 01-Jan-1970 00:00:01 GMT";
    }
    time_t when = time(nullptr);
    if (request != nullptr && request->HasParam("client_time")) {
        when = ToInt(request->GetParam("client_time", 0), 0);
    }
    when += std::min(minutes, kMaxMinutes) * kSecondsPerMinute;
    struct tm parts = {};
    char text[1024];
    if (gmtime_r(&when, &parts) == nullptr ||
        strftime(text, sizeof text, "%a, %d-%b-%Y %H:%M:%S GMT", &parts) == 0) {
        return std::string();
    }
    return std::string("; expires=") + text;
}

}  // namespace

bool APIResponsePrivate::AddCookie(const std::string& name, const std::string& value,
                                   const std::string& path, long expireMinutes,
                                   const std::string& domain, bool secure, bool httponly) {
    if (name.empty() || value.empty() || path.empty()) {
        return false;
    }
    if (!IsCookieName(name)) {
        LogMessage(LOG_ERR, "%s(%d)%s: key[%s] contains invalid character", kCookieSource, __LINE__,
                   "AddCookie", name.c_str());
        return false;
    }
    std::string cookie = name + "=" + WebAPIUtil::URLEncode(value) + "; path=" + path;
    if (expireMinutes != 0) {
        cookie += ExpiryText(request, expireMinutes);
    }
    if (!domain.empty()) {
        cookie += "; domain=" + domain;
    }
    if (secure) {
        cookie += "; secure";
    }
    if (httponly) {
        cookie += "; httponly";
    }
    store["setCookie"].append(cookie);
    return true;
}

// A path is read from its first character without a look at its length: an empty
// one is the caller's mistake and throws.
bool APIResponsePrivate::Redirect(const std::string& path) {
    if (request == nullptr) {
        return false;
    }
    std::string location =
        request->GetURLProto("") + "://" + ToText(request->GetEnv("HTTP_HOST", ""));
    if (path.at(0) != '/') {
        location += '/';
    }
    return owner->SetHeader("Location", location + path);
}

bool APIResponse::AddCookie(const std::string& path, const std::string& name,
                            const std::string& value) {
    return d->AddCookie(name, value, path, 0, "", false, false);
}

bool APIResponse::Redirect(const std::string& path) {
    return d->Redirect(path) && SetStatus(HTTP_STATUS_FOUND, "");
}

}  // namespace TALO
