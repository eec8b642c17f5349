#include <string>
#include <vector>

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
    ExpectLine("sealed:a=1&b=x", true, R"({"a": 1, "b": "x"})");
    ExpectLine("sealed:a+b=%5B1%5D", true, R"({"a b": [1]})");
    ExpectLine("sealed:a=2", true, R"({"a": 2, "c": 3})", R"({"a": 1, "c": 3})");
    ExpectLine("sealed:", true, "{}");
}

TEST_F(ParameterLineStep, GivesThePlatformACopyOfTheLine) {
    Inside({}, [](ProbeEntry& entry) {
        const std::string line = "sealed:a=1";
        Json::Value params(Json::objectValue);
        EXPECT_TRUE(entry.DetectAndDecryptParamLine(line, params));
        EXPECT_EQ(line, "sealed:a=1");
        EXPECT_EQ(fake::Now().detectCalls, std::vector<std::string>{line});
        EXPECT_TRUE(fake::Now().decryptCalls.empty());
    });
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

// A carrier of the appliance's own cipher at the top is left for the request.
TEST_F(ParameterLineStep, ReadsWhatIsUnderATokenOnly) {
    ExpectLine("a=1&__tXeTrEhPiC=under+t:a=2%26b=2&__nEkOtReHpIc=t", true, R"({"a": 2, "b": 2})");
    ExpectLine("__tXeTrEhPiC=under+t:&__nEkOtReHpIc=t", true, "{}");
    ExpectLine("a=1&__cIpHeRtExT=sealed:b=2", true, R"({"a": 1, "__cIpHeRtExT": "sealed:b=2"})");
    ExpectLine("sealed:__tXeTrEhPiC=under+t:b=2&__nEkOtReHpIc=t", true, R"({"b": 2})");
}

TEST_F(ParameterLineStep, ReadsACarrierOfWhatTheObjectHadBefore) {
    ExpectLine("__nEkOtReHpIc=t", true, R"({"b": 2})", R"({"__tXeTrEhPiC": "under t:b=2"})");
}

TEST_F(ParameterLineStep, LeavesACarrierWithoutItsCompanion) {
    ExpectLine("a=1&__tXeTrEhPiC=t", true, R"({"a": 1, "__tXeTrEhPiC": "t"})");
    ExpectLine("a=1&__nEkOtReHpIc=t", true, R"({"a": 1, "__nEkOtReHpIc": "t"})");
}

TEST_F(ParameterLineStep, HasNoTokenStepForAnEmptyObject) {
    Inside({}, [](ProbeEntry& entry) {
        Json::Value params(Json::objectValue);
        EXPECT_TRUE(entry.DetectAndDecryptParamLine("", params));
        EXPECT_EQ(params, Json::Value(Json::objectValue));
        EXPECT_TRUE(fake::Now().keyCalls.empty());
    });
}

// Nobody may take what an enciphered part held for absent and go on.
TEST_F(ParameterLineStep, RemovesBothCarriersAndFailsWhenTheyHoldNothingReadable) {
    for (const char* values :
         {"__tXeTrEhPiC=&__nEkOtReHpIc=", "__tXeTrEhPiC=t&__nEkOtReHpIc=",
          "__tXeTrEhPiC=&__nEkOtReHpIc=t", "__tXeTrEhPiC=7&__nEkOtReHpIc=t",
          "__tXeTrEhPiC=under+t:b=2&__nEkOtReHpIc=[]", "__tXeTrEhPiC=under+u:b=2&__nEkOtReHpIc=t",
          "__tXeTrEhPiC={}&__nEkOtReHpIc=null"}) {
        ExpectLine(std::string("a=1&") + values, false, R"({"a": 1})");
    }
}

TEST_F(ParameterLineStep, FailsWhereverTheTokenStepFails) {
    const struct {
        const char* operation;
        int nth;
    } rows[] = {
        {"TALONdtokenGenerateToken", 1}, {"GetDecryptAESString", 1}, {"strPairToJsonObj", 2}};
    for (const auto& row : rows) {
        fake::Now().failAt = {};
        fake::Now().FailCall(row.operation, row.nth);
        ExpectLine("a=1&__tXeTrEhPiC=under+t:b=2&__nEkOtReHpIc=t&webapi={%22__cIpHeRtExT%22:7}",
                   false, R"({"a": 1, "webapi": {"__cIpHeRtExT": 7}})");
    }
}

TEST_F(ParameterLineStep, LeavesAnEncipheredLineThatItCannotOpen) {
    fake::Now().FailCall("strPairToJsonObj", 1);
    ExpectLine("sealed:a=1", false, R"({"b": 2})", R"({"b": 2})");
    fake::Now().FailCall("TaloCgiDetectAndDecryptParamLine", 1);
    ExpectLine("sealed:a=1", false, R"({"b": 2})", R"({"b": 2})");
}

}  // namespace
