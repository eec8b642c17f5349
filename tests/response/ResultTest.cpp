#include "tests/response/Fixture.h"
#include "webapi/APIRequest.h"

using support::Parse;

namespace {

typedef Response ResponseResult;

TEST_F(ResponseResult, SucceedsWithData) {
    response.SetSuccess(Parse(R"({"a": [1, null]})"));
    EXPECT_EQ(response.GetBody(), Parse(R"({"success": true, "data": {"a": [1, null]}})"));
    EXPECT_EQ(response.GetError(), 0);
}

TEST_F(ResponseResult, SucceedsWithoutData) {
    response.SetSuccess(Json::Value());
    EXPECT_EQ(response.GetBody(), Parse(R"({"success": true})"));
}

TEST_F(ResponseResult, KeepsEveryDataButNull) {
    for (const Json::Value& data : Parse(R"([false, 0, "", [], {}, 0.0, "text", true])")) {
        response.SetSuccess(data);
        Json::Value wanted;
        wanted["success"] = true;
        wanted["data"] = data;
        EXPECT_EQ(response.GetBody(), wanted);
    }
}

TEST_F(ResponseResult, FailsWithACode) {
    response.SetError(105, Json::Value());
    EXPECT_EQ(response.GetBody(), Parse(R"({"success": false, "error": {"code": 105}})"));
    EXPECT_EQ(response.GetError(), 105);
}

TEST_F(ResponseResult, FailsWithDetails) {
    for (const Json::Value& details : Parse(R"([false, 0, "", [], {}, {"name": "a"}, [1]])")) {
        response.SetError(400, details);
        Json::Value wanted = Parse(R"({"success": false, "error": {"code": 400}})");
        wanted["error"]["errors"] = details;
        EXPECT_EQ(response.GetBody(), wanted);
    }
}

TEST_F(ResponseResult, FailsWithANegativeCode) {
    response.SetError(-1, Json::Value());
    EXPECT_EQ(response.GetBody(), Parse(R"({"success": false, "error": {"code": -1}})"));
    EXPECT_EQ(response.GetError(), -1);
}

TEST_F(ResponseResult, SucceedsWithErrorZero) {
    response.SetError(0, "details");
    EXPECT_EQ(response.GetBody(), Parse(R"({"success": true, "data": "details"})"));
    EXPECT_EQ(response.GetError(), 0);
}

TEST_F(ResponseResult, ReplacesTheWholeResult) {
    response.SetSuccess(Parse(R"({"a": 1})"));
    response.SetError(117, Parse("[1]"));
    EXPECT_EQ(response.GetBody(),
              Parse(R"({"success": false, "error": {"code": 117, "errors": [1]}})"));
    response.SetError(118, Json::Value());
    EXPECT_EQ(response.GetBody(), Parse(R"({"success": false, "error": {"code": 118}})"));
    response.SetSuccess(Json::Value());
    EXPECT_EQ(response.GetBody(), Parse(R"({"success": true})"));
    EXPECT_EQ(response.GetError(), 0);
}

TEST_F(ResponseResult, ClearsWhatElseTheBodyHeld) {
    response.SetSuccess(Json::Value());
    Put("body", "extra", 1);
    response.SetSuccess(Json::Value());
    EXPECT_EQ(response.GetBody(), Parse(R"({"success": true})"));
}

TEST_F(ResponseResult, TakesAPartOfTheResultAsTheNextResult) {
    response.SetSuccess(Parse(R"({"inner": {"a": 1}})"));
    TALO::APIResponsePrivate* d = nullptr;
    std::memcpy(&d, &response, sizeof d);
    response.SetSuccess(d->GetData("body", "data", Json::Value())["inner"]);
    EXPECT_EQ(response.GetBody(), Parse(R"({"success": true, "data": {"a": 1}})"));
}

TEST_F(ResponseResult, LeavesHeadersAndOptionsAlone) {
    response.SetHeader("X-One", "1");
    response.SetEnableOutput(false);
    response.SetHttpdRestart(true);
    response.SetError(101, Json::Value());
    EXPECT_EQ(response.GetHeader("X-One", ""), "1");
    EXPECT_FALSE(response.IsEnableOutput());
    EXPECT_TRUE(response.GetHttpdRestart());
    EXPECT_EQ(Stored("success"), Json::Value(Json::objectValue));
}

TEST_F(ResponseResult, MakesNoTaskHandleForAnOrdinaryRequest) {
    TALO::APIRequest request(Parse(R"({"environ": {"task_id": "1"}})"));
    TALO::APIResponse ordinary(&request);
    TALO::APIResponsePrivate* d = nullptr;
    std::memcpy(&d, &ordinary, sizeof d);
    ordinary.SetError(101, Json::Value());
    EXPECT_EQ(d->task, nullptr);
    EXPECT_EQ(ordinary.GetError(), 101);
}

TEST_F(ResponseResult, TakesDataAsItSetsThem) {
    Json::Value data(Json::objectValue);
    data["text"] = std::string(1000, 'a');
    const char* const text = data["text"].asCString();
    response.SetError(105, Json::Value());
    response.TakeSuccess(&data);
    EXPECT_EQ(response.GetError(), 0);
    EXPECT_EQ(response.GetBodyRef().size(), 2u);
    EXPECT_EQ(response.GetBodyRef()["success"], Json::Value(true));
    EXPECT_EQ(response.GetBodyRef()["data"]["text"].asCString(), text) << "a copy";
    Json::Value nothing;
    response.TakeSuccess(&nothing);
    EXPECT_EQ(response.GetBody(), Parse(R"({"success": true})"));
}

TEST_F(ResponseResult, ShowsItsBodyWithoutACopy) {
    EXPECT_EQ(response.GetBodyRef(), Json::Value(Json::objectValue)) << "nothing is set";
    response.SetError(400, "which");
    EXPECT_EQ(response.GetBodyRef(), response.GetBody());
    EXPECT_EQ(&response.GetBodyRef(), &response.GetBodyRef());
}

}  // namespace
