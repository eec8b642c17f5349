#include <gtest/gtest.h>

#include <limits>
#include <optional>

#include "tests/support/Json.h"
#include "webapi/APIParameter.h"

using support::Parse;
using TALO::APIParameter;

namespace {

const std::nullopt_t kNo = std::nullopt;

// One JSON value and what bool, double and text make of it; none where they refuse.
struct Row {
    const char* name;
    Json::Value json;
    std::optional<bool> flag;
    std::optional<double> real;
    std::optional<std::string> text;
};

const Row kRows[] = {
    {"true", true, true, kNo, kNo},
    {"false", false, false, kNo, kNo},
    {"zero", 0, kNo, 0.0, kNo},
    {"one", 1, kNo, 1.0, kNo},
    {"minus one", -1, kNo, -1.0, kNo},
    {"unsigned", 5u, kNo, 5.0, kNo},
    {"lowest 64-bit", Json::Value(std::numeric_limits<Json::Int64>::min()), kNo,
     -9223372036854775808.0, kNo},
    {"highest unsigned 64-bit", Json::Value(std::numeric_limits<Json::UInt64>::max()), kNo,
     18446744073709551616.0, kNo},
    {"real", 1.5, kNo, 1.5, kNo},
    {"huge real", 1e300, kNo, 1e300, kNo},
    {"smallest real", 5e-324, kNo, 5e-324, kNo},
    {"infinity", std::numeric_limits<double>::infinity(), kNo,
     std::numeric_limits<double>::infinity(), kNo},
    {"text true", "true", kNo, kNo, "true"},
    {"text of a number", "1.5", kNo, kNo, "1.5"},
    {"empty text", "", kNo, kNo, ""},
    {"text", "text", kNo, kNo, "text"},
    {"text with a zero byte", std::string("a\0b", 3), kNo, kNo, std::string("a\0b", 3)},
    {"null", Json::Value(), kNo, kNo, kNo},
    {"array", Parse(R"(["a"])"), kNo, kNo, kNo},
    {"empty array", Json::Value(Json::arrayValue), kNo, kNo, kNo},
    {"object", Parse(R"({"a": true})"), kNo, kNo, kNo},
};

template <typename T>
void Check(const Json::Value& json, const std::optional<T>& wanted, const Json::Value& before) {
    APIParameter<T> parameter;
    ASSERT_TRUE(parameter.ParseValue(before, Json::nullValue));
    const T kept = parameter.Get();
    EXPECT_EQ(parameter.ParseValue(json, Json::nullValue), wanted.has_value());
    EXPECT_EQ(parameter.Get(), wanted.value_or(kept));
}

TEST(BoolParameter, TakesBooleansOnly) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        Check(row.json, row.flag, true);
        Check(row.json, row.flag, false);
    }
}

TEST(RealParameter, TakesNumbersOnly) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        Check(row.json, row.real, 99);
    }
}

TEST(TextParameter, TakesTextsOnly) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        Check(row.json, row.text, "before");
    }
}

struct DocumentRow {
    const char* name;
    Json::Value json;
};

const DocumentRow kDocuments[] = {
    {"null", Json::Value()},
    {"int", 5},
    {"unsigned", 5u},
    {"real", 5.0},
    {"text", "a"},
    {"bool", true},
    {"array", Parse("[1]")},
    {"empty array", Json::Value(Json::arrayValue)},
    {"object", Parse(R"({"a": 1})")},
    {"empty object", Json::Value(Json::objectValue)},
};

TEST(DocumentParameter, TakesExactlyTheTypeAskedFor) {
    for (const DocumentRow& row : kDocuments) {
        for (int type = Json::nullValue; type <= Json::objectValue; ++type) {
            SCOPED_TRACE(std::string(row.name) + " as type " + std::to_string(type));
            APIParameter<Json::Value> parameter;
            const bool same = row.json.type() == type;
            EXPECT_EQ(parameter.ParseValue(row.json, static_cast<Json::ValueType>(type)), same);
            EXPECT_EQ(parameter.Get(), same ? row.json : Json::Value());
        }
    }
}

TEST(DocumentParameter, KeepsACopy) {
    Json::Value source = Parse(R"({"a": 1})");
    APIParameter<Json::Value> parameter;
    ASSERT_TRUE(parameter.ParseValue(source, Json::objectValue));
    source["a"] = 2;
    EXPECT_EQ(parameter.Get(), Parse(R"({"a": 1})"));
}

}  // namespace
