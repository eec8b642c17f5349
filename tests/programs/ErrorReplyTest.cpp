#include <gtest/gtest.h>

#include <string>

#include "programs/common/ErrorReply.h"

namespace {

// The lines of an ordinary reply, and the empty one.
const char kOrdinaryLines[] =
    "Content-type: text/html; charset=\"UTF-8\"\r\n"
    "Cache-Control: max-age=0, no-cache, no-store, must-revalidate\r\n"
    "Pragma: no-cache\r\n"
    "Expires: 0\r\n"
    "\r\n";

struct Row {
    ReplyStatus status;
    const char* line;
    int code;
};

const Row kRows[] = {
    {ReplyStatus::kBadRequest, "Status: 400 Bad Request\r\n", 101},
    {ReplyStatus::kCrashed, "Status: 500 Internal Server Error\r\n", 117},
    {ReplyStatus::kOverloaded, "Status: 503 Service Unavailable\r\n", 100},
    {ReplyStatus::kTimedOut, "Status: 504 Gateway Timeout\r\n", 117},
};

TEST(ErrorReply, HasAStatusLineInFrontOfAnOrdinaryReplyWithACode) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.line);
        const ErrorReply reply = ReplyFor(row.status);
        EXPECT_EQ(std::string(reply.text, reply.size),
                  row.line + std::string(kOrdinaryLines) +
                      "{\"error\":{\"code\":" + std::to_string(row.code) + "},\"success\":false}");
    }
}

TEST(ErrorReply, FitsIntoAPipeInOneWrite) {
    for (const Row& row : kRows) {
        EXPECT_LE(ReplyFor(row.status).size, 4096u) << row.line;
    }
}

}  // namespace
