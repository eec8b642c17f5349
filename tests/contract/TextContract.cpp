#include <string>

#include "platform/WebAPIUtil.h"
#include "tests/contract/World.h"
#include "tests/support/Json.h"

using support::Parse;
using TALO::WebAPIUtil;

namespace {

TEST(URLDecode, DecodesOnceAndLeavesWhatIsNoEscape) {
    const struct {
        std::string text;
        std::string decoded;
    } rows[] = {
        {"", ""},
        {"plain", "plain"},
        {"a%20b", "a b"},
        {"%41%7a%7A", "Azz"},
        {"%2541", "%41"},
        {"%25%34%31", "%41"},
        {"%", "%"},
        {"a%4", "a%4"},
        {"%%41", "%A"},
        {"%zz", "%zz"},
        {"%4z", "%4z"},
        {"%z4", "%z4"},
        {"% 41", "% 41"},
        {"%00", std::string(1, '\0')},
        {std::string("a\0b", 3), std::string("a\0b", 3)},
        {"%FF%FE", "\xFF\xFE"},
        {"\xC3\xA9", "\xC3\xA9"},
        {"%2B", "+"},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(WebAPIUtil::URLDecode(row.text, true), row.decoded) << row.text;
        EXPECT_EQ(WebAPIUtil::URLDecode(row.text, false), row.decoded) << row.text;
    }
}

TEST(URLDecode, MakesABlankOfAPlusWhenAsked) {
    EXPECT_EQ(WebAPIUtil::URLDecode("a+b%2Bc", true), "a b+c");
    EXPECT_EQ(WebAPIUtil::URLDecode("a+b%2Bc", false), "a+b+c");
}

TEST(URLEncode, LeavesUnreservedCharactersOnly) {
    const std::string plain = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_.~";
    EXPECT_EQ(WebAPIUtil::URLEncode(plain), plain);
    EXPECT_EQ(WebAPIUtil::URLEncode(" +/&=%\n"), "%20%2B%2F%26%3D%25%0A");
    EXPECT_EQ(WebAPIUtil::URLEncode(std::string("\0\xC3\xA9", 3)), "%00%C3%A9");
    EXPECT_EQ(WebAPIUtil::URLEncode(""), "");
}

TEST(ParseToArray, SplitsAtEachSeparatorAndTrims) {
    const struct {
        const char* text;
        const char* separator;
        const char* pieces;
    } rows[] = {
        {"", ";", R"([""])"},
        {"a", ";", R"(["a"])"},
        {"a;b", ";", R"(["a", "b"])"},
        {"id=1; lang=en ;x", ";", R"(["id=1", "lang=en", "x"])"},
        {" a  b ;\t c", ";", R"(["a  b", "c"])"},
        {";", ";", R"(["", ""])"},
        {"a;;b;", ";", R"(["a", "", "b", ""])"},
        {"a; ;b", ";", R"(["a", "", "b"])"},
        {"a--b-c", "--", R"(["a", "b-c"])"},
        {"aaa", "aa", R"(["", "a"])"},
        {"a;b", "", R"(["a;b"])"},
        {"", "", R"([""])"},
        {"a;b", "x", R"(["a;b"])"},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(WebAPIUtil::ParseToArray(row.text, row.separator), Parse(row.pieces)) << row.text;
    }
}

}  // namespace
