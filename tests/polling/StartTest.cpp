#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>

#include "tests/polling/PollingFixture.h"

using polling::Parse;
using TALO::APIRequest;
using TALO::APIResponse;

namespace {

void Succeed(APIRequest*, APIResponse* response) {
    response->SetSuccess(Json::Value());
}

class StartTask : public polling::Fixture {
  protected:
    void DoesNotStart(int pollingError) {
        EXPECT_FALSE(Start(Succeed));
        EXPECT_EQ(polling.GetError(), pollingError);
        EXPECT_TRUE(AwaitChildren().empty());
    }

    void AnswersError(int code) {
        EXPECT_EQ(response.GetBody()["error"]["code"], code);
        EXPECT_FALSE(response.GetBody()["error"].isMember("errors"));
        EXPECT_EQ(response.GetError(), code);
    }

    void AnswersNothing() {
        EXPECT_EQ(response.GetBody(), Json::Value(Json::objectValue));
    }

    Json::Value Info() const {
        return Record(StartedId())["properties"]["info"];
    }
};

TEST_F(StartTask, WithoutARequestFailsWith502) {
    polling.SetRequest(nullptr);
    DoesNotStart(502);
    EXPECT_EQ(Messages(), std::vector<std::string>{"unknown request"});
    EXPECT_TRUE(Logged("unknown request"));
    EXPECT_TRUE(fake::TaskCalls().empty());
    AnswersNothing();
}

TEST_F(StartTask, WithoutAResponseOrWorkFailsWith502) {
    int calls = 0;
    EXPECT_FALSE(polling.Start(
        nullptr, [](APIRequest*, APIResponse*, void*) {}, &calls));
    EXPECT_EQ(polling.GetError(), 502);
    polling.SetError(500);
    EXPECT_FALSE(polling.Start(&response, nullptr, &calls));
    EXPECT_EQ(polling.GetError(), 502);
    EXPECT_EQ(Messages(), std::vector<std::string>(2, "bad parameters"));
    EXPECT_TRUE(Logged("bad parameters"));
    EXPECT_TRUE(fake::TaskCalls().empty());
    AnswersNothing();
}

TEST_F(StartTask, MissesTheRequestBeforeTheResponse) {
    polling.SetRequest(nullptr);
    EXPECT_FALSE(polling.Start(nullptr, nullptr, nullptr));
    EXPECT_EQ(Messages(), std::vector<std::string>{"unknown request"});
}

TEST_F(StartTask, AnswersTheFullTaskIdAndNothingElse) {
    EXPECT_TRUE(Start(Succeed));
    const std::string id = StartedId();
    EXPECT_EQ(id.substr(0, 4), "ann/");
    EXPECT_EQ(response.GetBody()["success"], true);
    EXPECT_EQ(response.GetBody()["data"].getMemberNames(), std::vector<std::string>{"task_id"});
    EXPECT_EQ(fake::TaskIds("ann"), std::vector<std::string>{id.substr(4)});
    EXPECT_EQ(polling.GetError(), 500);
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(StartTask, KeepsTheCallInTheRecord) {
    ASSERT_TRUE(Start(Succeed));
    EXPECT_EQ(Info(), Parse(R"({"api": "Acme.Index", "version": 2, "method": "start", "group": "",
                                "prefix": "", "param": {"folder": "/music", "depth": 3}})"));
}

TEST_F(StartTask, KeepsAnEmptyObjectOfACallWithoutParameters) {
    request.InitParam(Parse(R"({"getParam": {"api": "A", "version": 1, "method": "m"}})"), true);
    ASSERT_TRUE(Start(Succeed));
    EXPECT_EQ(Info(), Parse(R"({"api": "A", "version": 1, "method": "m", "group": "",
                                "prefix": "", "param": {}})"));
}

TEST_F(StartTask, LeavesTheParametersOfTheRequestAlone) {
    ASSERT_TRUE(Start(Succeed));
    EXPECT_EQ(request.GetParam("api", ""), "Acme.Index");
    EXPECT_EQ(request.GetParam("version", 0), 2);
    EXPECT_EQ(request.GetParam("method", ""), "start");
    EXPECT_FALSE(request.IsPollingTask());
}

TEST_F(StartTask, HandsTheStoreTheNamesOfSecretParameters) {
    request.InitParam(Parse(R"({"getParam": {"_sid": "s1", "passwd": "p", "pin": 1234, "open": 1,
                                             "key": {"a": [1]}}})"),
                      false);
    request.InitAPIInfo(Parse(R"({"secret": ["pin", "key", "absent"]})"));
    ASSERT_TRUE(Start(Succeed));
    EXPECT_EQ(Info()["param"], Parse(R"({"folder": "/music", "depth": 3, "_sid": "*****",
                                         "passwd": "*****", "pin": "*****", "key": "*****",
                                         "open": 1})"));
    EXPECT_EQ(request.GetParam("pin", 0), 1234);
}

