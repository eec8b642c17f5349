#include "programs/webapi_server/Scgi.h"

#include <gtest/gtest.h>
#include <sys/socket.h>
#include <unistd.h>

#include <string>
#include <thread>
#include <vector>

#include "tests/programs/webapi_server/Netstring.h"

using support::HeaderBlock;
using support::Netstring;

namespace {

using Strings = std::vector<std::string>;

// Two ends of a connection: the web server's, and the one that is read.
class ScgiRequest : public testing::Test {
  protected:
    ScgiRequest() {
        EXPECT_EQ(0, socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends_));
        limits_.milliseconds = 10000;
    }
    ~ScgiRequest() override {
        End();
        (void)close(ends_[0]);
    }

    void Send(const std::string& bytes) const {
        ASSERT_EQ(static_cast<ssize_t>(bytes.size()), write(ends_[1], bytes.data(), bytes.size()));
    }
    void End() {
        if (ends_[1] >= 0) {
            (void)close(ends_[1]);
            ends_[1] = -1;
        }
    }
    ScgiResult Read() {
        return ReadScgiRequest(ends_[0], limits_, &variables_, &reason_);
    }
    // What is left for whoever reads next.
    std::string Rest() {
        End();
        std::string rest;
        char block[4096];
        for (ssize_t size = 0; (size = read(ends_[0], block, sizeof block)) > 0;) {
            rest.append(block, static_cast<size_t>(size));
        }
        return rest;
    }

    int ends_[2] = {-1, -1};
    ScgiLimits limits_;
    Strings variables_ = {"untouched"};
    std::string reason_;
};

const std::string kGood = HeaderBlock({{"CONTENT_LENGTH", "5"}, {"SCGI", "1"}, {"A", "b=c"}});
const Strings kGoodVariables = {"CONTENT_LENGTH=5", "SCGI=1", "A=b=c"};

// Five bytes are announced.
std::string WithWholeLength(const std::string& length) {
    return HeaderBlock({{"CONTENT_LENGTH", "5"}, {"SCGI", "1"}, {"WEBAPI_CONTENT_LENGTH", length}});
}

}  // namespace

TEST_F(ScgiRequest, ReadsTheVariablesAndLeavesTheBody) {
    Send(kGood + "hello, and more");
    ASSERT_EQ(ScgiResult::kRead, Read()) << reason_;
    EXPECT_EQ(kGoodVariables, variables_);
    EXPECT_EQ("hello, and more", Rest());
}

TEST_F(ScgiRequest, ReadsABlockThatComesInPiecesOfAnySize) {
    const std::string bytes = kGood + "hello";
    for (size_t piece = 1; piece < 12; ++piece) {
        int ends[2];
        ASSERT_EQ(0, socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends));
        std::thread sender([&] {
            for (size_t at = 0; at < bytes.size(); at += piece) {
                const std::string part = bytes.substr(at, piece);
                EXPECT_EQ(static_cast<ssize_t>(part.size()),
                          write(ends[1], part.data(), part.size()));
                std::this_thread::sleep_for(std::chrono::microseconds(300));
            }
            (void)close(ends[1]);
        });
        EXPECT_EQ(ScgiResult::kRead, ReadScgiRequest(ends[0], limits_, &variables_, &reason_));
        sender.join();
        EXPECT_EQ(kGoodVariables, variables_);
        char rest[16];
        EXPECT_EQ(5, read(ends[0], rest, sizeof rest));
        (void)close(ends[0]);
    }
}

TEST_F(ScgiRequest, IsGoneWhereTheBytesEnd) {
    for (size_t size = 0; size < kGood.size(); ++size) {
        int ends[2];
        ASSERT_EQ(0, socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends));
        ASSERT_EQ(static_cast<ssize_t>(size), write(ends[1], kGood.data(), size));
        (void)close(ends[1]);
        EXPECT_EQ(ScgiResult::kGone, ReadScgiRequest(ends[0], limits_, &variables_, &reason_))
            << size;
        (void)close(ends[0]);
    }
    EXPECT_EQ(Strings{"untouched"}, variables_);
    EXPECT_FALSE(reason_.empty());
}

