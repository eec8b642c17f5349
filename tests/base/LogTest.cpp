#include "src/base/Log.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>

#include "tests/support/LogCapture.h"

namespace {

const char kSource[] = "LogTest.cpp";

class Log : public ::testing::Test {
  protected:
    std::string Only() const {
        return capture.Lines().size() == 1 ? capture.Lines()[0].text : "not exactly one line";
    }

    support::LogCapture capture;
};

TEST_F(Log, WritesSourceLineAndMessage) {
    TALO::LogAt(LOG_ERR, "File.cpp", 42, "%s has %d of %s", "it", 7, "them");
    EXPECT_EQ(Only(), "File.cpp:42 it has 7 of them");
    EXPECT_EQ(capture.Lines()[0].priority, LOG_ERR);
}

TEST_F(Log, TakesSourceAndLineFromTheMacros) {
    LOG_ERROR("first %d", 1);
    const int line = __LINE__ - 1;
    LOG_DETAIL("second");
    ASSERT_EQ(capture.Lines().size(), 2u);
    EXPECT_EQ(capture.Lines()[0].text, "LogTest.cpp:" + std::to_string(line) + " first 1");
    EXPECT_EQ(capture.Lines()[0].priority, LOG_ERR);
    EXPECT_EQ(capture.Lines()[1].text, "LogTest.cpp:" + std::to_string(line + 2) + " second");
    EXPECT_EQ(capture.Lines()[1].priority, LOG_DEBUG);
}

TEST_F(Log, WritesTheErrorOfTheCallForPercentM) {
    errno = ENOENT;
    TALO::LogAt(LOG_ERR, "File.cpp", 1, "cannot open %s: %m", "it");
    EXPECT_EQ(Only(), std::string("File.cpp:1 cannot open it: ") + strerror(ENOENT));
}

TEST_F(Log, LeavesErrnoAsItWas) {
    errno = EXDEV;
    TALO::LogAt(LOG_ERR, "File.cpp", 1, "%s", "message");
    EXPECT_EQ(errno, EXDEV);
}

TEST_F(Log, LeavesErrnoAsItWasWhenTheSinkChangesIt) {
    TALO::SetLogSink([](int, const char*) { errno = EIO; });
    errno = 0;
    TALO::LogAt(LOG_ERR, "File.cpp", 1, "message");
    EXPECT_EQ(errno, 0);
}

TEST_F(Log, EscapesControlCharacters) {
    TALO::LogAt(LOG_ERR, "File.cpp", 1, "%s", "a\nApr 1 root: forged\r\t\x1b[31m\x01\x1f\x7f b");
    EXPECT_EQ(Only(), "File.cpp:1 a\\x0aApr 1 root: forged\\x0d\\x09\\x1b[31m\\x01\\x1f\\x7f b");
}

TEST_F(Log, PassesTextOfOtherScriptsThrough) {
    TALO::LogAt(LOG_ERR, "File.cpp", 1, "%s", "\xC3\xA9 \xE2\x82\xAC ~");
    EXPECT_EQ(Only(), "File.cpp:1 \xC3\xA9 \xE2\x82\xAC ~");
}

TEST_F(Log, TakesNothingFromAnArgumentAsAFormat) {
    TALO::LogAt(LOG_ERR, "File.cpp", 1, "%s", "%s %n %d");
    EXPECT_EQ(Only(), "File.cpp:1 %s %n %d");
}

TEST_F(Log, CutsALongMessage) {
    const std::string longText(100000, 'x');
    TALO::LogAt(LOG_ERR, "File.cpp", 1, "%s", longText.c_str());
    const std::string line = Only();
    EXPECT_GT(line.size(), 500u);
    EXPECT_LT(line.size(), 1024u);
    EXPECT_EQ(line, "File.cpp:1 " + std::string(line.size() - 11, 'x'));
}

TEST_F(Log, WritesTheMessageWhenTheSourceIsTooLong) {
    const std::string source(5000, 's');
    TALO::LogAt(LOG_ERR, source.c_str(), 1, "message");
    EXPECT_EQ(Only(), "message");
}

TEST_F(Log, WritesAnEmptyMessage) {
    TALO::LogAt(LOG_ERR, "File.cpp", 1, "%s", "");
    EXPECT_EQ(Only(), "File.cpp:1 ");
}

TEST(LogSink, AnswersTheOneBeforeAndRestoresTheDefaultForNull) {
    const TALO::LogSink first = [](int, const char*) {};
    const TALO::LogSink standard = TALO::SetLogSink(first);
    ASSERT_NE(standard, nullptr);
    EXPECT_EQ(TALO::SetLogSink(nullptr), first);
    EXPECT_EQ(TALO::SetLogSink(nullptr), standard);
}

}  // namespace
