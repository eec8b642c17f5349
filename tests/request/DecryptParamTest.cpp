#include <gtest/gtest.h>

#include "tests/fake/FakePlatform.h"
#include "tests/request/Private.h"
#include "tests/support/Json.h"

using support::Parse;
using TALO::APIRequest;

namespace {

class DecryptParam : public ::testing::Test {
  protected:
    DecryptParam() {
        fake::Reset();
    }
    ~DecryptParam() override {
        fake::Reset();
    }

    // Runs the whole step on its own and compares its answer and what it leaves.
    static void Expect(const char* before, bool result, const char* after) {
        const APIRequest request((Json::Value()));
        Json::Value params = Parse(before);
        EXPECT_EQ(PrivateOf(request)->DecryptParam(params), result) << before;
        EXPECT_EQ(params, Parse(after)) << before;
    }
};

// Before, whether the step succeeds, and after. "sealed:LINE" and "under TOKEN:LINE"
// are what the ciphers open.
struct Row {
    const char* name;
    const char* before;
    bool result;
    const char* after;
};

const Row kRows[] = {
    // Nothing to do.
    {"nothing", "{}", true, "{}"},
    {"plain parameters", R"({"a": 1, "b": "x"})", true, R"({"a": 1, "b": "x"})"},
    {"names in other case", R"({"__ciphertext": "sealed:b=2", "__CIPHERTEXT": "sealed:b=2"})", true,
     R"({"__ciphertext": "sealed:b=2", "__CIPHERTEXT": "sealed:b=2"})"},
    {"no object: null", "null", true, "null"},
    {"no object: array", R"(["__cIpHeRtExT"])", true, R"(["__cIpHeRtExT"])"},
    {"no object: text", R"("__cIpHeRtExT")", true, R"("__cIpHeRtExT")"},
    {"the companion of a whole line alone", R"({"__cIpHeRtOkEn": "t"})", true,
     R"({"__cIpHeRtOkEn": "t"})"},

    // A line under the appliance's own cipher.
    {"line", R"({"__cIpHeRtExT": "sealed:b=2&c=x"})", true, R"({"b": 2, "c": "x"})"},
    {"line beside plain parameters", R"({"__cIpHeRtExT": "sealed:b=2", "a": 1})", true,
     R"({"a": 1, "b": 2})"},
    {"line that replaces a plain parameter", R"({"__cIpHeRtExT": "sealed:a=2", "a": 1})", true,
     R"({"a": 2})"},
    {"line that is decoded", R"({"__cIpHeRtExT": "sealed:a+b=%5B1%5D&c=%2541"})", true,
     R"({"a b": [1], "c": "%41"})"},
    {"line that is an object", R"({"__cIpHeRtExT": "sealed:{\"b\": {\"c\": 1}}", "a": 1})", true,
     R"({"a": 1, "b": {"c": 1}})"},
    {"empty line", R"({"__cIpHeRtExT": "sealed:", "a": 1})", true, R"({"a": 1})"},
    {"empty line and nothing else", R"({"__cIpHeRtExT": "sealed:"})", true, "{}"},
    {"line that cannot be opened", R"({"__cIpHeRtExT": "x", "a": 1})", false, R"({"a": 1})"},
    {"only a line that cannot be opened", R"({"__cIpHeRtExT": "x"})", false, "{}"},
    {"empty text", R"({"__cIpHeRtExT": "", "a": 1})", false, R"({"a": 1})"},
    {"number", R"({"__cIpHeRtExT": 5, "a": 1})", false, R"({"a": 1})"},
    {"null", R"({"__cIpHeRtExT": null, "a": 1})", false, R"({"a": 1})"},
    {"array", R"({"__cIpHeRtExT": ["sealed:b=2"], "a": 1})", false, R"({"a": 1})"},
    {"object", R"({"__cIpHeRtExT": {"b": 1}, "a": 1})", false, R"({"a": 1})"},
    {"the companion stays", R"({"__cIpHeRtExT": "sealed:b=2", "__cIpHeRtOkEn": "t"})", true,
     R"({"b": 2, "__cIpHeRtOkEn": "t"})"},

