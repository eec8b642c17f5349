#include <gtest/gtest.h>

#include "tests/support/Json.h"
#include "webapi/APIRequest.h"

using support::Parse;
using TALO::APIRequest;

namespace {

Json::Value All(const APIRequest& request) {
    return request.GetParam("", Json::Value("no parameters at all"));
}

TEST(Parameters, MergeQueryAndBodySoThatTheBodyWins) {
    const APIRequest request(Parse(R"({"postParam": {"both": "body", "b": 2},
                                       "getParam": {"both": "query", "a": 1}})"));
    EXPECT_EQ(All(request), Parse(R"({"a": 1, "b": 2, "both": "body"})"));
}

TEST(Parameters, KeepEveryType) {
    const Json::Value params =
        Parse(R"({"n": null, "i": 5, "r": 1.5, "b": false, "s": "5", "l": [1], "o": {"a": {}}})");
    Json::Value document;
    document["getParam"] = params;
    EXPECT_EQ(All(APIRequest(document)), params);
}

TEST(Parameters, LetANullOfTheBodyReplaceTheQuery) {
    const APIRequest request(Parse(R"({"getParam": {"a": 1}, "postParam": {"a": null}})"));
    EXPECT_TRUE(request.HasParam("a"));
    EXPECT_EQ(request.GetParam("a", "none"), Json::Value());
}

TEST(Parameters, GrowWithoutClear) {
    APIRequest request(Parse(R"({"getParam": {"a": 1, "b": 2}})"));
    request.InitParam(Parse(R"({"getParam": {"b": 3}, "postParam": {"c": 4}})"), false);
    EXPECT_EQ(All(request), Parse(R"({"a": 1, "b": 3, "c": 4})"));
}

TEST(Parameters, AreReplacedWithClear) {
    APIRequest request(Parse(R"({"getParam": {"a": 1, "b": 2}})"));
    request.InitParam(Parse(R"({"getParam": {"b": 3}, "postParam": {"c": 4}})"), true);
    EXPECT_EQ(All(request), Parse(R"({"b": 3, "c": 4})"));
}

TEST(Parameters, AreEmptiedByADocumentWithoutAny) {
    for (const char* document : {"{}", "null", "[]", R"("text")", R"({"environ": {"a": "1"}})",
                                 R"({"getParam": 5})", R"({"getParam": null, "postParam": []})"}) {
        APIRequest request(Parse(R"({"getParam": {"a": 1}})"));
        request.InitParam(Parse(document), false);
        EXPECT_EQ(All(request), Parse(R"({"a": 1})")) << document;
        request.InitParam(Parse(document), true);
        EXPECT_EQ(All(request), Json::Value(Json::objectValue)) << document;
    }
}

TEST(Parameters, KeepTheBodyWhenTheQueryIsNoObject) {
    for (const char* query : {"null", "[]", "[1]", "5", R"("text")", "{}"}) {
        Json::Value document = Parse(R"({"postParam": {"a": 1, "api": "X"}})");
        document["getParam"] = Parse(query);
        const APIRequest request(document);
        EXPECT_EQ(All(request), Parse(R"({"a": 1, "api": "X"})")) << query;
        EXPECT_EQ(request.GetAPIClass(), "X");
    }
}

TEST(Parameters, MayBeReplacedByAPartOfThemselves) {
    APIRequest request(Parse(R"({"getParam": {"inner":
        {"getParam": {"api": "TALO.Inner", "inner": 1}, "postParam": {"version": 2, "b": 3}}}})"));
    request.InitParam(request.GetParamRef("inner", Json::Value::nullSingleton()), true);
    EXPECT_EQ(All(request), Parse(R"({"api": "TALO.Inner", "inner": 1, "version": 2, "b": 3})"));
    EXPECT_EQ(request.GetAPIClass(), "TALO.Inner");
    EXPECT_EQ(request.GetAPIVersion(), 2);
}

TEST(Parameters, MayGrowByAPartOfThemselves) {
    APIRequest request(Parse(R"({"getParam": {"inner":
        {"getParam": {"inner": 1}, "postParam": {"b": 3}}}})"));
    request.InitParam(request.GetParamRef("inner", Json::Value::nullSingleton()), false);
    EXPECT_EQ(All(request), Parse(R"({"inner": 1, "b": 3})"));
}

TEST(Parameters, TouchNeitherEnvironmentNorSession) {
    APIRequest request(Parse(R"({"environ": {"A": "1"}, "session": {"username": "mia"}})"));
    request.InitParam(Parse(R"({"environ": {"A": "2"}, "session": {"username": "eve"},
        "reqLib": {"a": 1}, "getParam": {"p": 1}})"),
                      true);
    EXPECT_EQ(request.GetEnv("A", ""), Json::Value("1"));
    EXPECT_EQ(request.GetLoginUserName(), "mia");
    EXPECT_EQ(request.GetAPIInfo("", Json::Value()), Json::Value(Json::objectValue));
}

}  // namespace
