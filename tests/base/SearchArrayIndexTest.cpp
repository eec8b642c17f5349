#include <gtest/gtest.h>

#include "src/base/JsonText.h"
#include "tests/support/Json.h"

using support::Parse;

namespace {

const unsigned kNowhere = Json::Value::maxUInt;

struct Row {
    const char* name;
    const char* array;
    const char* wanted;
    unsigned index;
};

const Row kRows[] = {
    {"first", R"(["a", "b", "c"])", R"("a")", 0},
    {"last", R"(["a", "b", "c"])", R"("c")", 2},
    {"first of two equal ones", R"(["x", "b", "b"])", R"("b")", 1},
    {"absent", R"(["a", "b"])", R"("c")", kNowhere},
    {"part of a text", R"(["abc"])", R"("a")", kNowhere},
    {"other case", R"(["A"])", R"("a")", kNowhere},
    {"number", "[3, 2, 1]", "1", 2},
    {"number is no text", R"(["1"])", "1", kNowhere},
    {"integer is no real", "[1.0]", "1", kNowhere},
    {"null", R"(["a", null])", "null", 1},
    {"false is no null", "[false]", "null", kNowhere},
    {"array", "[[1], [1, 2]]", "[1, 2]", 1},
    {"object", R"([{"a": 2}, {"a": 1}])", R"({"a": 1})", 1},
    {"empty array", "[]", R"("a")", kNowhere},
    {"null in an empty array", "[]", "null", kNowhere},
    {"object is no array", R"({"0": "a", "a": "a"})", R"("a")", kNowhere},
    {"text is no array", R"("a")", R"("a")", kNowhere},
    {"null is no array", "null", "null", kNowhere},
    {"number is no array", "5", "5", kNowhere},
};

TEST(SearchArrayIndex, FindsTheFirstEqualElement) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(TALO::searchArrayIndex(Parse(row.array), Parse(row.wanted)), row.index);
    }
}

TEST(SearchArrayIndex, AnswersTheLargestUnsignedValueWhenThereIsNone) {
    EXPECT_EQ(TALO::searchArrayIndex(Parse("[]"), Json::Value()), 4294967295u);
}

TEST(SearchArrayIndex, CountsTheHolesOfAnArray) {
    Json::Value array(Json::arrayValue);
    array[3] = "d";
    EXPECT_EQ(TALO::searchArrayIndex(array, "d"), 3u);
    EXPECT_EQ(TALO::searchArrayIndex(array, Json::Value()), 0u);
}

}  // namespace