    // A line under the key of a token.
    {"text and token", R"({"__tXeTrEhPiC": "under t:b=2&c=x", "__nEkOtReHpIc": "t"})", true,
     R"({"b": 2, "c": "x"})"},
    {"text and token beside plain parameters",
     R"({"__tXeTrEhPiC": "under t:a=2", "__nEkOtReHpIc": "t", "a": 1, "b": 1})", true,
     R"({"a": 2, "b": 1})"},
    {"text and token that decode",
     R"({"__tXeTrEhPiC": "under t:a+b=%7B%7D", "__nEkOtReHpIc": "t"})", true, R"({"a b": {}})"},
    {"text under another token", R"({"__tXeTrEhPiC": "under u:b=2", "__nEkOtReHpIc": "t", "a": 1})",
     false, R"({"a": 1})"},
    {"text that cannot be opened", R"({"__tXeTrEhPiC": "x", "__nEkOtReHpIc": "t", "a": 1})", false,
     R"({"a": 1})"},
    {"text and empty token", R"({"__tXeTrEhPiC": "x", "__nEkOtReHpIc": "", "a": 1})", false,
     R"({"a": 1})"},
    {"empty text and token", R"({"__tXeTrEhPiC": "", "__nEkOtReHpIc": "t", "a": 1})", false,
     R"({"a": 1})"},
    {"both empty", R"({"__tXeTrEhPiC": "", "__nEkOtReHpIc": ""})", false, "{}"},
    {"token that is a number", R"({"__tXeTrEhPiC": "under 5:b=2", "__nEkOtReHpIc": 5})", true,
     R"({"b": 2})"},
    {"token that is null", R"({"__tXeTrEhPiC": "under :b=2", "__nEkOtReHpIc": null})", false, "{}"},
    {"token and text of other types", R"({"__tXeTrEhPiC": [1], "__nEkOtReHpIc": {"t": 1}})", false,
     "{}"},
    {"text without a token", R"({"__tXeTrEhPiC": "under t:b=2", "a": 1})", true,
     R"({"__tXeTrEhPiC": "under t:b=2", "a": 1})"},
    {"token without a text", R"({"__nEkOtReHpIc": "t", "a": 1})", true,
     R"({"__nEkOtReHpIc": "t", "a": 1})"},

    // One after the other.
    {"both kinds, the token's later",
     R"({"__cIpHeRtExT": "sealed:a=2&b=2", "__tXeTrEhPiC": "under t:a=3",
         "__nEkOtReHpIc": "t", "a": 1})",
     true, R"({"a": 3, "b": 2})"},
    {"line that holds a text and its token",
     R"({"__cIpHeRtExT": "sealed:b=2&__tXeTrEhPiC=under+t:c=3&__nEkOtReHpIc=t", "a": 1})", true,
     R"({"a": 1, "b": 2, "c": 3})"},
    {"line that holds the token of a plain text",
     R"({"__cIpHeRtExT": "sealed:__nEkOtReHpIc=t", "__tXeTrEhPiC": "under t:c=3"})", true,
     R"({"c": 3})"},
    {"line that holds another text: one of a kind is read",
     R"({"__cIpHeRtExT": "sealed:b=2&__cIpHeRtExT=sealed:c=3"})", true,
     R"({"b": 2, "__cIpHeRtExT": "sealed:c=3"})"},
    {"text that holds another: one of a kind is read",
     R"({"__tXeTrEhPiC": "under t:__tXeTrEhPiC=under+u:c=3&__nEkOtReHpIc=u",
         "__nEkOtReHpIc": "t"})",
     true, R"({"__tXeTrEhPiC": "under u:c=3", "__nEkOtReHpIc": "u"})"},
    {"line fails: text and token are not read",
     R"({"__cIpHeRtExT": "x", "__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t"})", false,
     R"({"__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t"})"},
    {"text fails: the line's pairs stay",
     R"({"__cIpHeRtExT": "sealed:b=2", "__tXeTrEhPiC": "x", "__nEkOtReHpIc": "t"})", false,
     R"({"b": 2})"},
};

TEST_F(DecryptParam, ReadsTheCarriersOfAnObject) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        fake::Reset();
        Expect(row.before, row.result, row.after);
    }
}

