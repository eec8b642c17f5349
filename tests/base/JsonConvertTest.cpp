#include "src/base/JsonConvert.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <optional>

#include "tests/support/Json.h"

using support::Parse;

namespace {

const Json::Value kNaN(std::numeric_limits<double>::quiet_NaN());
const Json::Value kInfinity(std::numeric_limits<double>::infinity());

// How one value reads as each of the types. No integer means the fallback.
struct Row {
    const char* name;
    Json::Value value;
    std::optional<int> integer;
    std::optional<long long> wide;
    bool boolean;
    const char* text;
};

const std::nullopt_t kNone = std::nullopt;
const long long kLowest = std::numeric_limits<long long>::min();
const long long kHighest = std::numeric_limits<long long>::max();

const Row kRows[] = {
    {"null", Json::Value(), 0, 0, false, ""},
    {"zero", 0, 0, 0, false, "0"},
    {"twelve", 12, 12, 12, true, "12"},
    {"minus one", -1, -1, -1, true, "-1"},
    {"unsigned", 7u, 7, 7, true, "7"},
    {"unsigned zero", 0u, 0, 0, false, "0"},
    {"lowest int", Parse("-2147483648"), -2147483647 - 1, -2147483648ll, true, "-2147483648"},
    {"below int", Parse("-2147483649"), kNone, -2147483649ll, true, "-2147483649"},
    {"highest int", Parse("2147483647"), 2147483647, 2147483647, true, "2147483647"},
    {"above int", Parse("2147483648"), kNone, 2147483648ll, true, "2147483648"},
    {"lowest 64-bit", Json::Value(Json::Int64{kLowest}), kNone, kLowest, true,
     "-9223372036854775808"},
    {"highest 64-bit", Json::Value(Json::Int64{kHighest}), kNone, kHighest, true,
     "9223372036854775807"},
    {"above 64-bit", Parse("9223372036854775808"), kNone, kNone, true, "9223372036854775808"},
    {"highest unsigned", Parse("18446744073709551615"), kNone, kNone, true, "18446744073709551615"},
    {"whole real", 5.0, 5, 5, true, "5.0"},
    {"real is cut", 5.9, 5, 5, true, "5.9000000000000004"},
    {"negative real is cut towards zero", -5.5, -5, -5, true, "-5.5"},
    {"small real", 0.5, 0, 0, true, "0.5"},
    {"zero real", 0.0, 0, 0, false, "0.0"},
    {"minus zero real", -0.0, 0, 0, false, "-0.0"},
    {"real above int", 2147483648.0, kNone, 2147483648ll, true, "2147483648.0"},
    {"real at the lowest 64-bit", -9223372036854775808.0, kNone, kLowest, true,
     "-9.2233720368547758e+18"},
    {"real above 64-bit", 9223372036854775808.0, kNone, kNone, true, "9.2233720368547758e+18"},
    {"huge real", 1e300, kNone, kNone, true, "1.0000000000000001e+300"},
    {"no number", kNaN, kNone, kNone, true, "null"},
    {"infinity", kInfinity, kNone, kNone, true, "1e+9999"},
    {"true", true, 1, 1, true, "true"},
    {"false", false, 0, 0, false, "false"},
    {"empty text", "", kNone, kNone, false, ""},
    {"text of an integer", "12", 12, 12, true, "12"},
    {"text of zero", "0", 0, 0, true, "0"},
    {"text of a negative", "-12", -12, -12, true, "-12"},
    {"text of an integer above int", "2147483648", kNone, 2147483648ll, true, "2147483648"},
    {"text of an integer above 64-bit", "9223372036854775808", kNone, kNone, true,
     "9223372036854775808"},
    {"text with leading zeros", "007", 7, 7, true, "007"},
    {"text of a real", "1.5", kNone, kNone, true, "1.5"},
    {"text with a plus", "+1", kNone, kNone, true, "+1"},
    {"text with a blank before", " 1", kNone, kNone, true, " 1"},
    {"text with a blank behind", "1 ", kNone, kNone, true, "1 "},
    {"text with letters behind", "12abc", kNone, kNone, true, "12abc"},
    {"text in hexadecimal", "0x10", kNone, kNone, true, "0x10"},
    {"text of an exponent", "1e3", kNone, kNone, true, "1e3"},
    {"other text", "abc", kNone, kNone, true, "abc"},
    {"text false", "false", kNone, kNone, true, "false"},
    {"empty array", Json::Value(Json::arrayValue), kNone, kNone, false, ""},
    {"array", Parse("[0]"), kNone, kNone, true, ""},
    {"empty object", Json::Value(Json::objectValue), kNone, kNone, false, ""},
    {"object", Parse(R"({"a": 0})"), kNone, kNone, true, ""},
};

TEST(JsonConvert, ReadsIntegersOrAnswersTheFallback) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(TALO::ToInt(row.value, -77), row.integer.value_or(-77));
        EXPECT_EQ(TALO::ToInt(row.value, 88), row.integer.value_or(88));
        EXPECT_EQ(TALO::ToInt64(row.value, -77), row.wide.value_or(-77));
        EXPECT_EQ(TALO::ToInt64(row.value, 88), row.wide.value_or(88));
    }
}

