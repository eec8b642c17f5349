#include <gtest/gtest.h>

#include "tests/support/Json.h"
#include "webapi/APIRequest.h"

using support::Parse;
using TALO::APIRequest;

namespace {

int MethodCode(const Json::Value& name) {
    Json::Value document;
    document["environ"]["REQUEST_METHOD"] = name;
    return APIRequest(document).GetRequestMethod();
}

TEST(Environment, KeepsTextsOnly) {
    const APIRequest request(Parse(R"({"environ": {"a": "text", "empty": "", "n": 5, "b": true,
        "null": null, "l": ["x"], "o": {"x": "y"}, "r": 1.5}})"));
    EXPECT_EQ(request.GetEnv("", Json::Value()), Parse(R"({"a": "text", "empty": ""})"));
}

TEST(Environment, GrowsAndOverwrites) {
    APIRequest request(Parse(R"({"environ": {"a": "1", "b": "2"}})"));
    request.InitEnv(Parse(R"({"b": "3", "c": "4"})"));
    EXPECT_EQ(request.GetEnv("", Json::Value()), Parse(R"({"a": "1", "b": "3", "c": "4"})"));
}

TEST(Environment, TakesVariablesAsItAddsThem) {
    APIRequest request(Parse(R"({"environ": {"a": "1", "b": "2"}})"));
    Json::Value variables = Parse(R"({"b": "3", "n": 5, "HTTP_COOKIE": "c=4",
                                      "REQUEST_METHOD": "POST"})");
    request.TakeEnv(&variables);
    EXPECT_EQ(request.GetEnv("", Json::Value()),
              Parse(R"({"a": "1", "b": "3", "HTTP_COOKIE": "c=4", "REQUEST_METHOD": "POST"})"));
    EXPECT_EQ(request.GetCookie("c", ""), "4");
    EXPECT_EQ(request.GetRequestMethod(), 2);
}

TEST(Environment, StaysAsItIsForAnythingButAFilledObject) {
    APIRequest request(Parse(R"({"environ": {"HTTP_COOKIE": "a=1", "REQUEST_METHOD": "GET"}})"));
    request.SetCookie("a", "changed");
    const Json::Value before = request.GetEnv("", Json::Value());
    for (const Json::Value& value : Parse(R"([{}, [], ["a"], null, 5, "text", true])")) {
        request.InitEnv(value);
        EXPECT_EQ(request.GetEnv("", Json::Value()), before);
        EXPECT_EQ(request.GetCookie("a", ""), "changed") << "the cookies are not read again";
        EXPECT_EQ(request.GetRequestMethod(), 1);
    }
}

TEST(Environment, KnowsTheRequestMethod) {
    EXPECT_EQ(MethodCode("GET"), 1);
    EXPECT_EQ(MethodCode("POST"), 2);
    EXPECT_EQ(MethodCode("HEAD"), 3);
}

TEST(Environment, ComparesTheRequestMethodExactly) {
    for (const char* name : {"post", "Get", "head", "PUT", "DELETE", "OPTIONS", "", " GET", "GET ",
                             "GETX", "GE", "POST\n"}) {
        EXPECT_EQ(MethodCode(name), 0) << name;
    }
    EXPECT_EQ(MethodCode(std::string("GET\0", 4)), 0);
    EXPECT_EQ(MethodCode(1), 0);
    EXPECT_EQ(MethodCode(Json::Value()), 0);
    EXPECT_EQ(MethodCode(Parse(R"(["GET"])")), 0);
    EXPECT_EQ(APIRequest(Parse(R"({"environ": {"A": "GET"}})")).GetRequestMethod(), 0);
}

TEST(Environment, KeepsTheMethodCodeForAnUnknownMethod) {
    APIRequest request(Parse(R"({"environ": {"REQUEST_METHOD": "POST"}})"));
    request.InitEnv(Parse(R"({"REQUEST_METHOD": "PATCH"})"));
    EXPECT_EQ(request.GetRequestMethod(), 2);
    EXPECT_EQ(request.GetEnv("REQUEST_METHOD", ""), Json::Value("PATCH"));
    request.InitEnv(Parse(R"({"REQUEST_METHOD": "HEAD"})"));
    EXPECT_EQ(request.GetRequestMethod(), 3);
}

TEST(Environment, ReadsMethodAndCookiesAlsoWhenEveryMemberWasSkipped) {
    APIRequest request(Parse(R"({"environ": {"HTTP_COOKIE": "a=1", "REQUEST_METHOD": "GET"}})"));
    request.SetCookie("a", "changed");
    request.InitEnv(Parse(R"({"n": 5})"));
    EXPECT_EQ(request.GetCookie("a", ""), "1");
    EXPECT_EQ(request.GetRequestMethod(), 1);
}

}  // namespace
