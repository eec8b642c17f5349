#include <syslog.h>
#include <unistd.h>

#include <climits>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "src/base/ErrorCode.h"
#include "tests/entry/RelayFixture.h"
#include "tests/support/LogCapture.h"

// What the client gets: the other appliance's answer, or an error of this one's.

namespace {

class RelayAnswer : public RelayFixture {
  protected:
    static std::string OutputOf(const std::string& answer) {
        Peer().response = answer;
        return Forward(Far(), [](const fake::RelayCall&) {});
    }
};

TEST_F(RelayAnswer, StandsUnchangedBehindTheHeaderBlockOfThisAppliance) {
    const struct {
        const char* what;
        std::string answer;
    } rows[] = {
        {"JSON", R"({"data":{"a":"</b>"},"success":true})"},
        {"an error", R"({"error":{"code":105},"success":false})"},
        {"nothing", ""},
        {"a line end", "\n"},
        {"no JSON", "<html>"},
        {"a header of its own", "Status: 500\r\nContent-type: text/plain\r\n\r\nlost"},
        {"NUL bytes", std::string("\0a\0\0b\0", 6)},
        {"every byte there is", "\x01\x7f\x80\xc0\xff\xfe\r\n\x1b%s%n"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.what);
        EXPECT_EQ(OutputOf(row.answer), kBlock + row.answer);
    }
}

TEST_F(RelayAnswer, IsWrittenWholeHoweverLong) {
    std::string answer(3u << 20, '\0');
    for (size_t index = 0; index < answer.size(); ++index) {
        answer[index] = static_cast<char>(index * 31 >> 3);
    }
    EXPECT_TRUE(OutputOf(answer) == kBlock + answer);
}

TEST_F(RelayAnswer, IsThatOfTheQueuedCall) {
    Peer().index = 5;
    const std::string output = Forward(Far("&relay_timeout=2"), [](const fake::RelayCall& call) {
        EXPECT_EQ(call.timeouts, std::vector<long>{2});
    });
    EXPECT_EQ(output, kBlock + Peer().response);
}

TEST_F(RelayAnswer, FollowsTheHeadersAndCookiesOfTheResponseHere) {
    const std::string output = Inside(Far(), [](ProbeEntry& entry) {
        entry.response->SetHeader("x-here", "1");
        entry.response->SetServerError("kept");
        (void)entry.Run(Json::Value());
    });
    EXPECT_EQ(output.find("Content-type: "), 0u) << output;
    EXPECT_NE(output.find("\r\nx-here: 1\r\nx-request-error: kept\r\nCache-Control: "),
              std::string::npos)
        << output;
    const std::string end = "Expires: 0\r\n\r\n" + Peer().response;
    EXPECT_EQ(output.substr(output.size() - end.size()), end);
}

TEST_F(RelayAnswer, HasLeftTheBufferWhenTheRelayIsDone) {
    // The child ends without emptying any buffer.
    const support::ChildResult result = support::InChild([]() -> int {
        const Call call = Far();
        for (const auto& variable : call.environment) {
            (void)setenv(variable.first.c_str(), variable.second.c_str(), 1);
        }
        ProbeEntry entry;
        (void)setvbuf(stdout, nullptr, _IOFBF, 1u << 16);
        if (!entry.Initialize(Json::Value()) ||
            !entry.ProcessRelay(entry.request, entry.response)) {
            _exit(1);
        }
        _exit(0);
    });
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.output, kBlock + Peer().response);
}

void TraceOnce(void*) {
    FILE* file = fopen(getenv("ENTRY_TRACE"), "ae");
    if (file != nullptr) {
        (void)fputs("ran\n", file);
        (void)fclose(file);
    }
}

TEST_F(RelayAnswer, LeavesTheCallbacksToRun) {
    const std::string output = Inside(Traced(Far()), [](ProbeEntry& entry) {
        entry.response->SetCallbackFunc(TraceOnce, nullptr);
        EXPECT_GT(entry.Run(Json::Value()), 0);
    });
    EXPECT_EQ(output, kBlock + Peer().response);
    EXPECT_EQ(WaitForTrace(1), "ran\n");
}

TEST_F(RelayAnswer, Is109WhereTheCallCannotBeQueued) {
    for (const int index : {-1, -5, INT_MIN}) {
        Peer().index = index;
        Refuse(Far("&relay_timeout=5"), TALO::kErrorRelay, [](ProbeEntry&) {
            EXPECT_EQ(Operations(),
                      "CredRequestMgr.CredRequestMgr CredRequestMgr.AddWebAPIRequest ");
        });
    }
}

TEST_F(RelayAnswer, Is109WithALineInTheLogWhereTheRelayFails) {
    Peer().succeeds = false;
    for (const int error : {0, 7, -1}) {
        Peer().error = error;
        Refuse(Far(), TALO::kErrorRelay, [](ProbeEntry&) {
            EXPECT_EQ(Operations(),
                      "CredRequestMgr.CredRequestMgr CredRequestMgr.AddWebAPIRequest "
                      "CredRequestMgr.Run CredRequestMgr.GetError ");
        });
        (void)Inside(Far(), [error](ProbeEntry& entry) {
            const support::LogCapture log;
            (void)entry.Run(Json::Value());
            ASSERT_EQ(log.Lines().size(), 1u);
            EXPECT_EQ(log.Lines()[0].priority, LOG_ERR);
            EXPECT_TRUE(
                log.Has("WebEntry.cpp", "relay request fail[" + std::to_string(error) + "]"))
                << log.Lines()[0].text;
        });
    }
}

TEST_F(RelayAnswer, LeavesNoLineInTheLogUnlessTheRelayFails) {
    const auto quiet = [] {
        (void)Inside(Far(), [](ProbeEntry& entry) {
            const support::LogCapture log;
            (void)entry.Run(Json::Value());
            EXPECT_TRUE(log.Lines().empty()) << log.Lines()[0].text;
        });
    };
    quiet();
    Peer().index = -1;
    quiet();
}

TEST_F(RelayAnswer, ComesWithoutATimeLimitWhereThePlatformHasNoRequestToLimit) {
    Peer().hasRequest = false;
    (void)Forward(Far("&relay_timeout=5"),
                  [](const fake::RelayCall& call) { EXPECT_TRUE(call.timeouts.empty()); });
}

// The header block must not leave before it is sure that an answer follows.
TEST_F(RelayAnswer, Is101WhereThePlatformThrows) {
    for (const char* operation :
         {"CredRequestMgr.CredRequestMgr", "CredRequestMgr.AddWebAPIRequest",
          "CredRequestMgr.GetRequest", "CredRequest.SetResponseTimeout", "CredRequestMgr.Run",
          "CredRequestMgr.GetResponse"}) {
        SCOPED_TRACE(operation);
        Peer().throws = operation;
        Refuse(Far("&relay_timeout=5"), TALO::kErrorBadRequest);
    }
    Peer().succeeds = false;
    Peer().throws = "CredRequestMgr.GetError";
    Refuse(Far(), TALO::kErrorBadRequest);
}

}  // namespace