TEST_F(ScgiRequest, TimesOutWhereTheBytesStop) {
    limits_.milliseconds = 20;
    for (const std::string& begin : Strings{"", "4", "40:", "40:CONTENT_LENGTH"}) {
        Send(begin);
        EXPECT_EQ(ScgiResult::kTimedOut, Read()) << begin;
        EXPECT_EQ(Strings{"untouched"}, variables_);
    }
}

TEST_F(ScgiRequest, TakesNoDescriptorThatIsNoConnection) {
    EXPECT_EQ(ScgiResult::kGone, ReadScgiRequest(-1, limits_, &variables_, &reason_));
}

TEST_F(ScgiRequest, TakesABlockOfExactlyTheLimitAndNoneBeyond) {
    limits_.headerBytes = 64;
    const std::string begin = std::string(
        "CONTENT_LENGTH\0"
        "0\0"
        "SCGI\0"
        "1\0"
        "A\0",
        26);
    const std::string fits = begin + std::string(64 - 27, 'a') + '\0';
    ASSERT_EQ(64u, fits.size());
    Send(Netstring(fits));
    EXPECT_EQ(ScgiResult::kRead, Read()) << reason_;
    Send("65:");
    EXPECT_EQ(ScgiResult::kTooLarge, Read());
}

TEST_F(ScgiRequest, StopsAtALengthThatGrowsForEver) {
    Send(std::string(4096, '9'));
    EXPECT_EQ(ScgiResult::kTooLarge, Read());
}

TEST_F(ScgiRequest, KeepsARepeatedHeaderOfTheClient) {
    Send(HeaderBlock({{"CONTENT_LENGTH", "0"}, {"SCGI", "1"}, {"HTTP_X", "1"}, {"HTTP_X", "2"}}));
    ASSERT_EQ(ScgiResult::kRead, Read());
    EXPECT_EQ((Strings{"CONTENT_LENGTH=0", "SCGI=1", "HTTP_X=1", "HTTP_X=2"}), variables_);
}

TEST_F(ScgiRequest, TakesTheLengthOfABodyThatIsStillComingFromAVariableOfItsOwn) {
    const struct {
        const char* announced;
        const char* whole;
    } cases[] = {
        {"0", "0"},    {"0", "5"},  {"5", "5"},
        {"5", "1000"}, {"9", "10"}, {"0", "9223372036854775807"},
    };
    for (const auto& lengths : cases) {
        SCOPED_TRACE(lengths.whole);
        Send(HeaderBlock({{"CONTENT_LENGTH", lengths.announced},
                          {"SCGI", "1"},
                          {"WEBAPI_CONTENT_LENGTH", lengths.whole},
                          {"A", "b"}}));
        ASSERT_EQ(ScgiResult::kRead, Read()) << reason_;
        EXPECT_EQ((Strings{std::string("CONTENT_LENGTH=") + lengths.whole, "SCGI=1", "A=b"}),
                  variables_);
    }
}

TEST_F(ScgiRequest, LeavesVariablesThatOnlyLookLikeALength) {
    Send(HeaderBlock({{"CONTENT_LENGTH", "5"},
                      {"SCGI", "1"},
                      {"WEBAPI_CONTENT_LENGTH_", "7"},
                      {"HTTP_WEBAPI_CONTENT_LENGTH", "8"}}));
    ASSERT_EQ(ScgiResult::kRead, Read()) << reason_;
    EXPECT_EQ((Strings{"CONTENT_LENGTH=5", "SCGI=1", "WEBAPI_CONTENT_LENGTH_=7",
                       "HTTP_WEBAPI_CONTENT_LENGTH=8"}),
              variables_);
}