TEST_F(StartTask, NeedsNoProperListOfSecretParameters) {
    for (const char* description : {R"({"secret": "pin"})", R"({"secret": {"pin": true}})",
                                    R"({"secret": [1, null, ["pin"]]})", R"({"secret": null})"}) {
        request.InitAPIInfo(Parse(description));
        ASSERT_TRUE(Start(Succeed)) << description;
        EXPECT_EQ(Info()["param"], Parse(R"({"folder": "/music", "depth": 3})")) << description;
    }
}

TEST_F(StartTask, BeginsTheIdWithThePrefix) {
    polling.SetPrefixAttr("index-");
    ASSERT_TRUE(Start(Succeed));
    EXPECT_EQ(StartedId().substr(0, 10), "ann/index-");
    EXPECT_EQ(Info()["prefix"], "index-");
    EXPECT_EQ(fake::TaskCalls()[0].operation, "TaskUtil.getUniqueID");
    EXPECT_EQ(fake::TaskCalls()[0].detail, "ann index-");
}

TEST_F(StartTask, GivesEveryTaskAnIdOfItsOwn) {
    ASSERT_TRUE(Start(Succeed));
    const std::string first = StartedId();
    ASSERT_TRUE(Start(Succeed));
    EXPECT_NE(StartedId(), first);
    EXPECT_EQ(fake::TaskIds("ann").size(), 2u);
}

TEST_F(StartTask, SharesWithEveryoneUnderTheirName) {
    polling.SetGroupAttr("everyone");
    ASSERT_TRUE(Start(Succeed));
    EXPECT_EQ(StartedId().substr(0, 7), "@users/");
    EXPECT_EQ(Info()["group"], "everyone");
    EXPECT_TRUE(fake::TaskIds("ann").empty());
}

TEST_F(StartTask, SharesWithTheAdministratorsUnderTheirName) {
    LogIn("root", true);
    polling.SetGroupAttr("admin");
    ASSERT_TRUE(Start(Succeed));
    EXPECT_EQ(StartedId().substr(0, 16), "@administrators/");
    EXPECT_EQ(Info()["group"], "admin");
}

TEST_F(StartTask, SharesWithTheAdministratorsForOneOfThemOnlyElse105) {
    LogIn("root", true);
    polling.SetGroupAttr("admin");
    LogIn("root", false);
    DoesNotStart(500);
    AnswersError(105);
    EXPECT_TRUE(fake::TaskCalls().empty());
}

TEST_F(StartTask, AnswersAGroupThatThereIsNotWith114) {
    polling::PrivateOf(polling)->SetData("polling_attribute", "share_to_group", "friends", true);
    DoesNotStart(500);
    AnswersError(114);
    EXPECT_TRUE(fake::TaskCalls().empty());
}

TEST_F(StartTask, AnswersNobodyWith117) {
    LogIn("", false);
    DoesNotStart(500);
    AnswersError(117);
    EXPECT_TRUE(fake::TaskIds("").empty());
}

TEST_F(StartTask, AnswersAPrefixThatIsNoNameWith117) {
    for (const std::string& prefix :
         {std::string("a b"), std::string("../"), std::string("a/b"), std::string("\xC3\xA4"),
          std::string("a\0b", 3), std::string("x*"), std::string(65, 'a')}) {
        polling.SetPrefixAttr(prefix);
        DoesNotStart(500);
        AnswersError(117);
    }
    EXPECT_TRUE(fake::TaskIds("ann").empty());
    polling.SetPrefixAttr(std::string(64, 'a'));
    EXPECT_TRUE(Start(Succeed));
}

TEST_F(StartTask, AnswersAManagerThatGivesNoIdOrNoHandleWith117) {
    for (const char* operation : {"TaskUtil.getUniqueID", "Task.Task"}) {
        fake::Now().FailCall(operation, 1);
        DoesNotStart(500);
        AnswersError(117);
        EXPECT_EQ(fake::Now().calls["TLIBCProcFork"], 0);
    }
    EXPECT_TRUE(fake::TaskIds("ann").empty());
}

TEST_F(StartTask, LeavesTheResponseWhenTheRecordCannotBeStored) {
    for (const char* operation : {"Task.endUpdate", "Task.setProperty"}) {
        fake::Now().FailCall(operation, 1);
        response.SetError(123, "before");
        const Json::Value before = response.GetBody();
        DoesNotStart(500);
        EXPECT_EQ(response.GetBody(), before);
        EXPECT_EQ(response.GetError(), 123);
    }
    EXPECT_EQ(Messages(), std::vector<std::string>(2, "Failed to set property."));
    EXPECT_TRUE(Logged("Failed to set property."));
    EXPECT_EQ(fake::Now().calls["TLIBCProcFork"], 0);
}

