#include <gtest/gtest.h>

#include "src/request/Carriers.h"
#include "tests/request/Private.h"
#include "tests/support/Json.h"

using support::Parse;
using TALO::APIRequest;

namespace {

TEST(Carriers, HaveTheirExactNames) {
    EXPECT_STREQ(TALO::kCipherText, "__cIpHeRtExT");
    EXPECT_STREQ(TALO::kCipherToken, "__cIpHeRtOkEn");
    EXPECT_STREQ(TALO::kAESText, "__tXeTrEhPiC");
    EXPECT_STREQ(TALO::kAESToken, "__nEkOtReHpIc");
    EXPECT_STREQ(TALO::kNestedObject, "webapi");
}

// What the step answers and leaves. No cipher is on board, so a carrier that is
// to be read is a failure.
struct Row {
    const char* name;
    const char* before;
    bool read;
    const char* after;
};

const Row kRows[] = {
    {"nothing", "{}", true, "{}"},
    {"plain parameters", R"({"a": 1, "b": "x"})", true, R"({"a": 1, "b": "x"})"},
    {"names in other case", R"({"__ciphertext": "x", "__CIPHERTEXT": "y"})", true,
     R"({"__ciphertext": "x", "__CIPHERTEXT": "y"})"},
    {"whole line", R"({"__cIpHeRtExT": "x", "a": 1})", false, R"({"a": 1})"},
    {"only a whole line", R"({"__cIpHeRtExT": "x"})", false, "{}"},
    {"empty whole line", R"({"__cIpHeRtExT": "", "a": 1})", false, R"({"a": 1})"},
    {"whole line that is a number", R"({"__cIpHeRtExT": 5, "a": 1})", false, R"({"a": 1})"},
    {"whole line that is null", R"({"__cIpHeRtExT": null, "a": 1})", false, R"({"a": 1})"},
    {"whole line that is an object", R"({"__cIpHeRtExT": {"b": 1}, "a": 1})", false, R"({"a": 1})"},
    {"text and token", R"({"__tXeTrEhPiC": "x", "__nEkOtReHpIc": "y", "a": 1})", false,
     R"({"a": 1})"},
    {"text and empty token", R"({"__tXeTrEhPiC": "x", "__nEkOtReHpIc": "", "a": 1})", false,
     R"({"a": 1})"},
    {"empty text and token", R"({"__tXeTrEhPiC": "", "__nEkOtReHpIc": "y", "a": 1})", false,
     R"({"a": 1})"},
    {"text and token that are no texts", R"({"__tXeTrEhPiC": [1], "__nEkOtReHpIc": 5, "a": 1})",
     false, R"({"a": 1})"},
    {"text without a token", R"({"__tXeTrEhPiC": "x", "a": 1})", true,
     R"({"__tXeTrEhPiC": "x", "a": 1})"},
    {"token without a text", R"({"__nEkOtReHpIc": "y", "a": 1})", true,
     R"({"__nEkOtReHpIc": "y", "a": 1})"},
    {"nested whole line", R"({"a": 1, "webapi": {"__cIpHeRtExT": "x", "b": 2}})", false,
     R"({"a": 1, "webapi": {"b": 2}})"},
    {"nested text and token", R"({"webapi": {"__tXeTrEhPiC": "x", "__nEkOtReHpIc": "y", "b": 2}})",
     false, R"({"webapi": {"b": 2}})"},
    {"nested twice", R"({"webapi": {"webapi": {"__cIpHeRtExT": "x", "b": 2}}})", false,
     R"({"webapi": {"webapi": {"b": 2}}})"},
    {"nested plain", R"({"webapi": {"b": 2}})", true, R"({"webapi": {"b": 2}})"},
    {"nested empty", R"({"webapi": {}})", true, R"({"webapi": {}})"},
    {"nested text without a token", R"({"webapi": {"__tXeTrEhPiC": "x"}})", true,
     R"({"webapi": {"__tXeTrEhPiC": "x"}})"},
    {"webapi that is a text", R"({"webapi": "__cIpHeRtExT"})", true,
     R"({"webapi": "__cIpHeRtExT"})"},
    {"webapi that is an array", R"({"webapi": ["__cIpHeRtExT"]})", true,
     R"({"webapi": ["__cIpHeRtExT"]})"},
    {"webapi that is null", R"({"webapi": null})", true, R"({"webapi": null})"},
    {"another nested object", R"({"other": {"__cIpHeRtExT": "x"}})", true,
     R"({"other": {"__cIpHeRtExT": "x"}})"},
    {"no object: null", "null", true, "null"},
    {"no object: array", R"(["__cIpHeRtExT"])", true, R"(["__cIpHeRtExT"])"},
    {"no object: text", R"("__cIpHeRtExT")", true, R"("__cIpHeRtExT")"},
};

TEST(DecryptParam, RemovesTheCarriersThatItReads) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        const APIRequest request((Json::Value()));
        Json::Value params = Parse(row.before);
        EXPECT_EQ(PrivateOf(request)->DecryptParam(params), row.read);
        EXPECT_EQ(params, Parse(row.after));
    }
}

