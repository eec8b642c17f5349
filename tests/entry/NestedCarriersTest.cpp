#include <string>
#include <vector>

#include "tests/entry/EntryTest.h"
#include "tests/support/Json.h"

using support::Parse;

namespace {

// What the entry does with the carriers of a "webapi" object, and the operation
// that does it.
class NestedCarriers : public EntryTest {
  protected:
    // The nested object that a line with that one leaves; the line's result.
    static void ExpectNested(const std::string& before, const char* after, bool result = true) {
        Inside({}, [&](ProbeEntry& entry) {
            Json::Value params = Parse(R"({"a": 1, "webapi": )" + before + "}");
            EXPECT_EQ(entry.DetectAndDecryptParamLine("b=2", params), result) << before;
            EXPECT_EQ(params["webapi"], Parse(after)) << before;
            EXPECT_EQ(params["a"], 1);
            EXPECT_EQ(params["b"], 2);
        });
    }

    static void ExpectText(const std::string& text, bool result, const char* after,
                           const char* before = "{}") {
        Inside({}, [&](ProbeEntry& entry) {
            Json::Value params = Parse(before);
            EXPECT_EQ(entry.DecryptParam(text, params), result) << text;
            EXPECT_EQ(params, Parse(after)) << text;
        });
    }
};

const struct {
    const char* name;
    const char* before;
    const char* after;
} kRows[] = {
    {"line", R"({"__cIpHeRtExT": "sealed:c=3"})", R"({"c": 3})"},
    {"line with its companion", R"({"__cIpHeRtExT": "sealed:c=3", "__cIpHeRtOkEn": "t", "d": 4})",
     R"({"c": 3, "d": 4})"},
    {"line that replaces a plain parameter", R"({"__cIpHeRtExT": "sealed:c=3", "c": 1})",
     R"({"c": 3})"},
    {"line that is empty", R"({"__cIpHeRtExT": "sealed:", "__cIpHeRtOkEn": "t"})", "{}"},
    {"line that brings the companion", R"({"__cIpHeRtExT": "sealed:c=3&__cIpHeRtOkEn=t"})",
     R"({"c": 3})"},
    {"line that brings a text and its token",
     R"({"__cIpHeRtExT": "sealed:__tXeTrEhPiC=under+t:c=3&__nEkOtReHpIc=t"})", R"({"c": 3})"},
    {"line beside a text and its token",
     R"({"__cIpHeRtExT": "sealed:c=3", "__tXeTrEhPiC": "under t:d=4", "__nEkOtReHpIc": "t"})",
     R"({"c": 3, "d": 4})"},
    {"line beside a text that cannot be opened",
     R"({"__cIpHeRtExT": "sealed:c=3", "__cIpHeRtOkEn": "t", "__tXeTrEhPiC": "x",
         "__nEkOtReHpIc": "t"})",
     R"({"c": 3})"},
    {"line that brings another", R"({"__cIpHeRtExT": "sealed:c=3&__cIpHeRtExT=sealed:d=4"})",
     R"({"c": 3, "__cIpHeRtExT": "sealed:d=4"})"},
    {"line that cannot be opened", R"({"__cIpHeRtExT": "x", "__cIpHeRtOkEn": "t", "c": 3})",
     R"({"c": 3})"},
    {"empty text", R"({"__cIpHeRtExT": "", "__cIpHeRtOkEn": "t", "c": 3})", R"({"c": 3})"},
    {"no texts", R"({"__cIpHeRtExT": 7, "__cIpHeRtOkEn": {}, "c": 3})", R"({"c": 3})"},
    {"null", R"({"__cIpHeRtExT": null, "__cIpHeRtOkEn": null, "c": 3})", R"({"c": 3})"},
    {"a failing line leaves text and token alone",
     R"({"__cIpHeRtExT": "x", "__tXeTrEhPiC": "under t:c=3", "__nEkOtReHpIc": "t"})",
     R"({"__tXeTrEhPiC": "under t:c=3", "__nEkOtReHpIc": "t"})"},
    {"the companion alone", R"({"__cIpHeRtOkEn": "t"})", R"({"__cIpHeRtOkEn": "t"})"},
    {"text and token alone", R"({"__tXeTrEhPiC": "under t:c=3", "__nEkOtReHpIc": "t"})",
     R"({"__tXeTrEhPiC": "under t:c=3", "__nEkOtReHpIc": "t"})"},
    {"one level further down", R"({"webapi": {"__cIpHeRtExT": "sealed:c=3"}})",
     R"({"webapi": {"__cIpHeRtExT": "sealed:c=3"}})"},
    {"a text", R"("__cIpHeRtExT")", R"("__cIpHeRtExT")"},
    {"an array", R"([{"__cIpHeRtExT": "sealed:c=3"}])", R"([{"__cIpHeRtExT": "sealed:c=3"}])"},
    {"null instead of an object", "null", "null"},
    {"empty", "{}", "{}"},
};

TEST_F(NestedCarriers, AreReadForTheLineUnderTheAppliancesCipherOnly) {
    for (const auto& row : kRows) {
        SCOPED_TRACE(row.name);
        ExpectNested(row.before, row.after);
    }
}

