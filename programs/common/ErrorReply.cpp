#include "programs/common/ErrorReply.h"

// The lines of an ordinary reply, behind the status.
#define REPLY(status, code)                                             \
    "Status: " status                                                   \
    "\r\n"                                                              \
    "Content-type: text/html; charset=\"UTF-8\"\r\n"                    \
    "Cache-Control: max-age=0, no-cache, no-store, must-revalidate\r\n" \
    "Pragma: no-cache\r\n"                                              \
    "Expires: 0\r\n"                                                    \
    "\r\n"                                                              \
    "{\"error\":{\"code\":" code "},\"success\":false}"

namespace {

constexpr char kBadRequest[] = REPLY("400 Bad Request", "101");
constexpr char kCrashed[] = REPLY("500 Internal Server Error", "117");
constexpr char kOverloaded[] = REPLY("503 Service Unavailable", "100");
constexpr char kTimedOut[] = REPLY("504 Gateway Timeout", "117");

template <size_t size>
constexpr ErrorReply Whole(const char (&text)[size]) {
    return {text, size - 1};
}

}  // namespace

ErrorReply ReplyFor(ReplyStatus status) {
    switch (status) {
        case ReplyStatus::kBadRequest:
            return Whole(kBadRequest);
        case ReplyStatus::kOverloaded:
            return Whole(kOverloaded);
        case ReplyStatus::kTimedOut:
            return Whole(kTimedOut);
        case ReplyStatus::kCrashed:
            break;
    }
    return Whole(kCrashed);
}
