#include <gtest/gtest.h>

#include "tests/request/Private.h"
#include "tests/support/Json.h"

using support::Parse;
using TALO::APIRequest;

namespace {

Json::Value Cookies(const std::string& header) {
    Json::Value document;
    document["environ"]["HTTP_COOKIE"] = header;
    const APIRequest request(document);
    return PrivateOf(request)->GetData("cookie", "", Json::Value());
}

struct Row {
    const char* name;
    const char* header;
    const char* cookies;
};

const Row kRows[] = {
    {"empty", "", "{}"},
    {"one", "id=abc", R"({"id": "abc"})"},
    {"two", "id=abc; lang=enu", R"({"id": "abc", "lang": "enu"})"},
    {"two without a blank", "id=abc;lang=enu", R"({"id": "abc", "lang": "enu"})"},
    {"blanks around the pieces", "  id=abc  ;  lang=enu  ", R"({"id": "abc", "lang": "enu"})"},
    {"last of a name wins", "id=abc; id=xyz", R"({"id": "xyz"})"},
    {"names are case-sensitive", "id=1; ID=2", R"({"id": "1", "ID": "2"})"},
    {"no equals sign", "id", "{}"},
    {"no equals sign between others", "a=1; junk; b=2", R"({"a": "1", "b": "2"})"},
    {"empty value", "id=", R"({"id": ""})"},
    {"empty value replaces", "id=abc; id=", R"({"id": ""})"},
    {"first equals sign splits", "id=a=b==", R"({"id": "a=b=="})"},
    {"empty name", "=abc", R"({"": "abc"})"},
    {"empty pieces", ";; ;id=abc;;", R"({"id": "abc"})"},
    {"encoded blank", "lang=a%20b", R"({"lang": "a b"})"},
    {"plus is a blank", "lang=a+b", R"({"lang": "a b"})"},
    {"encoded plus", "lang=a%2Bb", R"({"lang": "a+b"})"},
    {"encoded separator", "lang=a%3Bb%3D", R"({"lang": "a;b="})"},
    {"decoded once", "lang=%2541", R"({"lang": "%41"})"},
    {"name is not decoded", "l%61ng=x", R"({"l%61ng": "x"})"},
    {"percent cut short", "lang=a%2", R"({"lang": "a%2"})"},
    {"percent without digits", "lang=%zz%", R"({"lang": "%zz%"})"},
    {"encoded zero byte", "lang=a%00b", R"({"lang": "a\u0000b"})"},
    {"a value that looks like JSON is text", R"(n=5; o={"a":1})",
     R"({"n": "5", "o": "{\"a\":1}"})"},
};

TEST(Cookies, AreReadFromTheHeader) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(Cookies(row.header), Parse(row.cookies));
    }
}

TEST(Cookies, ReadAWholeHeader) {
    Json::Value document;
    document["environ"]["HTTP_COOKIE"] = "id=abc; lang=a%20b; junk; id=xyz";
    const APIRequest request(document);
    EXPECT_EQ(request.GetSessionID(), "xyz");
    EXPECT_EQ(request.GetCookie("lang", ""), "a b");
    EXPECT_FALSE(request.HasCookie("junk"));
}

TEST(Cookies, AreNoneWithoutAHeaderThatIsAText) {
    for (const char* value : {"5", "null", R"(["id=abc"])", R"({"id": "abc"})", "true"}) {
        Json::Value document = Parse(R"({"environ": {"A": "1"}})");
        document["environ"]["HTTP_COOKIE"] = Parse(value);
        const APIRequest request(document);
        EXPECT_EQ(request.GetSessionID(), "") << value;
    }
}

TEST(Cookies, StayWhenALaterHeaderBringsOthers) {
    APIRequest request(Parse(R"({"environ": {"HTTP_COOKIE": "a=1; b=2"}})"));
    request.InitEnv(Parse(R"({"HTTP_COOKIE": "b=3; c=4"})"));
    EXPECT_EQ(PrivateOf(request)->GetData("cookie", "", Json::Value()),
              Parse(R"({"a": "1", "b": "3", "c": "4"})"));
}

TEST(Cookies, AnswerTheFallbackForWhatIsNotThere) {
    const APIRequest request(Parse(R"({"environ": {"HTTP_COOKIE": "a=1; =nameless"}})"));
    EXPECT_EQ(request.GetCookie("b", "none"), "none");
    EXPECT_EQ(request.GetCookie("", "none"), "none") << "the whole section is no text";
    EXPECT_TRUE(request.HasCookie("a"));
    EXPECT_FALSE(request.HasCookie("b"));
    EXPECT_FALSE(request.HasCookie(""));
}

TEST(Cookies, AnswerTheFallbackForAStoredValueThatIsNoText) {
    const APIRequest request((Json::Value()));
    for (const Json::Value& value : Parse(R"([5, true, null, ["x"], {"a": "b"}])")) {
        ASSERT_TRUE(PrivateOf(request)->SetData("cookie", "a", value, false));
        EXPECT_EQ(request.GetCookie("a", "none"), "none");
        EXPECT_TRUE(request.HasCookie("a"));
    }
}

TEST(Cookies, AreSetForThisRequest) {
    APIRequest request(Parse(R"({"environ": {"HTTP_COOKIE": "id=abc"}})"));
    EXPECT_TRUE(request.SetCookie("id", "a%20b"));
    EXPECT_EQ(request.GetSessionID(), "a%20b") << "stored as it stands";
    EXPECT_TRUE(request.SetCookie("new", ""));
    EXPECT_TRUE(request.HasCookie("new"));
    EXPECT_EQ(request.GetCookie("new", "none"), "");
    EXPECT_EQ(request.GetEnv("HTTP_COOKIE", ""), Json::Value("id=abc"));
}

TEST(Cookies, RefuseAnEmptyName) {
    APIRequest request((Json::Value()));
    EXPECT_FALSE(request.SetCookie("", "x"));
    EXPECT_EQ(PrivateOf(request)->GetData("cookie", "", Json::Value()),
              Json::Value(Json::objectValue));
}

TEST(Cookies, HoldTheSessionIdentifier) {
    EXPECT_EQ(APIRequest(Json::Value()).GetSessionID(), "");
    APIRequest request(Parse(R"({"environ": {"HTTP_COOKIE": "sid=1; ID=2"}})"));
    EXPECT_EQ(request.GetSessionID(), "");
    EXPECT_TRUE(request.SetCookie("id", "3"));
    EXPECT_EQ(request.GetSessionID(), "3");
}

}  // namespace
