#include "tests/fake/FakePlatform.h"
#include "tests/runner/RunnerFixture.h"

namespace {

using runner::Error;
using runner::Parse;
using TALO::APIRequest;
using TALO::APIResponse;

typedef std::vector<std::string> Trace;

// Permission, upload, check and method of one call of an API library.
class ProcessLib : public runner::Fixture {
  protected:
    void SetUp() override {
        for (const char* api : {"Test.Basic", "Test.Check", "Test.Guard", "Test.NoTable",
                                "Test.NullTable", "Test.NullCheck", "Test.Missing"}) {
            Install(api);
        }
    }

    // The data of a success; fails the test for anything else.
    Json::Value Data(const Json::Value& document) {
        const Json::Value body = Run(document);
        EXPECT_EQ(body["success"], Json::Value(true)) << body;
        return body["data"];
    }

    Json::Value Dispatch(const Json::Value& document, int expected) {
        (void)Runner().Initialize(document);
        EXPECT_EQ(Runner().Process(Runner().request, Runner().response), expected);
        return Runner().response->GetBody();
    }
};

struct PermissionCase {
    const char* name;
    bool need, check, skip, served;
    Trace trace;
};

TEST_F(ProcessLib, GoesOnUnlessAPermissionIsNeededAndRefusedAndNotSkipped) {
    const PermissionCase rows[] = {
        {"not needed", false, false, false, true, {"need"}},
        {"granted", true, true, false, true, {"need", "check"}},
        {"refused", true, false, false, false, {"need", "check", "skip"}},
        {"let pass", true, false, true, true, {"need", "check", "skip"}},
    };
    for (const PermissionCase& row : rows) {
        runner::OpenRunner runner;
        runner.need = [&](APIRequest*) { return row.need; };
        runner.check = [&](APIRequest*, APIResponse*) { return row.check; };
        runner.skip = [&](APIRequest*) { return row.skip; };
        ASSERT_EQ(runner.APIRunner::Initialize(Post("Test.Basic", 1, "ok")), 1);
        EXPECT_EQ(runner.Process(runner.request, runner.response), row.served ? 1 : 0) << row.name;
        EXPECT_EQ(runner.trace, row.trace) << row.name;
        EXPECT_EQ(runner.response->GetBody(),
                  row.served ? Parse(R"({"success": true})") : Json::Value(Json::objectValue))
            << row.name;
    }
}

TEST_F(ProcessLib, LeavesTheCodeOfARefusalToTheHook) {
    Runner().need = [](APIRequest*) { return true; };
    Runner().skip = [](APIRequest*) { return false; };
    Runner().check = [](APIRequest*, APIResponse* response) {
        response->SetError(105, "why");
        return false;
    };
    EXPECT_EQ(Dispatch(Post("Test.Basic", 1, "ok"), 0),
              Parse(R"({"success": false, "error": {"code": 105, "errors": "why"}})"));
    EXPECT_TRUE(Runner().libHandles.empty());
}

TEST_F(ProcessLib, HasBaseHooksThatLetEverythingPass) {
    TALO::APIRunner runner;
    EXPECT_FALSE(runner.NeedPermission(nullptr));
    EXPECT_TRUE(runner.CheckPermission(nullptr, nullptr));
    EXPECT_TRUE(runner.HandleUpload(nullptr, nullptr));
    EXPECT_TRUE(runner.SkipPermission(nullptr));
}

TEST_F(ProcessLib, HandsAnUploadToItsHookBeforeTheLibraryIsOpened) {
    Runner().upload = [](APIRequest*, APIResponse* response) {
        response->SetError(108, Json::Value());
        return false;
    };
    EXPECT_EQ(Dispatch(Upload("Test.Basic", 1, "uploadEcho"), 0), Error(108));
    EXPECT_TRUE(Runner().libHandles.empty());
    EXPECT_EQ(Runner().trace, Trace({"initialize", "need", "upload"}));
}

TEST_F(ProcessLib, AsksTheUploadHookForUploadsOnly) {
    (void)Dispatch(Post("Test.Basic", 1, "uploadEcho"), 1);
    EXPECT_EQ(Runner().trace, Trace({"initialize", "need"}));
}

TEST_F(ProcessLib, StopsAnUploadToAMethodThatTakesNoneWithoutACode) {
    APIRequest request(Upload("Test.Basic", 1, "ok"));
    APIResponse response(&request);
    ASSERT_EQ(Runner().InitLibDesc(Runner().libDesc, &request), 1);
    ASSERT_EQ(Runner().AddAPIInfo(&request), 1);
    EXPECT_EQ(Runner().ProcessLib(&request, &response), 0);
    EXPECT_EQ(response.GetBody(), Json::Value(Json::objectValue));
    EXPECT_EQ(Runner().trace, Trace({"need"}));
}

TEST_F(ProcessLib, ServesTheIdentityThatItBeganWith) {
    Runner().upload = [](APIRequest* request, APIResponse*) {
        request->InitParam(Post("Test.Check", 2, "stop", Parse(R"({"relay_nd": 1, "x": 2})")),
                           false);
        return true;
    };
    const Json::Value body = Dispatch(Upload("Test.Basic", 1, "uploadEcho"), 1);
    EXPECT_EQ(body["success"], Json::Value(true));
    EXPECT_EQ(body["data"]["x"], Json::Value(2));
    EXPECT_EQ(body["data"]["relay_nd"], Json::Value(1)) << "an ordinary parameter by then";
    EXPECT_EQ(body["data"]["method"], Json::Value("stop"));
}

TEST_F(ProcessLib, AnswersALibraryWithoutUseWith111) {
    for (const char* api : {"Test.NoTable", "Test.NullTable", "Test.Missing"}) {
        EXPECT_EQ(Call(api, 1, "ok"), Error(111)) << api;
    }
}

TEST_F(ProcessLib, ServesDespiteANullCheckTable) {
    EXPECT_EQ(Data(Post("Test.NullCheck", 1, "ok")), Json::Value("served"));
}

TEST_F(ProcessLib, CallsTheRowOfTheVersion) {
    EXPECT_EQ(Data(Post("Test.Basic", 1, "ok")), Json::Value());
    EXPECT_EQ(Data(Post("Test.Basic", 2, "ok")), Json::Value("version 2"));
}

TEST_F(ProcessLib, AnswersAMethodWithoutARowWith121) {
    EXPECT_EQ(Call("Test.Basic", 1, "notInTable"), Error(121));
}

TEST_F(ProcessLib, LeavesTheMethodsOwnError) {
    EXPECT_EQ(Call("Test.Basic", 1, "fail", Parse(R"({"code": 433, "details": [1]})")),
              Parse(R"({"success": false, "error": {"code": 433, "errors": [1]}})"));
}

TEST_F(ProcessLib, Leaves117WhenTheMethodSetsNothing) {
    EXPECT_EQ(Call("Test.Basic", 1, "nothing"), Error(117));
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(ProcessLib, Leaves117WhenTheMethodThrowsAndLogsWhatItSaid) {
    EXPECT_EQ(Call("Test.Basic", 1, "throwException"), Error(117));
    EXPECT_TRUE(LogMentions("the method gave up"));
    EXPECT_EQ(log.Lines().back().priority, LOG_ERR);
}

TEST_F(ProcessLib, Leaves117WhenTheMethodThrowsWhatIsNoException) {
    EXPECT_EQ(Call("Test.Basic", 1, "throwNumber"), Error(117));
    EXPECT_EQ(log.Lines().size(), 1u);
}

TEST_F(ProcessLib, Leaves117WhenTheMethodThrowsBehindItsSuccess) {
    EXPECT_EQ(Call("Test.Basic", 1, "throwAfterSuccess"), Error(117));
    EXPECT_TRUE(LogMentions("the method gave up late"));
}

TEST_F(ProcessLib, CountsAMethodThatThrowsAsCalled) {
    (void)Dispatch(Post("Test.Basic", 1, "throwException"), 1);
}

class CheckTable : public ProcessLib {};

TEST_F(CheckTable, LetsThroughForAnyNumberButZero) {
    EXPECT_EQ(Data(Post("Test.Check", 1, "pass")), Json::Value("by its row"));
    EXPECT_EQ(Data(Post("Test.Check", 1, "passNegative")), Json::Value("with -1"));
}

TEST_F(CheckTable, StopsWithTheErrorOfTheCheck) {
    EXPECT_EQ(Dispatch(Post("Test.Check", 1, "stop"), 0),
              Parse(R"({"success": false, "error": {"code": 401, "errors": "stopped"}})"));
}

TEST_F(CheckTable, StopsWithoutAnErrorOfItsOwn) {
    EXPECT_EQ(Dispatch(Post("Test.Check", 1, "stopSilently"), 0), Json::Value(Json::objectValue));
}

TEST_F(CheckTable, ThatThrowsStopsWith117) {
    EXPECT_EQ(Dispatch(Post("Test.Check", 1, "throwException"), 0), Error(117));
    EXPECT_TRUE(LogMentions("the check gave up"));
    EXPECT_EQ(Call("Test.Check", 1, "throwNumber"), Error(117));
}

TEST_F(CheckTable, MatchesNameVersionAndMethod) {
    EXPECT_EQ(Data(Post("Test.Check", 2, "stop")), Json::Value("unchecked"));
    EXPECT_EQ(Data(Post("Test.Check", 1, "unlisted")), Json::Value("unchecked"));
}

TEST_F(CheckTable, MayHaveARowWithoutAFunction) {
    EXPECT_EQ(Data(Post("Test.Check", 1, "noFunction")), Json::Value("unchecked"));
}

TEST_F(CheckTable, MayEndInACheckOfAllTheRest) {
    EXPECT_EQ(Data(Post("Test.Guard", 1, "listed")), Json::Value("by its row"));
    EXPECT_EQ(Data(Post("Test.Guard", 1, "unlisted")), Json::Value("by the last row"));
    const Json::Value refuse = Parse(R"({"refuse": 1})");
    EXPECT_EQ(Data(Post("Test.Guard", 1, "listed", refuse)), Json::Value("by its row"));
    EXPECT_EQ(Dispatch(Post("Test.Guard", 1, "unlisted", refuse), 0),
              Parse(R"({"success": false, "error": {"code": 402, "errors": "refused"}})"));
}

TEST_F(CheckTable, IsAskedBeforeTheMethodTable) {
    EXPECT_EQ(Call("Test.Guard", 1, "notInTable", Parse(R"({"refuse": 1})"))["error"]["code"],
              Json::Value(402));
    EXPECT_EQ(Call("Test.Guard", 1, "notInTable"), Error(121));
}

TEST_F(ProcessLib, ShowsTheMethodItsCaller) {
    Json::Value document = Post("Test.Basic", 1, "caller");
    document["session"] = Parse(R"({"username": "ada", "isAdmin": true, "isTimeout": false,
                                    "isAuthorized": true})");
    document["attr"] = Parse(R"({"mark": 5})");
    const Json::Value data = Data(document);
    EXPECT_EQ(data["user"], Json::Value("ada"));
    EXPECT_EQ(data["admin"], Json::Value(true));
    EXPECT_EQ(data["timeout"], Json::Value(false));
    EXPECT_EQ(data["authorized"], Json::Value(true));
    EXPECT_EQ(data["attributes"], Parse(R"({"mark": 5})"));
    EXPECT_EQ(data["requestMethod"], Json::Value(2));
    EXPECT_EQ(data["description"]["requestFormat"], Json::Value("JSON"));
}

}  // namespace
