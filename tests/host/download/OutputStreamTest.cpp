#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include "platform/HTTPFileOutputer.h"
#include "tests/host/download/Exchange.h"

namespace {

using exchange::Ask;
using exchange::Environment;
using exchange::Get;
using exchange::Pattern;
using exchange::Reply;

// Sends what a process of its own writes into a pipe, a piece at a time.
Reply AskForPipe(const std::string& content, const Environment& environment,
                 const std::string& readBefore = "") {
    return Ask(environment, [&] {
        int ends[2];
        EXPECT_EQ(pipe2(ends, O_CLOEXEC), 0);
        if (fork() == 0) {
            for (size_t at = 0; at < content.size();) {
                const ssize_t put =
                    write(ends[1], &content[at], std::min<size_t>(content.size() - at, 10007));
                if (put <= 0) {
                    break;
                }
                at += static_cast<size_t>(put);
            }
            _exit(0);
        }
        (void)close(ends[1]);
        FILE* const file = fdopen(ends[0], "r");
        for (const char expected : readBefore) {
            EXPECT_EQ(fgetc(file), expected);
        }
        const int result = HTTPFileOutputer().Output(file, "n.txt", "text/plain");
        EXPECT_EQ(fclose(file), 0);
        return exchange::Told(result);
    });
}

const char kHeader[] =
    "Content-Type: text/plain\r\n"
    "Content-Disposition: attachment; filename=\"n.txt\"\r\n"
    "Accept-Ranges: none\r\n";

TEST(OutputByStream, SendsAPipeToItsEndWithoutALength) {
    for (const size_t size : {0u, 1u, 65536u, 262144u, 1000000u}) {
        const std::string content = Pattern(size);
        const Reply reply = AskForPipe(content, Get());
        EXPECT_EQ(reply.status, exchange::kSent) << size;
        EXPECT_EQ(reply.Header(), kHeader) << size;
        EXPECT_TRUE(reply.Body() == content) << size;
    }
}

TEST(OutputByStream, SendsWhatStdioHasReadAhead) {
    EXPECT_EQ(AskForPipe("hello, world", Get(), "hello, ").Body(), "world");
}

TEST(OutputByStream, KnowsNoRangesAndNoConditions) {
    const Reply reply = AskForPipe("hello", Get({{"HTTP_RANGE", "bytes=1-2"},
                                                 {"HTTP_IF_NONE_MATCH", "*"},
                                                 {"HTTP_IF_MATCH", "\"x\""}}));
    EXPECT_EQ(reply.Header(), kHeader);
    EXPECT_EQ(reply.Body(), "hello");
}

TEST(OutputByStream, AnswersHeadWithoutTheContent) {
    const Reply reply = AskForPipe("hello", {{"REQUEST_METHOD", "HEAD"}});
    EXPECT_EQ(reply.status, exchange::kSent);
    EXPECT_EQ(reply.Header(), kHeader);
    EXPECT_EQ(reply.Body(), "");
}

TEST(OutputByStream, SendsMemory) {
    const Reply reply = Ask(Get(), [] {
        char content[] = "hello";
        FILE* const file = fmemopen(content, 5, "r");
        EXPECT_EQ(fgetc(file), 'h');
        const int result = HTTPFileOutputer().Output(file, "", "x/y");
        EXPECT_EQ(fclose(file), 0);
        return exchange::Told(result);
    });
    EXPECT_EQ(reply.status, exchange::kSent);
    EXPECT_EQ(reply.Body(), "ello");
}

}  // namespace
