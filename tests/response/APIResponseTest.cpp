#include "tests/response/Fixture.h"
#include "webapi/APIRequest.h"

using support::Parse;

namespace {

TEST_F(Response, StartsWithOneHeaderAndNothingElse) {
    Json::Value headers;
    headers["Content-type"] = "text/html; charset=\"UTF-8\"";
    EXPECT_EQ(response.GetHeaders(), headers);
    EXPECT_EQ(response.GetStatus(), 200);
    EXPECT_TRUE(response.IsEnableOutput());
    EXPECT_FALSE(response.GetHttpdRestart());
    EXPECT_EQ(response.GetError(), 0);
    EXPECT_EQ(response.GetBody(), Json::Value(Json::objectValue));
    EXPECT_EQ(response.GetCookies(), Json::Value(Json::arrayValue));
    EXPECT_TRUE(response.GetCallbackFuncs()->empty());
    EXPECT_FALSE(response.HasServerError());
    EXPECT_EQ(response.GetServerError(), "");
}

TEST_F(Response, StartsTheSameWithARequest) {
    TALO::APIRequest request((Json::Value()));
    const TALO::APIResponse other(&request);
    EXPECT_EQ(other.GetHeaders(), response.GetHeaders());
    EXPECT_EQ(other.GetBody(), response.GetBody());
    EXPECT_EQ(other.GetStatus(), 200);
}

TEST_F(Response, CreatesItsSectionsButNoBody) {
    EXPECT_TRUE(Stored("headers").isObject());
    EXPECT_EQ(Stored("setCookie"), Json::Value(Json::arrayValue));
    EXPECT_EQ(Stored("success"), Json::Value(Json::objectValue));
    EXPECT_EQ(Stored("option"), Json::Value(Json::objectValue));
    EXPECT_EQ(Stored("body"), Json::Value("nothing stored"));
}

TEST_F(Response, KeepsTheOutputSwitchUnderItsHistoricalName) {
    response.SetEnableOutput(false);
    EXPECT_FALSE(response.IsEnableOutput());
    EXPECT_EQ(Stored("option", "isDownload"), Json::Value(false));
    response.SetEnableOutput(true);
    EXPECT_TRUE(response.IsEnableOutput());
    EXPECT_EQ(Stored("option", "isDownload"), Json::Value(true));
}

TEST_F(Response, RemembersTheRestartOfTheWebServer) {
    response.SetHttpdRestart(true);
    EXPECT_TRUE(response.GetHttpdRestart());
    EXPECT_EQ(Stored("option", "restart_httpd"), Json::Value(true));
    response.SetHttpdRestart(false);
    EXPECT_FALSE(response.GetHttpdRestart());
}

TEST_F(Response, ReadsSwitchesOfAnotherTypeWithoutThrowing) {
    Put("option", "isDownload", "");
    EXPECT_FALSE(response.IsEnableOutput());
    Put("option", "isDownload", "yes");
    EXPECT_TRUE(response.IsEnableOutput());
    Put("option", "restart_httpd", Parse(R"({"a": 1})"));
    EXPECT_TRUE(response.GetHttpdRestart());
    Put("option", "restart_httpd", Json::Value());
    EXPECT_FALSE(response.GetHttpdRestart());
}

TEST_F(Response, KeepsTheSwitchesApart) {
    response.SetHttpdRestart(true);
    EXPECT_TRUE(response.IsEnableOutput());
    response.SetEnableOutput(false);
    EXPECT_TRUE(response.GetHttpdRestart());
    EXPECT_EQ(response.GetBody(), Json::Value(Json::objectValue));
    EXPECT_EQ(response.GetHeaders().size(), 1u);
}

}  // namespace