const Row kNestedRows[] = {
    {"plain", R"({"webapi": {"b": 2}})", true, R"({"webapi": {"b": 2}})"},
    {"empty", R"({"webapi": {}})", true, R"({"webapi": {}})"},
    {"line", R"({"a": 1, "webapi": {"__cIpHeRtExT": "sealed:b=2&c=3", "b": 1}})", true,
     R"({"a": 1, "webapi": {"b": 2, "c": 3}})"},
    {"line that is all there is", R"({"webapi": {"__cIpHeRtExT": "sealed:"}})", true,
     R"({"webapi": {}})"},
    {"line with its companion, which stays",
     R"({"webapi": {"__cIpHeRtExT": "sealed:b=2", "__cIpHeRtOkEn": "t"}})", true,
     R"({"webapi": {"b": 2, "__cIpHeRtOkEn": "t"}})"},
    {"text and token",
     R"({"webapi": {"__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t", "b": 1}})", true,
     R"({"webapi": {"b": 2}})"},
    {"text without a token", R"({"webapi": {"__tXeTrEhPiC": "under t:b=2"}})", true,
     R"({"webapi": {"__tXeTrEhPiC": "under t:b=2"}})"},
    {"line that cannot be opened", R"({"a": 1, "webapi": {"__cIpHeRtExT": "x", "b": 2}})", false,
     R"({"a": 1, "webapi": {"b": 2}})"},
    {"text that cannot be opened",
     R"({"webapi": {"__tXeTrEhPiC": "x", "__nEkOtReHpIc": "t", "b": 2}})", false,
     R"({"webapi": {"b": 2}})"},
    {"three levels, each with a carrier",
     R"({"__cIpHeRtExT": "sealed:a=1",
         "webapi": {"__cIpHeRtExT": "sealed:b=2",
                    "webapi": {"__tXeTrEhPiC": "under t:c=3", "__nEkOtReHpIc": "t",
                               "webapi": {"__cIpHeRtExT": "sealed:d=4"}}}})",
     true, R"({"a": 1, "webapi": {"b": 2, "webapi": {"c": 3, "webapi": {"d": 4}}}})"},
    {"the innermost fails",
     R"({"webapi": {"__cIpHeRtExT": "sealed:b=2", "webapi": {"__cIpHeRtExT": "x"}}})", false,
     R"({"webapi": {"b": 2, "webapi": {}}})"},
    {"the outer fails: the inner is not read",
     R"({"__cIpHeRtExT": "x", "webapi": {"__cIpHeRtExT": "sealed:b=2"}})", false,
     R"({"webapi": {"__cIpHeRtExT": "sealed:b=2"}})"},
    {"the outer's text fails: the inner is not read",
     R"({"__tXeTrEhPiC": "x", "__nEkOtReHpIc": "t", "webapi": {"__cIpHeRtExT": "sealed:b=2"}})",
     false, R"({"webapi": {"__cIpHeRtExT": "sealed:b=2"}})"},
    {"object out of a line", R"({"__cIpHeRtExT":
         "sealed:webapi={\"__cIpHeRtExT\":\"sealed:b=2\"}"})",
     true, R"({"webapi": {"b": 2}})"},
    {"object out of a line, in the place of a plain one",
     R"({"__cIpHeRtExT": "sealed:webapi={\"b\":2}", "webapi": {"__cIpHeRtExT": "x"}})", true,
     R"({"webapi": {"b": 2}})"},
    {"object out of a text", R"({"__tXeTrEhPiC":
         "under t:webapi={\"__cIpHeRtExT\":\"sealed:b=2\"}", "__nEkOtReHpIc": "t"})",
     true, R"({"webapi": {"b": 2}})"},
    {"a text", R"({"webapi": "__cIpHeRtExT"})", true, R"({"webapi": "__cIpHeRtExT"})"},
    {"an array", R"({"webapi": [{"__cIpHeRtExT": "sealed:b=2"}]})", true,
     R"({"webapi": [{"__cIpHeRtExT": "sealed:b=2"}]})"},
    {"null", R"({"webapi": null})", true, R"({"webapi": null})"},
    {"another object", R"({"other": {"__cIpHeRtExT": "sealed:b=2"}})", true,
     R"({"other": {"__cIpHeRtExT": "sealed:b=2"}})"},
    {"an object within another", R"({"other": {"webapi": {"__cIpHeRtExT": "sealed:b=2"}}})", true,
     R"({"other": {"webapi": {"__cIpHeRtExT": "sealed:b=2"}}})"},
};

TEST_F(DecryptParam, ReadsTheCarriersOfNestedObjectsAlike) {
    for (const Row& row : kNestedRows) {
        SCOPED_TRACE(row.name);
        fake::Reset();
        Expect(row.before, row.result, row.after);
    }
}

TEST_F(DecryptParam, ReadsTheDeepestObjectThatALineCanHold) {
    Json::Value params(Json::objectValue);
    Json::Value* deepest = &params;
    for (int depth = 0; depth < 64; ++depth) {
        deepest = &(*deepest)["webapi"];
    }
    (*deepest)["__cIpHeRtExT"] = "sealed:b=2";
    const APIRequest request((Json::Value()));
    EXPECT_TRUE(PrivateOf(request)->DecryptParam(params));
    EXPECT_EQ(*deepest, Parse(R"({"b": 2})"));
}