TEST(DecryptParam, ReadsNeitherWholeLinesNorNestedObjectsInTheTokenStep) {
    const APIRequest request((Json::Value()));
    const char* const kUntouched[] = {"{}", R"({"__cIpHeRtExT": "x"})", R"({"__tXeTrEhPiC": "x"})",
                                      R"({"__nEkOtReHpIc": "y"})",
                                      R"({"webapi": {"__tXeTrEhPiC": "x", "__nEkOtReHpIc": "y"}})"};
    for (const char* json : kUntouched) {
        Json::Value params = Parse(json);
        EXPECT_TRUE(PrivateOf(request)->DecryptAESParam(params)) << json;
        EXPECT_EQ(params, Parse(json));
    }
}

TEST(DecryptParam, RemovesTextAndTokenInTheTokenStep) {
    const APIRequest request((Json::Value()));
    for (const char* json : {R"({"__tXeTrEhPiC": "x", "__nEkOtReHpIc": "", "a": 1})",
                             R"({"__tXeTrEhPiC": "", "__nEkOtReHpIc": "y", "a": 1})"}) {
        Json::Value params = Parse(json);
        EXPECT_FALSE(PrivateOf(request)->DecryptAESParam(params)) << json;
        EXPECT_EQ(params, Parse(R"({"a": 1})"));
    }
}

TEST(DecryptParam, LetsTheOtherParametersThroughWhenItFails) {
    const APIRequest request(Parse(R"({
        "getParam": {"__cIpHeRtExT": "x", "api": "TALO.System", "version": 1, "a": 1},
        "postParam": {"__tXeTrEhPiC": "x", "__nEkOtReHpIc": "y", "method": "ping", "b": 2,
                      "webapi": 5}})"));
    EXPECT_EQ(request.GetParam("", Json::Value()),
              Parse(R"({"api": "TALO.System", "version": 1, "method": "ping", "a": 1, "b": 2,
                        "webapi": 5})"));
    EXPECT_EQ(request.GetAPIClass(), "TALO.System");
    EXPECT_EQ(request.GetAPIMethod(), "ping");
}

TEST(DecryptParam, LooksIntoQueryAndBodyApart) {
    const APIRequest request(Parse(R"({"getParam": {"__tXeTrEhPiC": "x"},
                                       "postParam": {"__nEkOtReHpIc": "y"}})"));
    EXPECT_EQ(request.GetParam("", Json::Value()),
              Parse(R"({"__tXeTrEhPiC": "x", "__nEkOtReHpIc": "y"})"));
}

TEST(NestedObject, IsFoundOnlyWhereItIsAnObject) {
    Json::Value params = Parse(R"({"webapi": {"a": 1}})");
    EXPECT_EQ(TALO::NestedObject(params), &params["webapi"]);
    for (const char* json : {"{}", R"({"webapi": null})", R"({"webapi": "a"})",
                             R"({"webapi": [1]})", R"({"webapi": 5})", "null", "[]"}) {
        Json::Value other = Parse(json);
        EXPECT_EQ(TALO::NestedObject(other), nullptr) << json;
        EXPECT_EQ(other, Parse(json)) << "looking inserts nothing";
    }
}

TEST(Carriers, AreTakenOutOfTheObject) {
    std::string text = "before";
    Json::Value params = Parse(R"({"carrier": "x", "number": 5, "null": null})");
    EXPECT_EQ(TALO::TakeCarrier(params, "none", &text), TALO::Carrier::kAbsent);
    EXPECT_EQ(text, "before");
    EXPECT_EQ(TALO::TakeCarrier(params, "number", &text), TALO::Carrier::kUnreadable);
    EXPECT_EQ(TALO::TakeCarrier(params, "null", &text), TALO::Carrier::kUnreadable);
    EXPECT_EQ(text, "before") << "stays untouched on failure";
    EXPECT_EQ(TALO::TakeCarrier(params, "carrier", &text), TALO::Carrier::kText);
    EXPECT_EQ(text, "x");
    EXPECT_EQ(params, Json::Value(Json::objectValue));
    Json::Value array(Json::arrayValue);
    EXPECT_EQ(TALO::TakeCarrier(array, "carrier", &text), TALO::Carrier::kAbsent);
}

}  // namespace