TEST_F(ScgiRequest, RefusesWhatIsNoRequest) {
    const struct {
        const char* name;
        std::string bytes;
    } cases[] = {
        {"no number", "x:"},
        {"an HTTP request", "GET / HTTP/1.1\r\n\r\n"},
        {"a negative length", "-1:"},
        {"a signed length", "+26:"},
        {"a blank before the length", " 26:"},
        {"a hexadecimal length", "0x1a:"},
        {"no length", ":CONTENT_LENGTH"},
        {"a leading zero", "026:"},
        {"two zeros", "00:,"},
        {"nothing in it", "0:,"},
        {"no comma", "1:a;"},
        {"a comma that comes early", "9:CONTENT,LENGTH"},
        {"no NUL at all", Netstring("CONTENT_LENGTH")},
        {"a name without a value", Netstring(std::string("CONTENT_LENGTH\0", 15))},
        {"a value that does not end", Netstring(std::string("CONTENT_LENGTH\0"
                                                            "0",
                                                            16))},
        {"an odd number of pieces", Netstring(std::string("CONTENT_LENGTH\0"
                                                          "0\0"
                                                          "SCGI\0",
                                                          22))},
        {"CONTENT_LENGTH second", HeaderBlock({{"SCGI", "1"}, {"CONTENT_LENGTH", "0"}})},
        {"CONTENT_LENGTH missing", HeaderBlock({{"SCGI", "1"}})},
        {"CONTENT_LENGTH twice",
         HeaderBlock({{"CONTENT_LENGTH", "0"}, {"SCGI", "1"}, {"CONTENT_LENGTH", "0"}})},
        {"CONTENT_LENGTH empty", HeaderBlock({{"CONTENT_LENGTH", ""}, {"SCGI", "1"}})},
        {"CONTENT_LENGTH negative", HeaderBlock({{"CONTENT_LENGTH", "-1"}, {"SCGI", "1"}})},
        {"CONTENT_LENGTH with a blank", HeaderBlock({{"CONTENT_LENGTH", " 1"}, {"SCGI", "1"}})},
        {"CONTENT_LENGTH huge",
         HeaderBlock({{"CONTENT_LENGTH", "9223372036854775808"}, {"SCGI", "1"}})},
        {"SCGI missing", HeaderBlock({{"CONTENT_LENGTH", "0"}})},
        {"SCGI of another version", HeaderBlock({{"CONTENT_LENGTH", "0"}, {"SCGI", "2"}})},
        {"SCGI twice", HeaderBlock({{"CONTENT_LENGTH", "0"}, {"SCGI", "1"}, {"SCGI", "1"}})},
        {"a name with =", HeaderBlock({{"CONTENT_LENGTH", "0"}, {"SCGI", "1"}, {"A=B", "c"}})},
        {"a name with a line end",
         HeaderBlock({{"CONTENT_LENGTH", "0"}, {"SCGI", "1"}, {"A\nB", "c"}})},
        {"a name with DEL", HeaderBlock({{"CONTENT_LENGTH", "0"}, {"SCGI", "1"}, {"A\x7f", "c"}})},
        {"an empty name", HeaderBlock({{"CONTENT_LENGTH", "0"}, {"SCGI", "1"}, {"", "c"}})},
        {"a whole length below the announced one", WithWholeLength("4")},
        {"an empty whole length", WithWholeLength("")},
        {"a negative whole length", WithWholeLength("-6")},
        {"a signed whole length", WithWholeLength("+6")},
        {"a whole length behind a blank", WithWholeLength(" 6")},
        {"a whole length before a blank", WithWholeLength("6 ")},
        {"a hexadecimal whole length", WithWholeLength("0x6")},
        {"a huge whole length", WithWholeLength("9223372036854775808")},
        {"a whole length of very many digits", WithWholeLength(std::string(1000, '9'))},
        {"a whole length twice", HeaderBlock({{"CONTENT_LENGTH", "5"},
                                              {"SCGI", "1"},
                                              {"WEBAPI_CONTENT_LENGTH", "6"},
                                              {"WEBAPI_CONTENT_LENGTH", "6"}})},
    };
    for (const auto& refused : cases) {
        SCOPED_TRACE(refused.name);
        int ends[2];
        ASSERT_EQ(0, socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends));
        ASSERT_EQ(static_cast<ssize_t>(refused.bytes.size()),
                  write(ends[1], refused.bytes.data(), refused.bytes.size()));
        reason_.clear();
        EXPECT_EQ(ScgiResult::kMalformed, ReadScgiRequest(ends[0], limits_, &variables_, &reason_));
        EXPECT_FALSE(reason_.empty());
        EXPECT_EQ(Strings{"untouched"}, variables_);
        (void)close(ends[0]);
        (void)close(ends[1]);
    }
}
