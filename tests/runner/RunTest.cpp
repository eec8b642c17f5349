#include <stdlib.h>
#include <unistd.h>

#include "platform/Paths.h"
#include "tests/fake/FakePlatform.h"
#include "tests/runner/RunnerFixture.h"

namespace {

using runner::Error;
using runner::ErrorCode;
using runner::Parse;

typedef std::vector<std::string> Trace;

class Run : public runner::Fixture {
  protected:
    void SetUp() override {
        Install("Test.Basic");
    }
};

TEST_F(Run, RefusesANullDocumentBeforeAnythingElse) {
    (void)Runner().Run(Json::Value());
    EXPECT_EQ(Runner().response->GetBody(), Error(101));
    EXPECT_TRUE(Runner().trace.empty());
}

TEST_F(Run, RefusesAnEmptyDocumentInInitialize) {
    for (const char* text : {"{}", "[]"}) {
        runner::OpenRunner runner;
        (void)runner.Run(Parse(text));
        EXPECT_EQ(runner.response->GetBody(), Error(101)) << text;
        EXPECT_EQ(runner.trace, Trace({"initialize"}));
    }
}

TEST_F(Run, RefusesDocumentsThatAreNoObject) {
    for (const char* text : {"5", "\"api\"", "true", "1.5", "[1]", "[{\"postParam\": {}}]"}) {
        EXPECT_EQ(Fixture::Run(Parse(text)), Error(101)) << text;
    }
}

TEST_F(Run, StopsWhenInitializeFails) {
    Runner().initialize = [](const Json::Value&) { return 0; };
    (void)Runner().Run(Post("Test.Basic", 1, "ok"));
    EXPECT_EQ(Runner().response->GetBody(), Json::Value(Json::objectValue));
}

TEST_F(Run, StopsWithoutAnAPIName) {
    EXPECT_EQ(Fixture::Run(Parse(R"({"postParam": {"version": 1, "method": "ok"}})")), Error(101));
    EXPECT_EQ(fake::Now().calls["TLIBCFileExist"], 0);
}

TEST_F(Run, DoesNotRelay) {
    Json::Value params(Json::objectValue);
    params["relay_nd"] = "1";
    EXPECT_EQ(Call("Test.Basic", 1, "ok", params), Error(101));
    params["relay_nd"] = Json::Value();
    EXPECT_EQ(Call("Test.Basic", 1, "ok", params), Error(101)) << "a null is present";
}

TEST_F(Run, ServesAMethod) {
    EXPECT_EQ(Call("Test.Basic", 1, "ok"), Parse(R"({"success": true})"));
}

TEST_F(Run, PassesParametersOfQueryAndBody) {
    Json::Value document = Post("Test.Basic", 1, "echo", Parse(R"({"a": 1, "b": [true]})"));
    document["getParam"] = Parse(R"({"a": "query", "c": "only there", "version": 7})");
    EXPECT_EQ(Fixture::Run(document)["data"],
              Parse(R"({"a": 1, "b": [true], "c": "only there", "api": "Test.Basic",
                        "version": 1, "method": "echo"})"));
}

TEST_F(Run, TakesAVersionThatIsATextOfDigits) {
    EXPECT_EQ(ErrorCode(Fixture::Run(Post("Test.Basic", "1", "ok"))), 0);
}

TEST_F(Run, AnswersAnImpossibleIdentityWith101) {
    for (const char* version :
         {"\"abc\"", "\"\"", "1.5", "[]", "[1]", "{}", "2147483648", "-2147483649", "\"1 \"",
          "\"2147483648\"", "1e300", "0", "-1", "null", "false"}) {
        EXPECT_EQ(Fixture::Run(Post("Test.Basic", Parse(version), "ok")), Error(101)) << version;
    }
    for (const char* wrong : {"[]", "{}", "[\"Test.Basic\"]"}) {
        for (const char* member : {"api", "method"}) {
            Json::Value document = Post("Test.Basic", 1, "ok");
            document["postParam"][member] = Parse(wrong);
            EXPECT_EQ(Fixture::Run(document), Error(101)) << member << " " << wrong;
        }
    }
}

TEST_F(Run, LogsWhatTheImpossibleIdentityThrew) {
    (void)Fixture::Run(Post("Test.Basic", "abc", "ok"));
    ASSERT_EQ(log.Lines().size(), 1u);
    EXPECT_EQ(log.Lines()[0].priority, LOG_ERR);
}

TEST_F(Run, CatchesWhateverAHookThrows) {
    for (int kind = 0; kind < 2; ++kind) {
        runner::OpenRunner runner;
        runner.need = [kind](TALO::APIRequest*) -> bool {
            if (kind == 0) {
                throw std::runtime_error("hook");
            }
            throw 1;
        };
        (void)runner.Run(Post("Test.Basic", 1, "ok"));
        EXPECT_EQ(runner.response->GetBody(), Error(101));
    }
    EXPECT_TRUE(LogMentions("hook"));
}

TEST_F(Run, AnswersTheDocumentWithTheRestartFlag) {
    (void)Runner().Run(Post("Test.Basic", 1, "ok"));
    EXPECT_EQ(Runner().GetResponse(), Parse(R"({"success": true, "httpd_restart": false})"));
    (void)Runner().Run(Post("Test.Basic", 1, "restart"));
    EXPECT_EQ(Runner().GetResponse(), Parse(R"({"success": true, "httpd_restart": true})"));
    Json::Value copy = Runner().GetResponse();
    copy["success"] = "changed";
    EXPECT_EQ(Runner().GetResponse()["success"], Json::Value(true));
    EXPECT_FALSE(Runner().response->GetBody().isMember("httpd_restart"));
}

TEST_F(Run, AnswersTheRestartFlagAloneWhenNothingWasSet) {
    EXPECT_EQ(Runner().GetResponse(), Parse(R"({"httpd_restart": false})"));
}

TEST_F(Run, AnswersNullWithoutAResponse) {
    TALO::APIResponse* kept = Runner().response;
    Runner().response = nullptr;
    EXPECT_TRUE(Runner().GetResponse().isNull());
    Runner().response = kept;
}

class Initialize : public Run {};

TEST_F(Initialize, TakesTheProcessEnvironmentAndThenTheDocuments) {
    ASSERT_EQ(setenv("RUNNER_TEST", "process", 1), 0);
    ASSERT_EQ(setenv("RUNNER_OTHER", "a=b=c", 1), 0);
    Json::Value document = Post("Test.Basic", 1, "ok");
    document["environ"]["RUNNER_TEST"] = "document";
    document["environ"]["RUNNER_NUMBER"] = 5;
    EXPECT_EQ(Runner().Initialize(document), 1);
    EXPECT_EQ(Runner().request->GetEnv("RUNNER_TEST", ""), Json::Value("document"));
    EXPECT_EQ(Runner().request->GetEnv("RUNNER_OTHER", ""), Json::Value("a=b=c"));
    EXPECT_FALSE(Runner().request->HasEnv("RUNNER_NUMBER"));
    EXPECT_EQ(Runner().request->GetRequestMethod(), 2);
    (void)unsetenv("RUNNER_TEST");
    (void)unsetenv("RUNNER_OTHER");
}

TEST_F(Initialize, TakesTheSessionAndTheAttributes) {
    Json::Value document = Post("Test.Basic", 1, "ok");
    document["session"] = Parse(R"({"username": "ada", "isAdmin": true})");
    document["attr"] = Parse(R"({"one": [1], "": 2, "nothing": null})");
    EXPECT_EQ(Runner().Initialize(document), 1);
    EXPECT_EQ(Runner().request->GetLoginUserName(), "ada");
    EXPECT_TRUE(Runner().request->IsAdmin());
    EXPECT_EQ(Runner().request->GetAttr("", Json::Value()),
              Parse(R"({"one": [1], "nothing": null})"));
}

TEST_F(Initialize, IgnoresMembersOfTheWrongType) {
    Json::Value document = Post("Test.Basic", 1, "ok");
    document["attr"] = Parse("[1]");
    document["session"] = 5;
    document["environ"] = "text";
    document["getParam"] = Parse("[]");
    EXPECT_EQ(Runner().Initialize(document), 1);
    EXPECT_EQ(Runner().request->GetAttr("", Json::Value()), Json::Value(Json::objectValue));
    EXPECT_EQ(Runner().request->GetAPIClass(), "Test.Basic");
}

TEST_F(Initialize, OfAnEmptyDocumentTakesTheEnvironmentAllTheSame) {
    ASSERT_EQ(setenv("RUNNER_TEST", "process", 1), 0);
    EXPECT_EQ(Runner().Initialize(Json::Value(Json::objectValue)), 0);
    EXPECT_EQ(Runner().response->GetBody(), Error(101));
    EXPECT_EQ(Runner().request->GetEnv("RUNNER_TEST", ""), Json::Value("process"));
    (void)unsetenv("RUNNER_TEST");
}

TEST_F(Initialize, TakesADocumentWithoutParameters) {
    EXPECT_EQ(Runner().Initialize(Parse(R"({"other": 1})")), 1);
    EXPECT_EQ(Runner().request->GetParam("", Json::Value()), Json::Value(Json::objectValue));
}

TEST_F(Initialize, KeepsTheParametersOfAnEarlierCall) {
    (void)Runner().Initialize(Post("Test.Basic", 1, "ok", Parse(R"({"a": 1})")));
    (void)Runner().Initialize(Post("Test.Basic", 1, "ok", Parse(R"({"b": 2})")));
    EXPECT_TRUE(Runner().request->HasParam("a"));
    EXPECT_TRUE(Runner().request->HasParam("b"));
}

class InitEnv : public Run {};

TEST_F(InitEnv, WantsAnObject) {
    for (const char* text : {"null", "[]", "5", "\"x\""}) {
        runner::OpenRunner runner;
        Json::Value environment = Parse(text);
        EXPECT_EQ(runner.InitEnv(environment), 0) << text;
        EXPECT_EQ(environment, Parse(text));
        EXPECT_EQ(runner.response->GetBody(), Error(101)) << text;
    }
}

TEST_F(InitEnv, CopiesEveryEntrySplitAtItsFirstEqualsSign) {
    char plain[] = "NAME=value";
    char split[] = "SPLIT=a=b";
    char empty[] = "EMPTY=";
    char without[] = "WITHOUT";
    char* entries[] = {plain, split, without, empty, nullptr};
    char** before = environ;
    environ = entries;
    Json::Value environment = Parse(R"({"KEPT": 1, "NAME": "old"})");
    const int result = Runner().InitEnv(environment);
    environ = before;
    EXPECT_EQ(result, 1);
    EXPECT_EQ(environment, Parse(R"({"KEPT": 1, "NAME": "value", "SPLIT": "a=b", "EMPTY": ""})"));
    EXPECT_STREQ(split, "SPLIT=a=b") << "the entries are as they were";
}

TEST_F(InitEnv, OfNoEnvironmentAddsNothing) {
    char** before = environ;
    environ = nullptr;
    Json::Value environment(Json::objectValue);
    const int result = Runner().InitEnv(environment);
    environ = before;
    EXPECT_EQ(result, 1);
    EXPECT_TRUE(environment.empty());
}

TEST_F(Run, BeginsASessionOfItsOwnInTheConstructor) {
    runner::InChild([] {
        ASSERT_NE(getsid(0), getpid());
        runner::OpenRunner runner;
        EXPECT_EQ(getsid(0), getpid());
    });
}

}  // namespace
