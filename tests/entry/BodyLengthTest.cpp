#include <stdio.h>
#include <unistd.h>

#include <string>

#include "src/base/ErrorCode.h"
#include "tests/entry/EntryTest.h"
#include "tests/support/Json.h"

using support::Parse;

namespace {

const char kLine[] = "api=Test.Entry&version=1&method=echo&text=hello";

class BodyLength : public EntryTest {};

TEST_F(BodyLength, RefusesLengthsThatAreNoneWith101) {
    for (const char* length : {"", "0", "-1", "-9223372036854775808", "9223372036854775807",
                               "9223372036854775808", "18446744073709551616", "12abc", "abc", " 12",
                               "+12", "0x10", "1e2", "1.5", "16777217", "4294967296"}) {
        const Reply reply = Serve(Post(kLine).With("CONTENT_LENGTH", length));
        EXPECT_EQ(reply.status, 0) << length;
        EXPECT_EQ(reply.bodyText, R"({"error":{"code":101},"success":false})") << length;
    }
    EXPECT_EQ(Serve(Post(kLine).Without("CONTENT_LENGTH")).Code(), TALO::kErrorBadRequest);
}

TEST_F(BodyLength, TouchesNothingOfABodyThatIsTooLong) {
    Inside(Post(kLine).With("CONTENT_LENGTH", "16777217"), [](ProbeEntry& entry) {
        entry.TakeEnvironment();
        Json::Value params(Json::objectValue);
        EXPECT_FALSE(entry.InitPostParam(params));
        EXPECT_EQ(lseek(STDIN_FILENO, 0, SEEK_CUR), 0);
        EXPECT_EQ(params, Json::Value(Json::objectValue));
    });
}

TEST_F(BodyLength, TakesABodyOfTheLargestSize) {
    std::string body = std::string(kLine) + "&big=";
    body.resize(static_cast<size_t>(TALO::WebEntry::kMaxBodyBytes), 'x');
    Inside(Post(body), [&body](ProbeEntry& entry) {
        EXPECT_TRUE(entry.Initialize(Json::Value()));
        EXPECT_EQ(entry.request->GetParam("text", Json::Value()), "hello");
        EXPECT_EQ(entry.request->GetParam("big", Json::Value()).asString(),
                  body.substr(body.find("big=") + 4));
    });
}

TEST_F(BodyLength, TakesWhatThereIsOfABodyCutShort) {
    const Reply reply = Serve(Post(kLine).With("CONTENT_LENGTH", "100000"));
    ASSERT_EQ(reply.Code(), 0) << reply.output;
    EXPECT_EQ(reply.Param("text"), "hello");
}

TEST_F(BodyLength, TakesAnEmptyBodyOfAPromisedLengthForALineWithoutPairs) {
    Inside(Post("").With("CONTENT_LENGTH", "10"), [](ProbeEntry& entry) {
        EXPECT_TRUE(entry.Initialize(Json::Value()));
        EXPECT_EQ(entry.request->GetParam("", Json::Value()), Json::Value(Json::objectValue));
    });
}

TEST_F(BodyLength, StopsAtContentLength) {
    const Reply reply = Serve(Post(std::string(kLine) + "&more=1")
                                  .With("CONTENT_LENGTH", std::to_string(sizeof kLine - 3)));
    ASSERT_EQ(reply.Code(), 0) << reply.output;
    EXPECT_EQ(reply.Param("text"), "hel");
    EXPECT_FALSE(reply.body["data"]["params"].isMember("more"));
}

TEST_F(BodyLength, EndsTheBodyAtANul) {
    const Reply reply = Serve(Post(std::string(kLine) + std::string(1, '\0') + "&more=1"));
    ASSERT_EQ(reply.Code(), 0) << reply.output;
    EXPECT_EQ(reply.Param("text"), "hello");
    EXPECT_FALSE(reply.body["data"]["params"].isMember("more"));
}

TEST_F(BodyLength, ReadsABodyThatArrivesInPieces) {
    int ends[2];
    ASSERT_EQ(pipe(ends), 0);
    const std::string line = kLine;
    Inside(Post(line), [&ends, &line](ProbeEntry& entry) {
        const pid_t writer = fork();
        if (writer == 0) {
            for (const char& byte : line) {
                (void)!write(ends[1], &byte, 1);
                (void)usleep(200);
            }
            _exit(0);
        }
        (void)close(ends[1]);
        (void)dup2(ends[0], STDIN_FILENO);
        EXPECT_TRUE(entry.Initialize(Json::Value()));
        EXPECT_EQ(entry.request->GetParam("text", Json::Value()), "hello");
    });
    (void)close(ends[0]);
    (void)close(ends[1]);
}

TEST_F(BodyLength, FillsAnObjectOnly) {
    for (const char* target : {"[]", "1", "\"text\"", "true"}) {
        Inside(Post(kLine), [target](ProbeEntry& entry) {
            entry.TakeEnvironment();
            Json::Value params = Parse(target);
            EXPECT_FALSE(entry.InitPostParam(params)) << target;
            EXPECT_EQ(params, Parse(target));
            EXPECT_EQ(lseek(STDIN_FILENO, 0, SEEK_CUR), 0);
        });
    }
}

TEST_F(BodyLength, CountsNullForAnEmptyObject) {
    Inside(Post("a=1"), [](ProbeEntry& entry) {
        entry.TakeEnvironment();
        Json::Value params;
        EXPECT_TRUE(entry.InitPostParam(params));
        EXPECT_EQ(params, Parse(R"({"a": 1})"));
    });
}

TEST_F(BodyLength, LeavesTheBodyOfAnUploadAlone) {
    for (const Call& call : {Post(kLine).With("CONTENT_TYPE", "multipart/form-data; boundary=x"),
                             Post(kLine).With("HTTP_X_TYPE_NAME", "sliceUpload")}) {
        Inside(call, [](ProbeEntry& entry) {
            entry.TakeEnvironment();
            Json::Value params(Json::objectValue);
            EXPECT_FALSE(entry.InitPostParam(params));
            EXPECT_EQ(lseek(STDIN_FILENO, 0, SEEK_CUR), 0);
        });
    }
}

}  // namespace
