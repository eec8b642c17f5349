#include <string>

#include "platform/WebAPIUtil.h"
#include "tests/contract/World.h"
#include "tests/support/Json.h"

using support::Parse;
using TALO::WebAPIUtil;

namespace {

std::string Pairs(size_t count) {
    std::string line;
    for (size_t pair = 0; pair < count; ++pair) {
        line += (pair > 0 ? "&n" : "n") + std::to_string(pair) + "=v";
    }
    return line;
}

class StrPairToJsonObj : public Contract {
  protected:
    static void ExpectLine(const std::string& line, const std::string& expected, bool decode = true,
                           bool parseJson = true) {
        Json::Value params(Json::objectValue);
        EXPECT_TRUE(WebAPIUtil::strPairToJsonObj(line, params, decode, parseJson)) << line;
        EXPECT_EQ(params, Parse(expected)) << line;
    }

    // The value that a pair of that text comes to.
    static Json::Value Value(const std::string& text) {
        Json::Value params;
        EXPECT_TRUE(WebAPIUtil::strPairToJsonObj("v=" + text, params, true, true));
        return params["v"];
    }
};

TEST_F(StrPairToJsonObj, ReadsPairs) {
    ExpectLine("", "{}");
    ExpectLine("a=x", R"({"a": "x"})");
    ExpectLine("a=x&b=y", R"({"a": "x", "b": "y"})");
    ExpectLine("a=x=y", R"({"a": "x=y"})");
    ExpectLine("a", R"({"a": ""})");
    ExpectLine("a=", R"({"a": ""})");
    ExpectLine("&&a=x&&", R"({"a": "x"})");
    ExpectLine("=x&=&a=y", R"({"a": "y"})");
    ExpectLine("a=x;b=y", R"({"a": "x;b=y"})");
}

TEST_F(StrPairToJsonObj, LetsALaterPairReplaceAnEarlierOneAndWhatWasThere) {
    ExpectLine("a=x&a=y", R"({"a": "y"})");
    ExpectLine("a=x&%61=y", R"({"a": "y"})");
    Json::Value params = Parse(R"({"a": {"deep": 1}, "keep": 1})");
    EXPECT_TRUE(WebAPIUtil::strPairToJsonObj("a=x", params, true, true));
    EXPECT_EQ(params, Parse(R"({"a": "x", "keep": 1})"));
}

TEST_F(StrPairToJsonObj, DecodesNamesAndValuesOnce) {
    ExpectLine("a+b=c+d&e%26f=g%3Dh", R"({"a b": "c d", "e&f": "g=h"})");
    ExpectLine("a=%2541", R"({"a": "%41"})");
    ExpectLine("a=%&b=%4&c=%zz", R"({"a": "%", "b": "%4", "c": "%zz"})");
    ExpectLine("a+b=c%20d", R"({"a+b": "c%20d"})", false);
}

TEST_F(StrPairToJsonObj, DropsANameThatDecodesToNothingOnlyWhenItIsEmpty) {
    ExpectLine("+=x", R"({" ": "x"})");
    ExpectLine("%20=x", R"({" ": "x"})");
}

TEST_F(StrPairToJsonObj, KeepsNulAndBytesThatAreNoUtf8) {
    Json::Value params;
    EXPECT_TRUE(WebAPIUtil::strPairToJsonObj("a%00b=c%00d&%FF=%FE\xFF", params, true, true));
    EXPECT_EQ(params[std::string("a\0b", 3)].asString(), std::string("c\0d", 3));
    EXPECT_EQ(params["\xFF"].asString(), "\xFE\xFF");
}

TEST_F(StrPairToJsonObj, ReadsAValueThatIsOneCompleteJsonValue) {
    const struct {
        const char* text;
        const char* value;
    } rows[] = {
        {"1", "1"},
        {"0", "0"},
        {"-1", "-1"},
        {"1.5", "1.5"},
        {"1e2", "100.0"},
        {"true", "true"},
        {"false", "false"},
        {"null", "null"},
        {"%22a%22", "\"a\""},
        {"\"a+b\"", "\"a b\""},
        {"%22%22", "\"\""},
        {"[]", "[]"},
        {"{}", "{}"},
        {"[1,%22a%22,null]", "[1, \"a\", null]"},
        {"{%22a%22:{%22b%22:1}}", "{\"a\": {\"b\": 1}}"},
        {"+1+", "1"},
        {"%0A1%09", "1"},
        {"18446744073709551615", "18446744073709551615"},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(Value(row.text), Parse(row.value)) << row.text;
    }
    EXPECT_TRUE(Value("1").isInt());
}

TEST_F(StrPairToJsonObj, KeepsEverythingElseAsText) {
    for (const char* text :
         {"007", "01",  "-01",    "tru", "True", "nul",   "NaN",  "Infinity", "1.",
          ".5",  "1e",  "0x1",    "1 2", "[1",   "[1,]",  "[1]x", "{a:1}",    "{'a':1}",
          "'a'", "\"a", "\"a\"b", "//",  "1//c", "/**/1", "[1]]", "1e999",    "\"\\ud800\""}) {
        EXPECT_EQ(Value(text), text) << text;
    }
    EXPECT_EQ(Value("1%00").asString(), std::string("1\0", 2));
}

TEST_F(StrPairToJsonObj, ReadsNestedValuesUpToTheLimit) {
    const size_t limit = WebAPIUtil::kMaxJsonDepth;
    for (const size_t depth : {limit, limit + 1, size_t(100000)}) {
        const std::string text = std::string(depth, '[') + std::string(depth, ']');
        EXPECT_EQ(Value(text).isArray(), depth <= limit) << depth;
    }
}

TEST_F(StrPairToJsonObj, KeepsAllAsTextWhenNotToReadJson) {
    ExpectLine("a=1&b=%5B%5D&c=null", R"({"a": "1", "b": "[]", "c": "null"})", true, false);
    ExpectLine(R"({"a":1})", R"({"{\"a\":1}": ""})", true, false);
}

TEST_F(StrPairToJsonObj, TakesALineThatIsOneObjectForItsMembers) {
    ExpectLine(R"({"a": 1, "b": {"c": "x&y=z"}, "d": "%41+"})",
               R"({"a": 1, "b": {"c": "x&y=z"}, "d": "%41+"})");
    ExpectLine(" \r\n{\"a\": null} \n", R"({"a": null})");
    ExpectLine("{}", "{}");
    Json::Value params = Parse(R"({"a": 1, "b": 2})");
    EXPECT_TRUE(WebAPIUtil::strPairToJsonObj(R"({"b": 3})", params, true, true));
    EXPECT_EQ(params, Parse(R"({"a": 1, "b": 3})"));
}

TEST_F(StrPairToJsonObj, ReadsALineThatIsAlmostAnObjectAsPairs) {
    ExpectLine("{\"a\":1", R"({"{\"a\":1": ""})");
    ExpectLine("{\"a\":1}x", R"({"{\"a\":1}x": ""})");
    ExpectLine("[1]", R"({"[1]": ""})");
    ExpectLine("{=1", R"({"{": 1})");
}

TEST_F(StrPairToJsonObj, MakesAnObjectOfNullAndTouchesNothingElse) {
    Json::Value params;
    EXPECT_TRUE(WebAPIUtil::strPairToJsonObj("", params, true, true));
    EXPECT_EQ(params, Json::Value(Json::objectValue));
    for (const char* other : {"[]", "1", "\"a\"", "true"}) {
        for (const char* line : {"", "a=1", "{\"a\":1}"}) {
            params = Parse(other);
            EXPECT_FALSE(WebAPIUtil::strPairToJsonObj(line, params, true, true)) << other;
            EXPECT_EQ(params, Parse(other));
        }
    }
}

TEST_F(StrPairToJsonObj, TakesTenThousandPairsAndNoMore) {
    Json::Value params;
    EXPECT_TRUE(WebAPIUtil::strPairToJsonObj(Pairs(10000), params, true, true));
    EXPECT_EQ(params.size(), 10000u);
    params = Json::Value();
    EXPECT_FALSE(WebAPIUtil::strPairToJsonObj(Pairs(10001), params, true, true));
    std::string same;
    for (int pair = 0; pair < 10001; ++pair) {
        same += "a&";
    }
    EXPECT_FALSE(WebAPIUtil::strPairToJsonObj(same, params, true, true));
}

TEST_F(StrPairToJsonObj, CountsTheMembersOfAnObjectLineToo) {
    Json::Value object(Json::objectValue);
    for (size_t member = 0; member < 10000; ++member) {
        object["n" + std::to_string(member)] = 1;
    }
    Json::StreamWriterBuilder compact;
    compact["indentation"] = "";
    Json::Value params;
    EXPECT_TRUE(
        WebAPIUtil::strPairToJsonObj(Json::writeString(compact, object), params, true, true));
    EXPECT_EQ(params, object);
    object["more"] = 1;
    params = Json::Value(Json::objectValue);
    EXPECT_FALSE(
        WebAPIUtil::strPairToJsonObj(Json::writeString(compact, object), params, true, true));
    EXPECT_EQ(params, Json::Value(Json::objectValue));
}

}  // namespace
