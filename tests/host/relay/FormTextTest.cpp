#include "hosts/linux/relay/FormText.h"

#include <gtest/gtest.h>

#include <cstdlib>

#include "hosts/linux/util/Percent.h"
#include "tests/support/Json.h"

namespace {

using support::Parse;

struct ValueRow {
    const char* name;
    const char* params;
    const char* text;  // behind the call's name
};

class FormTextValue : public ::testing::TestWithParam<ValueRow> {};

TEST_P(FormTextValue, HasItsJsonTextPercentEncoded) {
    EXPECT_EQ(host::FormText("TALO.Test", 3, "do", Parse(GetParam().params)),
              std::string("api=TALO.Test&version=3&method=do") + GetParam().text);
}

const ValueRow kValues[] = {
    {"None", "{}", ""},
    {"Null", R"({"a":null})", "&a=null"},
    {"True", R"({"a":true})", "&a=true"},
    {"Number", R"({"a":-5})", "&a=-5"},
    {"Text", R"({"a":"b"})", "&a=%22b%22"},
    {"EmptyText", R"({"a":""})", "&a=%22%22"},
    {"NumberAsText", R"({"a":"1"})", "&a=%221%22"},
    {"LeastInteger", R"({"a":-9223372036854775808})", "&a=-9223372036854775808"},
    {"GreatestInteger", R"({"a":9223372036854775807})", "&a=9223372036854775807"},
    {"GreatestUnsigned", R"({"a":18446744073709551615})", "&a=18446744073709551615"},
    {"Double", R"({"a":0.1})", "&a=0.10000000000000001"},
    {"DoubleThatIsWhole", R"({"a":1.0})", "&a=1.0"},
    {"Utf8", "{\"a\":\"\xC3\xA4\xF0\x9F\x98\x80\"}", "&a=%22%C3%A4%F0%9F%98%80%22"},
    {"TextWithNul", R"({"a":"b\u0000c"})", "&a=%22b%5Cu0000c%22"},
    {"TextWithQuote", R"({"a":"\"&=+%"})", "&a=%22%5C%22%26%3D%2B%25%22"},
    {"Array", R"({"a":[1,"x",null]})", "&a=%5B1%2C%22x%22%2Cnull%5D"},
    {"Object", R"({"a":{"b":[{}]}})", "&a=%7B%22b%22%3A%5B%7B%7D%5D%7D"},
    {"NameToEncode", R"({"a b&=\u00e4":1})", "&a%20b%26%3D%C3%A4=1"},
    {"NameWithNul", R"({"a\u0000b":1})", "&a%00b=1"},
    {"EmptyName", R"({"":1})", "&=1"},
    {"Several", R"({"b":1,"a":2})", "&a=2&b=1"},
    {"SessionOfTheClient", R"({"_sid":"x","a":1})", "&a=1"},
    {"WayOverThisAppliance", R"({"relay_nd":2,"relay_timeout":5,"a":1})", "&a=1"},
    {"NameOfAnotherCall", R"({"api":"TALO.Other","version":9,"method":"no","a":1})", "&a=1"},
    {"NameInCapitals", R"({"API":1,"_SID":2})", "&API=1&_SID=2"},
};

INSTANTIATE_TEST_SUITE_P(Values, FormTextValue, ::testing::ValuesIn(kValues),
                         [](const auto& row) { return std::string(row.param.name); });

TEST(FormText, BringsEveryDoubleBackAsItWas) {
    for (const double number :
         {1.0 / 3, 1e300, -2.2250738585072014e-308, 123456789.123456789, 5e-324, 4e15 + 0.5}) {
        Json::Value params(Json::objectValue);
        params["a"] = number;
        const std::string text = host::FormText("A", 1, "m", params);
        const std::string value = host::PercentDecode(text.substr(text.rfind('=') + 1), true);
        EXPECT_EQ(std::strtod(value.c_str(), nullptr), number) << text;
    }
}

TEST(FormText, EncodesTheNameOfTheCall) {
    EXPECT_EQ(host::CallText("A&b", -1, "m=\n"), "api=A%26b&version=-1&method=m%3D%0A");
}

TEST(FormText, TakesNoObjectForNoParameters) {
    EXPECT_EQ(host::FormText("A", 1, "m", Json::Value()), "api=A&version=1&method=m");
}

struct UrlRow {
    const char* name;
    const char* url;
    const char* without;
    const char* with;  // "x=1"
};

class NodeUrlQuery : public ::testing::TestWithParam<UrlRow> {};

TEST_P(NodeUrlQuery, IsLeftOutOrGoesBeforeAFurtherOne) {
    EXPECT_EQ(host::WithoutQuery(GetParam().url), GetParam().without);
    EXPECT_EQ(host::WithQuery(GetParam().url, "x=1"), GetParam().with);
}

const UrlRow kUrls[] = {
    {"None", "https://b/e.cgi", "https://b/e.cgi", "https://b/e.cgi?x=1"},
    {"Some", "https://b/e.cgi?relay_nd=7", "https://b/e.cgi", "https://b/e.cgi?relay_nd=7&x=1"},
    {"Empty", "https://b/e.cgi?", "https://b/e.cgi", "https://b/e.cgi?x=1"},
    {"OpenEnded", "https://b/e.cgi?a=1&", "https://b/e.cgi", "https://b/e.cgi?a=1&x=1"},
};

INSTANTIATE_TEST_SUITE_P(Urls, NodeUrlQuery, ::testing::ValuesIn(kUrls),
                         [](const auto& row) { return std::string(row.param.name); });

}  // namespace
