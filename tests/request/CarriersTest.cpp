#include "src/request/Carriers.h"

#include <gtest/gtest.h>

#include "tests/support/Json.h"

using support::Parse;

namespace {

TEST(Carriers, HaveTheirExactNames) {
    EXPECT_STREQ(TALO::kCipherText, "__cIpHeRtExT");
    EXPECT_STREQ(TALO::kCipherToken, "__cIpHeRtOkEn");
    EXPECT_STREQ(TALO::kAESText, "__tXeTrEhPiC");
    EXPECT_STREQ(TALO::kAESToken, "__nEkOtReHpIc");
    EXPECT_STREQ(TALO::kNestedObject, "webapi");
}

TEST(Carriers, AreTakenOutOfTheObjectAsTexts) {
    const struct {
        const char* value;
        const char* text;
    } rows[] = {
        {R"("x")", "x"},
        {R"("")", ""},
        {"5", "5"},
        {"-1", "-1"},
        {"1.5", "1.5"},
        {"true", "true"},
        {"false", "false"},
        {"null", ""},
        {R"(["x"])", ""},
        {R"({"x": "y"})", ""},
        {"[]", ""},
        {"{}", ""},
        {R"("\u0000x")", nullptr},
    };
    for (const auto& row : rows) {
        Json::Value params = Parse(std::string(R"({"a": 1, "carrier": )") + row.value + "}");
        std::string text = "before";
        EXPECT_TRUE(TALO::TakeCarrier(params, "carrier", &text)) << row.value;
        EXPECT_EQ(text, row.text != nullptr ? row.text : std::string("\0x", 2)) << row.value;
        EXPECT_EQ(params, Parse(R"({"a": 1})")) << row.value;
    }
}

TEST(Carriers, ThatAreNotThereLeaveEverythingAsItIs) {
    for (const char* json :
         {"{}", R"({"Carrier": 1})", "[]", R"(["carrier"])", R"("carrier")", "null", "5"}) {
        Json::Value params = Parse(json);
        std::string text = "before";
        EXPECT_FALSE(TALO::TakeCarrier(params, "carrier", &text)) << json;
        EXPECT_EQ(text, "before");
        EXPECT_EQ(params, Parse(json));
    }
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

}  // namespace
