#include <string>

#include "src/base/ErrorCode.h"
#include "tests/entry/EntryTest.h"
#include "tests/support/Json.h"

using support::Parse;

namespace {

class Intake : public EntryTest {};

TEST_F(Intake, PutsTheWholeEnvironmentIntoTheRequest) {
    Inside(GetMethod("echo").With("ANY", "a=b").With("EMPTY", ""), [](ProbeEntry& entry) {
        EXPECT_TRUE(entry.Initialize(Json::Value()));
        EXPECT_EQ(entry.request->GetEnv("ANY", Json::Value()), "a=b");
        EXPECT_EQ(entry.request->GetEnv("EMPTY", Json::Value()), "");
        EXPECT_EQ(entry.request->GetRequestMethod(), 1);
    });
}

TEST_F(Intake, LetsTheBodyWinOverTheQuery) {
    Call call = Post("method=echo&version=2&both=body&body=1");
    call = call.With("QUERY_STRING", "api=Test.Entry&version=1&method=silent&both=query&query=1");
    const Reply reply = Serve(call);
    ASSERT_EQ(reply.Code(), 0) << reply.output;
    EXPECT_EQ(reply.Param("both"), "body");
    EXPECT_EQ(reply.Param("query"), 1);
    EXPECT_EQ(reply.Param("body"), 1);
    EXPECT_EQ(reply.body["data"]["version"], 2);
}

TEST_F(Intake, KeepsQueryAndBodyApartInTheDocument) {
    Inside(Post("b=2").With("QUERY_STRING", "a=1"), [](ProbeEntry& entry) {
        entry.TakeEnvironment();
        Json::Value document(Json::objectValue);
        EXPECT_TRUE(entry.InitParam(document));
        EXPECT_EQ(document, Parse(R"({"getParam": {"a": 1}, "postParam": {"b": 2}})"));
    });
}

TEST_F(Intake, ReadsNothingFromAGetWithoutQuery) {
    Inside(Call().With("REQUEST_METHOD", "GET"), [](ProbeEntry& entry) {
        entry.TakeEnvironment();
        Json::Value document(Json::objectValue);
        EXPECT_TRUE(entry.InitParam(document));
        EXPECT_EQ(document, Json::Value(Json::objectValue));
        EXPECT_EQ(fake::Now().calls["TaloCgiDetectAndDecryptParamLine"], 0);
    });
}

TEST_F(Intake, TakesAnEmptyQueryForALineWithoutPairs) {
    Inside(Get(""), [](ProbeEntry& entry) {
        EXPECT_TRUE(entry.Initialize(Json::Value()));
        EXPECT_EQ(entry.request->GetParam("", Json::Value()), Json::Value(Json::objectValue));
    });
}

TEST_F(Intake, ReadsTheBodyOfAPostOnly) {
    for (const char* method : {"GET", "HEAD", "PUT", "post", ""}) {
        Inside(Post("b=2").With("REQUEST_METHOD", method), [method](ProbeEntry& entry) {
            entry.TakeEnvironment();
            Json::Value document(Json::objectValue);
            EXPECT_TRUE(entry.InitParam(document)) << method;
            EXPECT_FALSE(document.isMember("postParam")) << method;
        });
    }
}

TEST_F(Intake, RefusesAQueryThatIsNotThereWith101) {
    Inside(Call(), [](ProbeEntry& entry) {
        entry.TakeEnvironment();
        Json::Value params(Json::objectValue);
        EXPECT_FALSE(entry.InitGetParam(params));
        EXPECT_EQ(entry.response->GetBody(),
                  Parse(R"({"success": false, "error": {"code": 101}})"));
    });
}

// The Get step sets no error of its own, so the reply has no result at all.
TEST_F(Intake, AnswersAnEmptyObjectWhenTheQueryCannotBeRead) {
    fake::Now().FailCall("TaloCgiDetectAndDecryptParamLine", 1);
    EXPECT_EQ(Serve(GetMethod("echo")).bodyText, "{}");
    fake::Reset();
    std::string many;
    for (int pair = 0; pair < 10001; ++pair) {
        many += "a&";
    }
    EXPECT_EQ(Serve(Get(many)).bodyText, "{}");
}

TEST_F(Intake, AnswersAQueryThatCannotBeReadOfAPostWithoutReadingTheBody) {
    fake::Now().FailCall("strPairToJsonObj", 1);
    Inside(Post("b=2").With("QUERY_STRING", "a=1"), [](ProbeEntry& entry) {
        EXPECT_FALSE(entry.Initialize(Json::Value()));
        EXPECT_EQ(entry.response->GetError(), 0);
        EXPECT_EQ(fake::Now().calls["strPairToJsonObj"], 1);
    });
}

TEST_F(Intake, AnswersABodyThatCannotBeReadWith101) {
    fake::Now().FailCall("strPairToJsonObj", 1);
    EXPECT_EQ(Serve(Post("api=Test.Entry")).Code(), TALO::kErrorBadRequest);
}

TEST_F(Intake, ServesTenThousandPairs) {
    std::string line = "api=Test.Entry&version=1&method=echo";
    for (int pair = 3; pair < 10000; ++pair) {
        line += "&p" + std::to_string(pair) + "=" + std::to_string(pair);
    }
    for (const Call& call :
         {Get(line).Without("QUERY_STRING").With("QUERY_STRING", line), Post(line)}) {
        const Reply reply = Serve(call);
        ASSERT_EQ(reply.Code(), 0);
        EXPECT_EQ(reply.body["data"]["params"].size(), 10000u);
    }
    EXPECT_EQ(Serve(Post(line + "&one=more")).Code(), TALO::kErrorBadRequest);
}

TEST_F(Intake, TakesAnObjectAsTheWholeBody) {
    const Reply reply = Serve(
        Post(R"({"api": "Test.Entry", "version": 1, "method": "echo", "list": [1, {"a": "&="}]})"));
    ASSERT_EQ(reply.Code(), 0) << reply.output;
    EXPECT_EQ(reply.Param("list"), Parse(R"([1, {"a": "&="}])"));
}

TEST_F(Intake, CarriesHostileTextThroughToAProperReply) {
    for (const char* text : {"%", "%4", "%zz", "%00", "%FF%FE", "\xFF\xFE", "%3Cscript%3E",
                             "%E2%80%A8", "+", "\"", "%5C", "{\"a\":", "[[[[", "%22%ud800%22"}) {
        const Reply reply =
            Serve(GetMethod("echo", std::string("&text=") + text + "&" + text + "=1"));
        EXPECT_EQ(reply.status, 0) << text;
        EXPECT_EQ(reply.Code(), 0) << text << ": " << reply.output;
        EXPECT_EQ(reply.bodyText.find('<'), std::string::npos) << text;
    }
}

TEST_F(Intake, ReadsNestedValuesUpToTheLimitOnly) {
    for (const size_t depth : {size_t(64), size_t(65), size_t(100000)}) {
        const std::string value = std::string(depth, '[') + std::string(depth, ']');
        const Reply reply = Serve(Post("api=Test.Entry&version=1&method=echo&deep=" + value));
        ASSERT_EQ(reply.status, 0) << depth;
        EXPECT_EQ(reply.Code(), 0) << depth;
        EXPECT_EQ(reply.Param("deep").isArray(), depth == 64) << depth;
    }
}

}  // namespace
