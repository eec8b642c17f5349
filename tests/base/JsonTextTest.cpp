#include "src/base/JsonText.h"

#include <gtest/gtest.h>

#include <limits>
#include <string>
#include <vector>

#include "tests/support/Json.h"

using namespace std::string_literals;
using support::Parse;

namespace {

#define REPLACED "\xEF\xBF\xBD"

struct TextRow {
    const char* name;
    std::string text;
    std::string json;
};

const TextRow kTexts[] = {
    {"empty", "", R"("")"},
    {"plain", "plain text 123 /-_.~!#$%'()*+,:;=?@[]^`{|}",
     R"("plain text 123 /-_.~!#$%'()*+,:;=?@[]^`{|}")"},
    {"quote", "a\"b", R"("a\"b")"},
    {"backslash", "a\\b", R"("a\\b")"},
    {"backspace", "\b", R"("\b")"},
    {"form feed", "\f", R"("\f")"},
    {"line feed", "\n", R"("\n")"},
    {"carriage return", "\r", R"("\r")"},
    {"tabulator", "\t", R"("\t")"},
    {"zero byte", "a\0b"s, R"("a\u0000b")"},
    {"only a zero byte", "\0"s, R"("\u0000")"},
    {"lowest control", "\x01", R"("\u0001")"},
    {"vertical tabulator", "\x0B", R"("\u000b")"},
    {"escape", "\x1B[0m", R"("\u001b[0m")"},
    {"highest control", "\x1F", R"("\u001f")"},
    {"blank", " ", R"(" ")"},
    {"delete", "\x7F", "\"\x7F\""},
    {"markup", "<script>&amp;</script>", R"("\u003cscript\u003e\u0026amp;\u003c/script\u003e")"},
    {"line separator",
     "a\xE2\x80\xA8"
     "b",
     R"("a\u2028b")"},
    {"paragraph separator",
     "a\xE2\x80\xA9"
     "b",
     R"("a\u2029b")"},
    {"before the separators", "\xE2\x80\xA7", "\"\xE2\x80\xA7\""},
    {"after the separators", "\xE2\x80\xAA", "\"\xE2\x80\xAA\""},
    {"two bytes", "caf\xC3\xA9", "\"caf\xC3\xA9\""},
    {"three bytes", "\xE2\x82\xAC", "\"\xE2\x82\xAC\""},
    {"four bytes", "\xF0\x9F\x98\x80", "\"\xF0\x9F\x98\x80\""},
    {"replacement character", REPLACED, "\"" REPLACED "\""},
    {"U+10FFFF", "\xF4\x8F\xBF\xBF", "\"\xF4\x8F\xBF\xBF\""},
    {"stray continuation", "a\x80z", "\"a" REPLACED "z\""},
    {"missing continuation", "a\xC3z", "\"a" REPLACED "z\""},
    {"missing continuation before markup", "\xC3<", "\"" REPLACED "\\u003c\""},
    {"missing continuation before a quote", "\xE2\x82\"", "\"" REPLACED REPLACED "\\\"\""},
    {"missing continuation at the end", "a\xC3", "\"a" REPLACED "\""},
    {"cut separator", "\xE2\x80", "\"" REPLACED REPLACED "\""},
    {"cut four bytes", "\xF0\x9F\x98", "\"" REPLACED REPLACED REPLACED "\""},
    {"overlong slash", "\xC0\xAF", "\"" REPLACED REPLACED "\""},
    {"overlong markup", "\xC0\xBC", "\"" REPLACED REPLACED "\""},
    {"surrogate", "\xED\xA0\x80", "\"" REPLACED REPLACED REPLACED "\""},
    {"above U+10FFFF", "\xF4\x90\x80\x80", "\"" REPLACED REPLACED REPLACED REPLACED "\""},
    {"bytes that never occur", "\xFE\xFF", "\"" REPLACED REPLACED "\""},
    {"good around bad", "\xC3\xA9\xFF\xC3\xA9", "\"\xC3\xA9" REPLACED "\xC3\xA9\""},
};

TEST(ToString, EscapesTexts) {
    for (const TextRow& row : kTexts) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(TALO::toString(Json::Value(row.text)), row.json);
    }
}

TEST(ToString, EscapesMemberNamesAlike) {
    for (const TextRow& row : kTexts) {
        SCOPED_TRACE(row.name);
        Json::Value object(Json::objectValue);
        object[row.text] = 1;
        EXPECT_EQ(TALO::toString(object), "{" + row.json + ":1}");
    }
}

// The serialiser looks at several bytes at once and cuts long texts in slices.
TEST(ToString, EscapesTextsWhereverTheyStand) {
    std::vector<size_t> places;
    for (size_t place = 0; place < 18; ++place) {
        places.push_back(place);
        places.push_back(4082 + place);
        places.push_back(8178 + place);
    }
    for (const TextRow& row : kTexts) {
        SCOPED_TRACE(row.name);
        const std::string inner = row.json.substr(1, row.json.size() - 2);
        for (const size_t place : places) {
            const std::string before(place, 'b');
            for (const size_t behind : {0u, 1u, 20u}) {
                const std::string after(behind, 'a');
                ASSERT_EQ(TALO::toString(Json::Value(before + row.text + after)),
                          "\"" + before + inner + after + "\"")
                    << place << " bytes before, " << behind << " behind";
            }
        }
    }
}

TEST(ToString, WritesAStaticTextAsAnyOther) {
    EXPECT_EQ(TALO::toString(Json::Value(Json::StaticString("a<b"))), R"("a\u003cb")");
}

struct ValueRow {
    const char* name;
    Json::Value value;
    const char* json;
};

const ValueRow kValues[] = {
    {"null", Json::Value(), "null"},
    {"true", true, "true"},
    {"false", false, "false"},
    {"zero", 0, "0"},
    {"unsigned zero", 0u, "0"},
    {"minus one", -1, "-1"},
    {"lowest int", std::numeric_limits<int>::min(), "-2147483648"},
    {"highest int", std::numeric_limits<int>::max(), "2147483647"},
    {"highest unsigned int", std::numeric_limits<unsigned>::max(), "4294967295"},
    {"lowest 64-bit", Json::Value(std::numeric_limits<Json::Int64>::min()), "-9223372036854775808"},
    {"highest 64-bit", Json::Value(std::numeric_limits<Json::Int64>::max()), "9223372036854775807"},
    {"first above the signed", Json::Value(Json::UInt64{1} << 63), "9223372036854775808"},
    {"highest unsigned 64-bit", Json::Value(std::numeric_limits<Json::UInt64>::max()),
     "18446744073709551615"},
    {"beyond the integers of a double", Json::Value(Json::Int64{9007199254740993}),
     "9007199254740993"},
    {"empty array", Json::Value(Json::arrayValue), "[]"},
    {"empty object", Json::Value(Json::objectValue), "{}"},
    {"empty text", "", R"("")"},
    {"array", Parse(R"([1, "a", null, true])"), R"([1,"a",null,true])"},
    {"nested", Parse(R"({"a": [[], {}, [{"b": [1]}]], "c": {"d": {}}})"),
     R"({"a":[[],{},[{"b":[1]}]],"c":{"d":{}}})"},
    {"names in byte order", Parse(R"({"b": 1, "B": 2, "a": 3, "": 4, "aa": 5, "\u00e9": 6})"),
     "{\"\":4,\"B\":2,\"a\":3,\"aa\":5,\"b\":1,\"\xC3\xA9\":6}"},
};

TEST(ToString, WritesEveryTypeCompactly) {
    for (const ValueRow& row : kValues) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(TALO::toString(row.value), row.json);
    }
}

TEST(ToString, WritesAResultDocument) {
    EXPECT_EQ(TALO::toString(Parse(R"({"success": false, "error": {"errors": [1], "code": 105}})")),
              R"({"error":{"code":105,"errors":[1]},"success":false})");
}

TEST(ToString, WritesTheHolesOfAnArrayAsNull) {
    Json::Value array(Json::arrayValue);
    array[2] = "c";
    array[4] = "e";
    EXPECT_EQ(TALO::toString(array), R"([null,null,"c",null,"e"])");
}

TEST(ToString, WritesTheNullsOfAResizedArray) {
    Json::Value array(Json::arrayValue);
    array.resize(3);
    EXPECT_EQ(TALO::toString(array), "[null,null,null]");
}

TEST(ToString, WritesALongText) {
    const std::string longText(300000, 'x');
    EXPECT_EQ(TALO::toString(Json::Value(longText)), "\"" + longText + "\"");
}

TEST(ToString, CarriesNoMarkupInAnyAscii) {
    std::string all;
    for (int byte = 0; byte < 256; ++byte) {
        all += static_cast<char>(byte);
    }
    const std::string json = TALO::toString(Json::Value(all));
    EXPECT_EQ(json.find_first_of("<>&"), std::string::npos);
    for (const char byte : json) {
        EXPECT_GE(static_cast<unsigned char>(byte), 0x20);
    }
}

}  // namespace