TEST_F(NestedCarriers, NeverFailTheLine) {
    for (const char* operation :
         {"TaloCgiDecryptParam", "TALONdtokenGenerateToken", "GetDecryptAESString"}) {
        fake::Now().failAt = {};
        fake::Now().FailCall(operation, 1);
        ExpectNested(R"({"__cIpHeRtExT": "sealed:__tXeTrEhPiC=under+t:c=3&__nEkOtReHpIc=t",
                         "__cIpHeRtOkEn": "t"})",
                     "{}");
    }
    fake::Now().failAt = {};
    fake::Now().FailCall("strPairToJsonObj", 2);
    ExpectNested(R"({"__cIpHeRtExT": "sealed:c=3", "__cIpHeRtOkEn": "t"})", "{}");
}

TEST_F(NestedCarriers, AreNotReadWhenTheTokenStepOfTheLineFails) {
    Inside({}, [](ProbeEntry& entry) {
        Json::Value params = Parse(R"({"webapi": {"__cIpHeRtExT": "sealed:c=3"}})");
        EXPECT_FALSE(entry.DetectAndDecryptParamLine("__tXeTrEhPiC=x&__nEkOtReHpIc=t", params));
        EXPECT_EQ(params, Parse(R"({"webapi": {"__cIpHeRtExT": "sealed:c=3"}})"));
    });
}

TEST_F(NestedCarriers, OfAnObjectThatALineBringsAreRead) {
    Inside({}, [](ProbeEntry& entry) {
        Json::Value params(Json::objectValue);
        EXPECT_TRUE(entry.DetectAndDecryptParamLine(
            R"(sealed:webapi={"__cIpHeRtExT":"sealed:c=3","__cIpHeRtOkEn":"t"})", params));
        EXPECT_EQ(params, Parse(R"({"webapi": {"c": 3}})"));
        params = Json::Value(Json::objectValue);
        EXPECT_TRUE(entry.DetectAndDecryptParamLine(
            R"(__nEkOtReHpIc=t&__tXeTrEhPiC=under+t:webapi={"__cIpHeRtExT":"sealed:d=4"})",
            params));
        EXPECT_EQ(params, Parse(R"({"webapi": {"d": 4}})"));
    });
}

TEST_F(NestedCarriers, GoDecipheredIntoTheObject) {
    ExpectText("sealed:a=2&b=%5B%5D", true, R"({"a": 2, "b": []})", R"({"a": 1})");
    ExpectText("sealed:", true, "{}");
    ExpectText("sealed:__tXeTrEhPiC=under+t:b=2&__nEkOtReHpIc=t", true, R"({"b": 2})");
    ExpectText("sealed:__tXeTrEhPiC=x&__nEkOtReHpIc=t", false, R"({"a": 1})", R"({"a": 1})");
    ExpectText("sealed:a=1&__tXeTrEhPiC=x", true, R"({"a": 1, "__tXeTrEhPiC": "x"})");
    ExpectText("x", false, R"({"a": 1})", R"({"a": 1})");
    ExpectText("", false, "{}");
    ExpectText("a=1", false, "{}");
    ExpectText("sealed:a=1", false, "[]", "[]");
}

TEST_F(NestedCarriers, AreGivenToThePlatformAsACopy) {
    Inside({}, [](ProbeEntry& entry) {
        const std::string text = "sealed:a=1";
        Json::Value params(Json::objectValue);
        EXPECT_TRUE(entry.DecryptParam(text, params));
        EXPECT_EQ(text, "sealed:a=1");
        EXPECT_EQ(fake::Now().decryptCalls, std::vector<std::string>{text});
        EXPECT_TRUE(fake::Now().detectCalls.empty());
    });
}

TEST_F(NestedCarriers, HaveTheTokenStepOfTheRequest) {
    Inside({}, [](ProbeEntry& entry) {
        Json::Value params = Parse(R"({"__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t"})");
        EXPECT_TRUE(entry.DecryptAESParam(params));
        EXPECT_EQ(params, Parse(R"({"b": 2})"));
        ASSERT_EQ(fake::Now().keyCalls.size(), 1u);
        EXPECT_EQ(fake::Now().keyCalls[0].size, 33u);
        EXPECT_TRUE(fake::Now().keyCalls[0].bufferWasZero);
        params = Parse(R"({"__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "", "a": 1})");
        EXPECT_FALSE(entry.DecryptAESParam(params));
        EXPECT_EQ(params, Parse(R"({"a": 1})"));
        params = Parse(R"({"__tXeTrEhPiC": "under t:b=2"})");
        EXPECT_TRUE(entry.DecryptAESParam(params));
        EXPECT_EQ(params, Parse(R"({"__tXeTrEhPiC": "under t:b=2"})"));
        params = Json::Value(Json::objectValue);
        EXPECT_TRUE(entry.DecryptAESParam(params));
        EXPECT_EQ(params, Json::Value(Json::objectValue));
    });
}

}  // namespace