TEST_F(StartTask, TakesTheRecordBackWhenThereIsNoProcessWith110) {
    fake::Now().FailCall("TLIBCProcFork", 1);
    DoesNotStart(500);
    AnswersError(110);
    EXPECT_TRUE(fake::TaskIds("ann").empty());
    EXPECT_EQ(Messages(),
              std::vector<std::string>{"Failed to fork(). Resource temporarily unavailable"});
    EXPECT_TRUE(Logged("Failed to fork(). Resource temporarily unavailable"));
}

TEST_F(StartTask, StoresEverythingInOneBatchBeforeTheFork) {
    fake::Now().FailCall("TLIBCProcFork", 1);
    EXPECT_FALSE(Start(Succeed));
    std::vector<std::string> steps;
    for (const fake::TaskCall& call : fake::TaskCalls()) {
        if (call.operation != "Task.setSecretParams" && call.operation != "Task.~Task") {
            steps.push_back(call.operation + " " + call.detail);
        }
    }
    const std::string id = "t00000001";
    EXPECT_EQ(steps, (std::vector<std::string>{"TaskUtil.getUniqueID ann ", "Task.Task ann " + id,
                                               "Task.beginUpdate ", "Task.setProperty info",
                                               "Task.setProperty auto_remove", "Task.endUpdate ",
                                               "Task.remove "}));
}

TEST_F(StartTask, ReadsTheAttributesWhenItStarts) {
    polling.SetRemoveAttr(false);
    const std::string first = RunTask();
    polling.SetRemoveAttr(true);
    const std::string second = RunTask();
    EXPECT_EQ(Record(first)["properties"]["auto_remove"], false);
    EXPECT_EQ(Record(second)["properties"]["auto_remove"], true);
}

TEST_F(StartTask, MayBeRemovedEarlyUnlessToldOtherwise) {
    EXPECT_EQ(Record(RunTask())["properties"]["auto_remove"], true);
}

TEST_F(StartTask, WaitsSixtySecondsForTheFirstResult) {
    fake::Tasks().waitsPassAtOnce = true;
    EXPECT_TRUE(Start([](APIRequest*, APIResponse*) {}));
    EXPECT_EQ(StartedId().substr(0, 4), "ann/");
    std::vector<std::string> waits;
    for (const fake::TaskCall& call : fake::TaskCalls()) {
        if (call.operation == "Task.waitForDataReady") {
            EXPECT_EQ(call.pid, getpid());
            waits.push_back(call.detail);
        }
    }
    EXPECT_EQ(waits, std::vector<std::string>{"task_run 60"});
}

TEST_F(StartTask, AnswersAsSoonAsTheWorkHasReported) {
    int gate[2];
    ASSERT_EQ(pipe(gate), 0);
    EXPECT_TRUE(Start([&gate](APIRequest*, APIResponse* taskResponse) {
        (void)close(gate[1]);
        taskResponse->SetSuccess("first");
        char byte = 0;
        (void)!read(gate[0], &byte, 1);
        taskResponse->SetSuccess("last");
    }));
    EXPECT_EQ(Reported(StartedId()), "first");
    EXPECT_EQ(Record(StartedId())["finished"], false);
    (void)close(gate[0]);
    (void)close(gate[1]);
    EXPECT_EQ(AwaitChildren(), std::vector<int>{0});
    EXPECT_EQ(Reported(StartedId()), "last");
    EXPECT_EQ(Record(StartedId())["finished"], true);
}

TEST_F(StartTask, ReleasesItsHandles) {
    for (const char* failing : {"", "Task.endUpdate", "TLIBCProcFork"}) {
        fake::ResetTasks();
        if (*failing != '\0') {
            fake::Now().FailCall(failing, 1);
        }
        (void)Start(Succeed);
        const std::vector<std::string> own = Operations(false);
        EXPECT_EQ(std::count(own.begin(), own.end(), "Task.Task"),
                  std::count(own.begin(), own.end(), "Task.~Task"))
            << failing;
        (void)AwaitChildren();
    }
}

// The parent's answer is its own: nothing of it goes into the record.
TEST_F(StartTask, RecordsTheWorksResultAndNotTheAnswer) {
    const std::string id = RunTask();
    EXPECT_EQ(Record(id)["properties"]["body"], Parse(R"({"success": true, "data": {"n": 1}})"));
    EXPECT_EQ(Record(id)["properties"]["task_run"], true);
}

}  // namespace
