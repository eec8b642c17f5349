#include <cstdio>
#include <string>

#include "src/base/AnswerMark.h"
#include "src/base/JsonText.h"
#include "webapi/APIResponse.h"
#include "webapi/WebEntry.h"

namespace TALO {

namespace {

const char kLineEnd[] = "\r\n";

// What a JSON call answers is true at that moment only.
const char kNoCache[] =
    "Cache-Control: max-age=0, no-cache, no-store, must-revalidate\r\n"
    "Pragma: no-cache\r\n"
    "Expires: 0\r\n";

void Write(const std::string& text) {
    (void)std::fwrite(text.data(), 1, text.size(), stdout);
}

}  // namespace

// Cookie lines leave as they are stored, without a header name in front.
void WebEntry::OutputHeader() {
    std::string block;
    const Json::Value headers = response->GetHeaders();
    for (auto header = headers.begin(); header != headers.end(); ++header) {
        if (header->isString()) {
            block += header.name() + ": " + header->asString() + kLineEnd;
        }
    }
    for (const Json::Value& cookie : response->GetCookies()) {
        if (cookie.isString()) {
            block += cookie.asString() + kLineEnd;
        }
    }
    block += kNoCache;
    block += kLineEnd;
    MarkAnswerBegun();
    Write(block);
}

void WebEntry::OutputBody() {
    Write(toString(response->GetBodyRef()));
    (void)std::fflush(stdout);
}

void WebEntry::WatchAnswer(volatile sig_atomic_t* begun) {
    LendAnswerMark(begun);
}

}  // namespace TALO