TEST(JsonConvert, ReadsTruth) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(TALO::ToBool(row.value), row.boolean);
    }
    EXPECT_TRUE(TALO::ToBool(Json::Value(std::string(1, '\0'))));
}

TEST(JsonConvert, ReadsTextsTheWayTheJsonLibraryPrints) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(TALO::ToText(row.value), row.text);
        if (!row.value.isArray() && !row.value.isObject()) {
            EXPECT_EQ(TALO::ToText(row.value), row.value.asString());
        }
    }
    const std::string zero("a\0b", 3);
    EXPECT_EQ(TALO::ToText(Json::Value(zero)), zero);
}

TEST(JsonConvert, RequiresAText) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        if (row.value.isArray() || row.value.isObject()) {
            EXPECT_THROW((void)TALO::RequireText(row.value), Json::LogicError);
        } else {
            EXPECT_EQ(TALO::RequireText(row.value), row.text);
        }
    }
}

TEST(JsonConvert, RequiresAnIntegerAndCutsNoReal) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        const bool broken =
            row.value.type() == Json::realValue && row.value.asDouble() != row.integer.value_or(0);
        if (row.integer && !broken) {
            EXPECT_EQ(TALO::RequireInt(row.value), *row.integer);
        } else {
            EXPECT_THROW((void)TALO::RequireInt(row.value), Json::LogicError);
        }
    }
}

struct ParseRow {
    const char* name;
    std::string text;
    std::optional<long long> number;
};

const ParseRow kTexts[] = {
    {"zero", "0", 0},
    {"minus zero", "-0", 0},
    {"lowest", "-9223372036854775808", kLowest},
    {"below the lowest", "-9223372036854775809", kNone},
    {"highest", "9223372036854775807", kHighest},
    {"above the highest", "9223372036854775808", kNone},
    {"far above", "99999999999999999999999999", kNone},
    {"many zeros", std::string(50, '0') + "5", 5},
    {"empty", "", kNone},
    {"only a minus", "-", kNone},
    {"two minus", "--1", kNone},
    {"plus", "+1", kNone},
    {"blank before", " 1", kNone},
    {"blank behind", "1 ", kNone},
    {"line feed behind", "1\n", kNone},
    {"letters behind", "12abc", kNone},
    {"zero byte behind", std::string("12\0", 3), kNone},
    {"only a zero byte", std::string("\0", 1), kNone},
    {"point", "1.", kNone},
    {"separator", "1,000", kNone},
    {"hexadecimal", "0x1", kNone},
    {"other digits", "\xD9\xA1", kNone},
};

TEST(JsonConvert, ParsesOneDecimalIntegerAndNothingElse) {
    for (const ParseRow& row : kTexts) {
        SCOPED_TRACE(row.name);
        long long number = 4711;
        EXPECT_EQ(TALO::ParseInt64(row.text, &number), row.number.has_value());
        EXPECT_EQ(number, row.number.value_or(4711)) << "stays untouched on failure";
    }
}

TEST(JsonConvert, FindsMembersWithoutInsertingThem) {
    Json::Value object = Parse(R"({"a": 1, "n": null, "": 2})");
    const Json::Value before = object;
    EXPECT_EQ(TALO::FindMember(&object, "a"), &object["a"]);
    EXPECT_EQ(TALO::FindMember(&object, "")->asInt(), 2);
    ASSERT_NE(TALO::FindMember(&object, "n"), nullptr);
    EXPECT_TRUE(TALO::FindMember(&object, "n")->isNull());
    EXPECT_EQ(TALO::FindMember(&object, "b"), nullptr);
    EXPECT_EQ(TALO::FindMember(&object, std::string("a\0", 2)), nullptr);
    EXPECT_EQ(TALO::FindMember(nullptr, "a"), nullptr);
    EXPECT_EQ(TALO::Member(object, "a"), Json::Value(1));
    EXPECT_TRUE(TALO::Member(object, "b").isNull());
    EXPECT_EQ(object, before);
}

TEST(JsonConvert, FindsNoMembersInWhatIsNoObject) {
    for (const Json::Value& value : Parse(R"([null, true, 1, 1.5, "a", ["a"], []])")) {
        EXPECT_EQ(TALO::FindMember(&value, "a"), nullptr) << value;
        EXPECT_TRUE(TALO::Member(value, "a").isNull()) << value;
    }
}

}  // namespace