// Each line hangs another piece below the one before.
TEST_F(DecryptParam, StopsWhereEncipheredLinesGoDeeperAndDeeper) {
    Json::Value chain(Json::objectValue);
    for (int depth = 0; depth < 1000; ++depth) {
        Json::Value outer(Json::objectValue);
        outer["webapi"] = std::move(chain);
        outer["webapi"]["__cIpHeRtExT"] = "sealed:b=" + std::to_string(depth);
        chain = std::move(outer);
    }
    const APIRequest request((Json::Value()));
    EXPECT_FALSE(PrivateOf(request)->DecryptParam(chain));
    EXPECT_EQ(fake::Now().decryptCalls.size(), 64u);
}

TEST_F(DecryptParam, GivesThePlatformACopyOfTheText) {
    Expect(R"({"__cIpHeRtExT": "x", "a": 1})", false, R"({"a": 1})");
    Expect(R"({"__cIpHeRtExT": "", "a": 1})", false, R"({"a": 1})");
    Expect(R"({"__cIpHeRtExT": 5, "a": 1})", false, R"({"a": 1})");
    EXPECT_EQ(fake::Now().decryptCalls, (std::vector<std::string>{"x", "", "5"}));
    EXPECT_TRUE(fake::Now().detectCalls.empty()) << "that is the entry's";
}

TEST_F(DecryptParam, ReadsNothingTwice) {
    const APIRequest request((Json::Value()));
    Json::Value params = Parse(R"({"__cIpHeRtExT": "sealed:a=1"})");
    EXPECT_TRUE(PrivateOf(request)->DecryptParam(params));
    EXPECT_TRUE(PrivateOf(request)->DecryptParam(params));
    EXPECT_EQ(params, Parse(R"({"a": 1})"));
    EXPECT_EQ(fake::Now().decryptCalls.size(), 1u);
}

TEST_F(DecryptParam, TakesItsStepsInOrder) {
    Expect(R"({"__cIpHeRtExT": "sealed:a=1", "__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t",
               "webapi": {"__cIpHeRtExT": "sealed:c=3"}})",
           true, R"({"a": 1, "b": 2, "webapi": {"c": 3}})");
    EXPECT_EQ(
        fake::Now().journal,
        (std::vector<std::string>{"TaloCgiDecryptParam", "strPairToJsonObj",
                                  "TALONdtokenGenerateToken", "GetDecryptAESString",
                                  "strPairToJsonObj", "TaloCgiDecryptParam", "strPairToJsonObj"}));
}

TEST_F(DecryptParam, FailsWhereverAStepFailsAndKeepsWhatIsMerged) {
    const struct {
        const char* operation;
        int nth;
        const char* after;
    } rows[] = {
        {"TaloCgiDecryptParam", 1,
         R"({"p": 0, "__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t",
             "webapi": {"__cIpHeRtExT": "sealed:c=3"}})"},
        {"strPairToJsonObj", 1,
         R"({"p": 0, "__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t",
             "webapi": {"__cIpHeRtExT": "sealed:c=3"}})"},
        {"TALONdtokenGenerateToken", 1,
         R"({"p": 0, "a": 1, "webapi": {"__cIpHeRtExT": "sealed:c=3"}})"},
        {"GetDecryptAESString", 1, R"({"p": 0, "a": 1, "webapi": {"__cIpHeRtExT": "sealed:c=3"}})"},
        {"strPairToJsonObj", 2, R"({"p": 0, "a": 1, "webapi": {"__cIpHeRtExT": "sealed:c=3"}})"},
        {"TaloCgiDecryptParam", 2, R"({"p": 0, "a": 1, "b": 2, "webapi": {}})"},
        {"strPairToJsonObj", 3, R"({"p": 0, "a": 1, "b": 2, "webapi": {}})"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.operation + std::to_string(row.nth));
        fake::Reset();
        fake::Now().FailCall(row.operation, row.nth);
        Expect(R"({"p": 0, "__cIpHeRtExT": "sealed:a=1",
                   "__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t",
                   "webapi": {"__cIpHeRtExT": "sealed:c=3"}})",
               false, row.after);
    }
}

TEST_F(DecryptParam, TakesEveryAnswerButZeroForASuccess) {
    for (const int answer : {1, 2, -1}) {
        fake::Reset();
        fake::Now().cipherResult = answer;
        Expect(R"({"__cIpHeRtExT": "sealed:a=1"})", true, R"({"a": 1})");
    }
}

}  // namespace
