#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include "tests/host/download/Exchange.h"
#include "tests/support/TempFolder.h"

namespace {

using exchange::AskForPath;
using exchange::Environment;
using exchange::Get;
using exchange::Reply;

const char kThen[] = "Sun, 06 Nov 1994 08:49:37 GMT";
const char kBefore[] = "Sun, 06 Nov 1994 08:49:36 GMT";

class OutputCondition : public ::testing::Test {
  protected:
    OutputCondition() {
        const struct timespec times[] = {{784111777, 0}, {784111777, 0}};
        EXPECT_EQ(utimensat(AT_FDCWD, path_.c_str(), times, 0), 0);
        tag_ = AskForPath(path_).Line("ETag");
    }
    Reply Ask(const Environment& headers) const {
        return AskForPath(path_, Get(headers));
    }
    void ExpectNotModified(const Reply& reply) const {
        EXPECT_EQ(reply.status, exchange::kSent);
        EXPECT_EQ(reply.Header(),
                  "Status: 304 Not Modified\r\n"
                  "Last-Modified: " +
                      std::string(kThen) +
                      "\r\n"
                      "ETag: " +
                      tag_ + "\r\n");
        EXPECT_EQ(reply.Body(), "");
    }
    static void ExpectWhole(const Reply& reply) {
        EXPECT_EQ(reply.status, exchange::kSent);
        EXPECT_EQ(reply.Line("Status"), "(none)");
        EXPECT_EQ(reply.Line("Content-Length"), "10");
        EXPECT_EQ(reply.Body(), "0123456789");
    }
    static void ExpectPart(const Reply& reply) {
        EXPECT_EQ(reply.Line("Status"), "206 Partial Content");
        EXPECT_EQ(reply.Body(), "23");
    }

    support::TempFolder folder_;
    std::string path_ = folder_.Write("a", "0123456789");
    std::string tag_;
};

TEST_F(OutputCondition, OfATagThatTheClientHasAnswers304) {
    ExpectNotModified(Ask({{"HTTP_IF_NONE_MATCH", tag_}}));
    ExpectNotModified(Ask({{"HTTP_IF_NONE_MATCH", "\"x\", W/" + tag_}}));
    ExpectNotModified(Ask({{"HTTP_IF_NONE_MATCH", "*"}}));
    ExpectWhole(Ask({{"HTTP_IF_NONE_MATCH", "\"x\""}}));
    ExpectNotModified(
        AskForPath(path_, {{"REQUEST_METHOD", "HEAD"}, {"HTTP_IF_NONE_MATCH", tag_}}));
}

TEST_F(OutputCondition, OfATimeThatTheClientHasAnswers304) {
    ExpectNotModified(Ask({{"HTTP_IF_MODIFIED_SINCE", kThen}}));
    ExpectWhole(Ask({{"HTTP_IF_MODIFIED_SINCE", kBefore}}));
    ExpectWhole(Ask({{"HTTP_IF_MODIFIED_SINCE", "garbage"}}));
    ExpectWhole(Ask({{"HTTP_IF_MODIFIED_SINCE", kThen}, {"HTTP_IF_NONE_MATCH", "\"x\""}}));
}

TEST_F(OutputCondition, OfAnotherStateAnswers412) {
    for (const Environment& headers : {Environment{{"HTTP_IF_MATCH", "\"x\""}},
                                       Environment{{"HTTP_IF_UNMODIFIED_SINCE", kBefore}}}) {
        const Reply reply = Ask(headers);
        EXPECT_EQ(reply.status, exchange::kSent);
        EXPECT_EQ(reply.Line("Status"), "412 Precondition Failed");
        EXPECT_EQ(reply.Line("Content-Length"), "0");
        EXPECT_EQ(reply.Body(), "");
    }
    ExpectWhole(Ask({{"HTTP_IF_MATCH", tag_}}));
    ExpectWhole(Ask({{"HTTP_IF_UNMODIFIED_SINCE", kThen}}));
}

TEST_F(OutputCondition, ComesBeforeTheRange) {
    const std::pair<std::string, std::string> range = {"HTTP_RANGE", "bytes=2-3"};
    ExpectNotModified(Ask({range, {"HTTP_IF_NONE_MATCH", tag_}}));
    ExpectPart(Ask({range, {"HTTP_IF_NONE_MATCH", "\"x\""}}));
    ExpectPart(Ask({range, {"HTTP_IF_MATCH", tag_}}));
    EXPECT_EQ(Ask({{"HTTP_RANGE", "bytes=50-"}, {"HTTP_IF_MATCH", "\"x\""}}).Line("Status"),
              "412 Precondition Failed");
}

TEST_F(OutputCondition, OnTheRangeSendsTheWholeWhenTheFileHasChanged) {
    const auto ask = [&](const std::string& ifRange) {
        return Ask({{"HTTP_RANGE", "bytes=2-3"}, {"HTTP_IF_RANGE", ifRange}});
    };
    ExpectPart(ask(tag_));
    ExpectPart(ask(kThen));
    ExpectWhole(ask("W/" + tag_));
    ExpectWhole(ask("\"x\""));
    ExpectWhole(ask(kBefore));
    ExpectWhole(ask(""));
    ExpectWhole(Ask({{"HTTP_RANGE", "bytes=50-"}, {"HTTP_IF_RANGE", "\"x\""}}));
    ExpectWhole(Ask({{"HTTP_IF_RANGE", tag_}}));
}

TEST_F(OutputCondition, IsForGetAndHeadAlone) {
    for (const char* method : {"POST", "PUT", "", "get"}) {
        ExpectWhole(AskForPath(path_, {{"REQUEST_METHOD", method},
                                       {"HTTP_IF_NONE_MATCH", tag_},
                                       {"HTTP_IF_MATCH", "\"x\""},
                                       {"HTTP_RANGE", "bytes=2-3"}}));
    }
    ExpectWhole(AskForPath(path_, {{"HTTP_RANGE", "bytes=2-3"}}));
}

TEST_F(OutputCondition, SurvivesHostileHeaders) {
    for (const std::string& value : {std::string(100000, '"'), std::string(100000, ','),
                                     std::string("\r\nX: y"), std::string("\xFF\xFE")}) {
        ExpectWhole(Ask({{"HTTP_IF_NONE_MATCH", value}, {"HTTP_IF_MODIFIED_SINCE", value}}));
        ExpectWhole(Ask({{"HTTP_RANGE", "bytes=" + value}}));
        ExpectWhole(Ask({{"HTTP_RANGE", "bytes=2-3"}, {"HTTP_IF_RANGE", value}}));
    }
}

}  // namespace
