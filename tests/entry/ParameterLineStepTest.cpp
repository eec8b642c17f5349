#include <functional>
#include <string>

#include "src/base/ErrorCode.h"
#include "tests/entry/EntryTest.h"
#include "tests/support/Json.h"

using support::Parse;

namespace {

class ParameterLineStep : public EntryTest {
  protected:
    // Reads a line into an object and compares result and object.
    static void ExpectLine(const std::string& line, bool result, const char* expected,
                           const char* before = "{}") {
        Inside({}, [&](ProbeEntry& entry) {
            Json::Value params = Parse(before);
            EXPECT_EQ(entry.DetectAndDecryptParamLine(line, params), result) << line;
            EXPECT_EQ(params, Parse(expected)) << line;
        });
    }
};

TEST_F(ParameterLineStep, DecodesNamesAndValuesAndReadsJSON) {
    ExpectLine("a+b=c%20d&n=7&t=007&l=%5B1%5D&e", true,
               R"({"a b": "c d", "n": 7, "t": "007", "l": [1], "e": ""})");
}

TEST_F(ParameterLineStep, MergesIntoWhatIsThere) {
    ExpectLine("a=2&b=3", true, R"({"a": 2, "b": 3, "c": 4})", R"({"a": 1, "c": 4})");
}

TEST_F(ParameterLineStep, MergesTheLineThatThePlatformDeciphered) {
    fake::Now().decipheredLine = "a=1&b=x";
    ExpectLine("something longer", true, R"({"a": 1, "b": "x"})");
}

TEST_F(ParameterLineStep, NeedsThePlatformsWord) {
    fake::Now().FailCall("TaloCgiDetectAndDecryptParamLine", 1);
    ExpectLine("a=1", false, "{}");
}

TEST_F(ParameterLineStep, NeedsTheMerge) {
    fake::Now().FailCall("strPairToJsonObj", 1);
    ExpectLine("a=1", false, "{}");
    ExpectLine("a=1", false, "[]", "[]");
}

TEST_F(ParameterLineStep, EndsTheLineAtANul) {
    ExpectLine(std::string("a=1\0&b=2", 8), true, R"({"a": 1})");
}

TEST_F(ParameterLineStep, LeavesACarrierWithoutItsCompanion) {
    ExpectLine("a=1&__tXeTrEhPiC=t", true, R"({"a": 1, "__tXeTrEhPiC": "t"})");
    ExpectLine("a=1&__nEkOtReHpIc=t", true, R"({"a": 1, "__nEkOtReHpIc": "t"})");
}

// Nobody may take what an enciphered part held for absent and go on.
TEST_F(ParameterLineStep, RemovesBothCarriersAndFailsWhenTheyHoldNothingReadable) {
    for (const char* values : {"__tXeTrEhPiC=&__nEkOtReHpIc=", "__tXeTrEhPiC=t&__nEkOtReHpIc=",
                               "__tXeTrEhPiC=&__nEkOtReHpIc=t", "__tXeTrEhPiC=7&__nEkOtReHpIc=t",
                               "__tXeTrEhPiC=t&__nEkOtReHpIc=[]"}) {
        ExpectLine(std::string("a=1&") + values, false, R"({"a": 1})");
    }
}

TEST_F(ParameterLineStep, RemovesTheCarriersOfANestedObject) {
    ExpectLine(R"(webapi={"__cIpHeRtExT":"c","__cIpHeRtOkEn":"t","a":1})", true,
               R"({"webapi": {"a": 1}})");
    ExpectLine(R"(webapi={"__cIpHeRtExT":7,"__cIpHeRtOkEn":{},"a":1})", true,
               R"({"webapi": {"a": 1}})");
}

TEST_F(ParameterLineStep, LooksAtANestedObjectForItsCipherTextOnly) {
    ExpectLine(R"(webapi={"__cIpHeRtOkEn":"t"})", true, R"({"webapi": {"__cIpHeRtOkEn": "t"}})");
    ExpectLine(R"(webapi={"__tXeTrEhPiC":"t","__nEkOtReHpIc":"t"})", true,
               R"({"webapi": {"__tXeTrEhPiC": "t", "__nEkOtReHpIc": "t"}})");
}

TEST_F(ParameterLineStep, TakesANestedNonObjectForAPlainParameter) {
    ExpectLine("webapi=[1]", true, R"({"webapi": [1]})");
    ExpectLine("webapi=text", true, R"({"webapi": "text"})");
    ExpectLine("webapi=null", true, R"({"webapi": null})");
}

TEST_F(ParameterLineStep, NeverLetsACarrierReachTheMethod) {
    const Reply reply = Serve(GetMethod("echo",
                                        "&__cIpHeRtExT=c&webapi={%22__cIpHeRtExT%22:%22c%22,"
                                        "%22__cIpHeRtOkEn%22:%22t%22}"));
    ASSERT_EQ(reply.Code(), 0) << reply.output;
    EXPECT_EQ(reply.bodyText.find("__"), std::string::npos) << reply.bodyText;
}

TEST_F(ParameterLineStep, AnswersAnEncipheredBodyThatCannotBeReadWith101) {
    const Reply reply =
        Serve(Post("api=Test.Entry&version=1&method=echo&__tXeTrEhPiC=&__nEkOtReHpIc="));
    EXPECT_EQ(reply.Code(), TALO::kErrorBadRequest);
}

}  // namespace
