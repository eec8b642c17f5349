#include <gtest/gtest.h>

#include "tests/fake/FakePlatform.h"
#include "tests/request/Private.h"
#include "tests/support/Json.h"

using support::Parse;
using TALO::APIRequest;

namespace {

class DecryptAESParam : public ::testing::Test {
  protected:
    DecryptAESParam() {
        fake::Reset();
    }
    ~DecryptAESParam() override {
        fake::Reset();
    }

    static void Expect(const char* before, bool result, const char* after) {
        const APIRequest request((Json::Value()));
        Json::Value params = Parse(before);
        EXPECT_EQ(PrivateOf(request)->DecryptAESParam(params), result) << before;
        EXPECT_EQ(params, Parse(after)) << before;
    }
};

TEST_F(DecryptAESParam, HasNothingToDoWithoutBothCarriers) {
    for (const char* json :
         {"{}", "null", R"({"a": 1})", R"({"__tXeTrEhPiC": "under t:b=2"})",
          R"({"__nEkOtReHpIc": "t"})", R"({"__cIpHeRtExT": "sealed:b=2"})",
          R"({"__nEkOtReHpIc": "t", "__txetrehpic": "under t:b=2"})",
          R"({"webapi": {"__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t"}})"}) {
        Expect(json, true, json);
    }
    EXPECT_TRUE(fake::Now().journal.empty());
}

TEST_F(DecryptAESParam, AsksForNoKeyWithoutATokenOrAText) {
    Expect(R"({"__tXeTrEhPiC": "under :b=2", "__nEkOtReHpIc": "", "a": 1})", false, R"({"a": 1})");
    Expect(R"({"__tXeTrEhPiC": "", "__nEkOtReHpIc": "t", "a": 1})", false, R"({"a": 1})");
    EXPECT_TRUE(fake::Now().journal.empty());
}

TEST_F(DecryptAESParam, DerivesTheKeyIntoAZeroedBufferOf33Bytes) {
    Expect(R"({"__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t"})", true, R"({"b": 2})");
    ASSERT_EQ(fake::Now().keyCalls.size(), 1u);
    EXPECT_EQ(fake::Now().keyCalls[0].token, "t");
    EXPECT_EQ(fake::Now().keyCalls[0].size, 33u);
    EXPECT_TRUE(fake::Now().keyCalls[0].bufferWasZero);
}

TEST_F(DecryptAESParam, DeciphersTheTextWithThatKey) {
    Expect(R"({"__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t"})", true, R"({"b": 2})");
    ASSERT_EQ(fake::Now().textCalls.size(), 1u);
    EXPECT_EQ(fake::Now().textCalls[0].first, "key of t");
    EXPECT_EQ(fake::Now().textCalls[0].second, "under t:b=2");
}

TEST_F(DecryptAESParam, TakesAKeyOf32Characters) {
    const std::string token(40, 't');
    Json::Value params(Json::objectValue);
    params["__nEkOtReHpIc"] = token;
    params["__tXeTrEhPiC"] = "under " + token + ":b=2";
    const APIRequest request((Json::Value()));
    EXPECT_TRUE(PrivateOf(request)->DecryptAESParam(params));
    EXPECT_EQ(params, Parse(R"({"b": 2})"));
    EXPECT_EQ(fake::Now().textCalls[0].first.size(), 32u);
}

TEST_F(DecryptAESParam, TakesEveryAnswerButANegativeOneForAKey) {
    for (const int answer : {0, 1, 32}) {
        fake::Reset();
        fake::Now().keyResult = answer;
        Expect(R"({"__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t"})", true, R"({"b": 2})");
    }
    fake::Reset();
    fake::Now().keyResult = -2;
    Expect(R"({"__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t"})", false, "{}");
    EXPECT_TRUE(fake::Now().textCalls.empty());
}

TEST_F(DecryptAESParam, RemovesBothCarriersWhateverFails) {
    for (const char* operation :
         {"TALONdtokenGenerateToken", "GetDecryptAESString", "strPairToJsonObj"}) {
        fake::Reset();
        fake::Now().FailCall(operation, 1);
        Expect(R"({"__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t", "a": 1})", false,
               R"({"a": 1})");
        EXPECT_EQ(fake::Now().journal.back(), operation);
    }
}

}  // namespace
