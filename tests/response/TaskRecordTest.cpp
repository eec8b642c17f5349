#include <gtest/gtest.h>

#include <cstring>
#include <memory>

#include "src/response/APIResponsePrivate.h"
#include "tests/fake/FakePlatform.h"
#include "tests/fake/FakeTask.h"
#include "tests/support/Json.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using support::Parse;
using TALO::APIRequest;
using TALO::APIResponse;

namespace {

const char kTask[] = R"({"task_id": "1", "task_user": "ann", "full_task_id": "ann/1"})";

// The response of a background task.
class ResponseOfTask : public ::testing::Test {
  protected:
    ResponseOfTask() : request(Json::Value()), response(std::make_unique<APIResponse>(&request)) {
        fake::Reset();
        request.InitEnv(Parse(kTask));
    }
    ~ResponseOfTask() override {
        fake::Reset();
    }

    static Json::Value Properties() {
        return fake::TaskRecord("ann", "1")["properties"];
    }

    ORB::Task* Handle() const {
        TALO::APIResponsePrivate* d = nullptr;
        std::memcpy(&d, response.get(), sizeof d);
        return d->task;
    }

    static std::vector<std::string> Steps() {
        std::vector<std::string> steps;
        for (const fake::TaskCall& call : fake::TaskCalls()) {
            steps.push_back(call.detail.empty() ? call.operation
                                                : call.operation + " " + call.detail);
        }
        return steps;
    }

    APIRequest request;
    std::unique_ptr<APIResponse> response;
};

TEST_F(ResponseOfTask, RecordsASuccess) {
    response->SetSuccess(Parse(R"({"n": 1})"));
    EXPECT_EQ(Properties(), Parse(R"({"body": {"success": true, "data": {"n": 1}},
                                      "task_run": true})"));
    EXPECT_EQ(response->GetBody(), Properties()["body"]);
}

TEST_F(ResponseOfTask, RecordsAFailure) {
    response->SetError(400, "folder");
    EXPECT_EQ(Properties(),
              Parse(R"({"body": {"success": false, "error": {"code": 400, "errors": "folder"}},
                        "task_run": true})"));
    EXPECT_EQ(response->GetError(), 400);
}

TEST_F(ResponseOfTask, ReplacesTheResultOnALaterReport) {
    response->SetSuccess(Parse(R"({"n": 1})"));
    response->SetError(117, Json::Value());
    EXPECT_EQ(Properties()["body"], Parse(R"({"success": false, "error": {"code": 117}})"));
    response->SetSuccess(Json::Value());
    EXPECT_EQ(Properties()["body"], Parse(R"({"success": true})"));
}

TEST_F(ResponseOfTask, OpensItsRecordOnceAndClosesItWhenItGoes) {
    EXPECT_EQ(Handle(), nullptr);
    EXPECT_TRUE(fake::TaskCalls().empty());
    response->SetSuccess(1);
    ORB::Task* const handle = Handle();
    EXPECT_NE(handle, nullptr);
    response->SetSuccess(2);
    EXPECT_EQ(Handle(), handle);
    response.reset();
    const std::vector<std::string> batch = {"Task.beginUpdate", "Task.setProperty body",
                                            "Task.setProperty task_run", "Task.endUpdate"};
    std::vector<std::string> steps = {"Task.Task ann 1"};
    steps.insert(steps.end(), batch.begin(), batch.end());
    steps.insert(steps.end(), batch.begin(), batch.end());
    steps.push_back("Task.~Task");
    EXPECT_EQ(Steps(), steps);
}

TEST_F(ResponseOfTask, RecordsNothingElse) {
    response->SetHeader("X-One", "1");
    response->SetEnableOutput(false);
    response->SetServerError("text");
    EXPECT_TRUE(fake::TaskCalls().empty());
}

TEST_F(ResponseOfTask, KeepsItsResultWhateverTheManagerSays) {
    for (const char* operation : {"Task.Task", "Task.setProperty", "Task.endUpdate"}) {
        response = std::make_unique<APIResponse>(&request);
        fake::Now().FailCall(operation, 1);
        response->SetSuccess(operation);
        EXPECT_EQ(response->GetBody()["data"], operation);
        EXPECT_EQ(response->GetError(), 0);
        EXPECT_FALSE(Properties().isMember("body")) << operation;
        EXPECT_FALSE(Properties().isMember("task_run")) << operation;
    }
}

TEST_F(ResponseOfTask, IsAskedForAtEveryReport) {
    APIRequest other(Json::Value{});
    response = std::make_unique<APIResponse>(&other);
    response->SetSuccess(1);
    EXPECT_EQ(Handle(), nullptr);
    other.InitEnv(Parse(kTask));
    response->SetSuccess(2);
    EXPECT_EQ(Properties()["body"]["data"], 2);
}

TEST_F(ResponseOfTask, NeedsUserAndIdInTheEnvironment) {
    for (const char* environ :
         {R"({"task_id": "1"})", R"({"task_user": "ann"})", R"({"full_task_id": "ann/1"})"}) {
        APIRequest other(Json::Value{});
        other.InitEnv(Parse(environ));
        APIResponse ordinary(&other);
        ordinary.SetSuccess(1);
        ordinary.SetError(101, Json::Value());
    }
    APIResponse without(nullptr);
    without.SetSuccess(1);
    EXPECT_TRUE(fake::TaskCalls().empty());
}

}  // namespace
