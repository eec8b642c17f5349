#include <gtest/gtest.h>

#include <limits>
#include <optional>

#include "tests/support/Json.h"
#include "webapi/APIParameter.h"

namespace {

const std::nullopt_t kNo = std::nullopt;

// One JSON value and what each integer type makes of it; none where it refuses.
struct Row {
    const char* name;
    Json::Value json;
    std::optional<int> asInt;
    std::optional<unsigned int> asUnsigned;
    std::optional<long long> asLong;
    std::optional<unsigned long long> asUnsignedLong;
};

const long long kLowest = std::numeric_limits<long long>::min();

Json::Value Signed(long long number) {
    return Json::Value(Json::Int64{number});
}

Json::Value Unsigned(unsigned long long number) {
    return Json::Value(Json::UInt64{number});
}

const Row kRows[] = {
    {"zero", 0, 0, 0u, 0, 0u},
    {"unsigned zero", 0u, 0, 0u, 0, 0u},
    {"one", 1, 1, 1u, 1, 1u},
    {"unsigned seven", 7u, 7, 7u, 7, 7u},
    {"minus one", -1, -1, kNo, -1, kNo},
    {"lowest int", Signed(-2147483648ll), -2147483647 - 1, kNo, -2147483648ll, kNo},
    {"one below int", Signed(-2147483649ll), kNo, kNo, -2147483649ll, kNo},
    {"highest int", Signed(2147483647), 2147483647, 2147483647u, 2147483647, 2147483647u},
    {"highest int, unsigned", Unsigned(2147483647), 2147483647, 2147483647u, 2147483647,
     2147483647u},
    {"one above int", Signed(2147483648ll), kNo, 2147483648u, 2147483648ll, 2147483648u},
    {"one above int, unsigned", Unsigned(2147483648u), kNo, 2147483648u, 2147483648ll, 2147483648u},
    {"highest unsigned", Signed(4294967295ll), kNo, 4294967295u, 4294967295ll, 4294967295u},
    {"one above unsigned", Signed(4294967296ll), kNo, kNo, 4294967296ll, 4294967296u},
    {"one above unsigned, unsigned", Unsigned(4294967296u), kNo, kNo, 4294967296ll, 4294967296u},
    {"five thousand million", Signed(5000000000ll), kNo, kNo, 5000000000ll, 5000000000u},
    {"a multiple of 2^32 and five", Signed(4294967301ll), kNo, kNo, 4294967301ll, 4294967301u},
    {"lowest 64-bit", Signed(kLowest), kNo, kNo, kLowest, kNo},
    {"highest 64-bit", Signed(9223372036854775807ll), kNo, kNo, 9223372036854775807ll,
     9223372036854775807u},
    {"highest 64-bit, unsigned", Unsigned(9223372036854775807u), kNo, kNo, 9223372036854775807ll,
     9223372036854775807u},
    {"one above 64-bit", Unsigned(9223372036854775808u), kNo, kNo, kNo, 9223372036854775808u},
    {"highest unsigned 64-bit", Unsigned(18446744073709551615u), kNo, kNo, kNo,
     18446744073709551615u},
    {"whole real", 5.0, 5, 5u, 5, 5u},
    {"negative whole real", -5.0, -5, kNo, -5, kNo},
    {"real zero", 0.0, 0, 0u, 0, 0u},
    {"real minus zero", -0.0, 0, 0u, 0, 0u},
    {"real with a fraction", 5.5, kNo, kNo, kNo, kNo},
    {"real just below one", 0.9999999999999999, kNo, kNo, kNo, kNo},
    {"real at the lowest int", -2147483648.0, -2147483647 - 1, kNo, -2147483648ll, kNo},
    {"real at the highest int", 2147483647.0, 2147483647, 2147483647u, 2147483647, 2147483647u},
    {"real above int", 2147483648.0, kNo, 2147483648u, 2147483648ll, 2147483648u},
    {"real above unsigned", 4294967296.0, kNo, kNo, 4294967296ll, 4294967296u},
    {"real at the lowest 64-bit", -9223372036854775808.0, kNo, kNo, kLowest, kNo},
    {"real below 64-bit", -9223372036854777856.0, kNo, kNo, kNo, kNo},
    {"real above 64-bit", 9223372036854775808.0, kNo, kNo, kNo, 9223372036854775808u},
    {"real above unsigned 64-bit", 18446744073709551616.0, kNo, kNo, kNo, kNo},
    {"huge real", 1e300, kNo, kNo, kNo, kNo},
    {"huge negative real", -1e300, kNo, kNo, kNo, kNo},
    {"no number", std::numeric_limits<double>::quiet_NaN(), kNo, kNo, kNo, kNo},
    {"infinity", std::numeric_limits<double>::infinity(), kNo, kNo, kNo, kNo},
    {"text of a number", "10", kNo, kNo, kNo, kNo},
    {"empty text", "", kNo, kNo, kNo, kNo},
    {"true", true, kNo, kNo, kNo, kNo},
    {"false", false, kNo, kNo, kNo, kNo},
    {"null", Json::Value(), kNo, kNo, kNo, kNo},
    {"array", support::Parse("[1]"), kNo, kNo, kNo, kNo},
    {"empty array", Json::Value(Json::arrayValue), kNo, kNo, kNo, kNo},
    {"object", support::Parse(R"({"a": 1})"), kNo, kNo, kNo, kNo},
};

// What a parameter answers that was at 99 before.
template <typename T>
void Check(const Json::Value& json, const std::optional<T>& wanted) {
    TALO::APIParameter<T> parameter;
    ASSERT_TRUE(parameter.ParseValue(99, Json::intValue));
    bool parsed = false;
    ASSERT_NO_THROW(parsed = parameter.ParseValue(json, Json::intValue));
    EXPECT_EQ(parsed, wanted.has_value());
    EXPECT_EQ(parameter.Get(), wanted.value_or(99));
    TALO::APIParameter<T> checked;
    checked.CheckValueTypeAndGet(json, Json::intValue, nullptr);
    EXPECT_TRUE(checked.IsSet());
    EXPECT_EQ(checked.IsInvalid(), !wanted.has_value() && !json.isNull());
    EXPECT_EQ(checked.Get(), wanted.value_or(0));
}

TEST(IntegerParameter, TakesAnInt) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        Check(row.json, row.asInt);
    }
}

TEST(IntegerParameter, TakesAnUnsignedInt) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        Check(row.json, row.asUnsigned);
    }
}

TEST(IntegerParameter, TakesALongLong) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        Check(row.json, row.asLong);
    }
}

TEST(IntegerParameter, TakesAnUnsignedLongLong) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        Check(row.json, row.asUnsignedLong);
    }
}

TEST(IntegerParameter, IgnoresTheTypeArgument) {
    for (const Json::ValueType type : {Json::nullValue, Json::stringValue, Json::objectValue}) {
        TALO::APIParameter<int> parameter;
        EXPECT_TRUE(parameter.ParseValue(5, type));
        EXPECT_FALSE(parameter.ParseValue("5", type));
    }
}

}  // namespace
