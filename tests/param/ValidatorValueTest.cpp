#include <gtest/gtest.h>

#include <limits>
#include <string>

#include "tests/support/Json.h"
#include "webapi/APIValidator.h"

using support::Parse;
using TALO::APIParameter;
using TALO::APIValidator;

namespace {

constexpr int kLowest = std::numeric_limits<int>::min();
constexpr int kHighest = std::numeric_limits<int>::max();

template <typename T>
APIParameter<T> Given(const Json::Value& json) {
    APIParameter<T> parameter;
    parameter.CheckValueTypeAndGet(json, json.type(), nullptr);
    return parameter;
}

// Holds its value all the same, as after a refusal by a validator.
template <typename T>
APIParameter<T> Invalid(const Json::Value& json) {
    APIParameter<T> parameter = Given<T>(json);
    parameter.MarkInvalid();
    return parameter;
}

TEST(IsPort, TakesSixteenBits) {
    const struct {
        const char* name;
        int port;
        bool passes;
    } rows[] = {
        {"zero", 0, true},
        {"one", 1, true},
        {"a common one", 443, true},
        {"one below the highest", 65534, true},
        {"highest", 65535, true},
        {"one above", 65536, false},
        {"same low bits as zero", 1 << 16, false},
        {"same low bits as 80", (1 << 16) + 80, false},
        {"highest int", kHighest, false},
        {"minus one", -1, false},
        {"same low bits as the highest", -65536 + 65535, false},
        {"same low bits as 80, negative", -65536 + 80, false},
        {"lowest int", kLowest, false},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(APIValidator::IsPort(row.port), row.passes) << row.name;
    }
}

TEST(IsPort, FitsAsTheValidatorOfAParameter) {
    APIParameter<int> good;
    good.CheckValueTypeAndGet(8080, Json::intValue, APIValidator::IsPort);
    EXPECT_FALSE(good.IsInvalid());
    APIParameter<int> bad;
    bad.CheckValueTypeAndGet(65536, Json::intValue, APIValidator::IsPort);
    EXPECT_TRUE(bad.IsInvalid());
}

TEST(IsLessAndIsGreater, ExcludeTheBound) {
    const struct {
        int value;
        int bound;
        bool less;
        bool greater;
    } rows[] = {
        {5, 5, false, false},
        {4, 5, true, false},
        {6, 5, false, true},
        {-1, 0, true, false},
        {0, -1, false, true},
        {kLowest, kLowest, false, false},
        {kLowest, kHighest, true, false},
        {kHighest, kLowest, false, true},
        {kHighest, kHighest, false, false},
    };
    for (const auto& row : rows) {
        const APIParameter<int> value = Given<int>(row.value);
        EXPECT_EQ(APIValidator::IsLess(value, row.bound), row.less) << row.value << row.bound;
        EXPECT_EQ(APIValidator::IsGreater(value, row.bound), row.greater) << row.value << row.bound;
    }
}

TEST(IsBetween, IncludesBothBounds) {
    const struct {
        const char* name;
        int value;
        int low;
        int high;
        bool passes;
    } rows[] = {
        {"inside", 5, 1, 9, true},
        {"at the low bound", 1, 1, 9, true},
        {"at the high bound", 9, 1, 9, true},
        {"one below", 0, 1, 9, false},
        {"one above", 10, 1, 9, false},
        {"bounds are one", 3, 3, 3, true},
        {"bounds are one, above", 4, 3, 3, false},
        {"bounds changed round", 5, 9, 1, false},
        {"negative", -5, -9, -1, true},
        {"negative, one above", 0, -9, -1, false},
        {"lowest of all", kLowest, kLowest, kHighest, true},
        {"highest of all", kHighest, kLowest, kHighest, true},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(APIValidator::IsBetween(Given<int>(row.value), row.low, row.high), row.passes)
            << row.name;
    }
}

TEST(Bounds, RefuseAnInvalidParameterWhateverItHolds) {
    const APIParameter<int> invalid = Invalid<int>(5);
    ASSERT_EQ(invalid.Get(), 5);
    EXPECT_FALSE(APIValidator::IsLess(invalid, 9));
    EXPECT_FALSE(APIValidator::IsGreater(invalid, 1));
    EXPECT_FALSE(APIValidator::IsBetween(invalid, 1, 9));
}

TEST(Bounds, TestTheZeroOfAnAbsentOrNullParameter) {
    for (const APIParameter<int>& zero : {APIParameter<int>(), Given<int>(Json::Value())}) {
        EXPECT_TRUE(APIValidator::IsLess(zero, 1));
        EXPECT_FALSE(APIValidator::IsLess(zero, 0));
        EXPECT_TRUE(APIValidator::IsGreater(zero, -1));
        EXPECT_FALSE(APIValidator::IsGreater(zero, 0));
        EXPECT_TRUE(APIValidator::IsBetween(zero, 0, 0));
    }
}

TEST(IsBelong, FindsATextInAList) {
    const Json::Value nul = std::string("a\0b", 3);
    Json::Value nulList(Json::arrayValue);
    nulList.append(nul);
    Json::Value cutList = Parse(R"(["a"])");
    const struct {
        const char* name;
        Json::Value value;
        Json::Value list;
        bool passes;
    } rows[] = {
        {"first", "a", Parse(R"(["a", "b"])"), true},
        {"last", "b", Parse(R"(["a", "b"])"), true},
        {"none", "c", Parse(R"(["a", "b"])"), false},
        {"another case", "A", Parse(R"(["a", "b"])"), false},
        {"a prefix", "a", Parse(R"(["ab"])"), false},
        {"empty list", "a", Json::Value(Json::arrayValue), false},
        {"empty text in the list", "", Parse(R"(["a", ""])"), true},
        {"empty text not in the list", "", Parse(R"(["a"])"), false},
        {"empty text is not null", "", Parse("[null]"), false},
        {"text is no number", "1", Parse("[1]"), false},
        {"text is not in a nested list", "a", Parse(R"([["a"]])"), false},
        {"mixed list", "a", Parse(R"([1, null, {"a": 1}, "a"])"), true},
        {"NUL inside", nul, nulList, true},
        {"NUL inside, cut in the list", nul, cutList, false},
        {"list is null", "a", Json::Value(), false},
        {"list is an object", "a", Parse(R"({"a": "a"})"), false},
        {"list is that text", "a", "a", false},
        {"list is a number", "a", 1, false},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(APIValidator::IsBelong(Given<std::string>(row.value), row.list), row.passes)
            << row.name;
        EXPECT_FALSE(APIValidator::IsBelong(Invalid<std::string>(row.value), row.list)) << row.name;
    }
}

TEST(IsBelong, FindsEachElementInAList) {
    const struct {
        const char* name;
        const char* value;
        const char* list;
        bool passes;
    } rows[] = {
        {"all", R"(["a", "b"])", R"(["b", "a"])", true},
        {"some of them", R"(["b"])", R"(["a", "b", "c"])", true},
        {"one twice", R"(["a", "a"])", R"(["a"])", true},
        {"one more", R"(["a", "c"])", R"(["a", "b"])", false},
        {"the first only is missing", R"(["c", "a"])", R"(["a", "b"])", false},
        {"none", R"(["c"])", R"(["a", "b"])", false},
        {"no element", "[]", R"(["a"])", true},
        {"no element, empty list", "[]", "[]", true},
        {"empty list", R"(["a"])", "[]", false},
        {"numbers", "[1, 3]", "[1, 2, 3]", true},
        {"numbers are no texts", "[1]", R"(["1"])", false},
        {"nulls", "[null]", "[null]", true},
        {"null is not there", "[null]", R"(["a"])", false},
        {"objects", R"([{"a": 1}])", R"([{"a": 1}, 2])", true},
        {"objects that differ", R"([{"a": 1}])", R"([{"a": 2}])", false},
        {"list is an object", R"(["a"])", R"({"a": "a"})", false},
        {"list is null", R"(["a"])", "null", false},
        {"list is a text", R"(["a"])", R"("a")", false},
        {"no element, list is null", "[]", "null", false},
        {"values of an object", R"({"x": "a", "y": "b"})", R"(["a", "b"])", true},
        {"values of an object, one more", R"({"x": "a", "y": "c"})", R"(["a", "b"])", false},
    };
    for (const auto& row : rows) {
        const Json::Value value = Parse(row.value);
        EXPECT_EQ(APIValidator::IsBelong(Given<Json::Value>(value), Parse(row.list)), row.passes)
            << row.name;
        EXPECT_FALSE(APIValidator::IsBelong(Invalid<Json::Value>(value), Parse(row.list)))
            << row.name;
    }
}

TEST(IsBelong, TakesTheNullOfAnAbsentParameterForNoElement) {
    EXPECT_TRUE(APIValidator::IsBelong(APIParameter<Json::Value>(), Parse(R"(["a"])")));
    EXPECT_FALSE(APIValidator::IsBelong(APIParameter<Json::Value>(), Json::Value()));
}

TEST(IsEqual, ComparesByteForByte) {
    const struct {
        const char* name;
        std::string value;
        const char* text;
        bool passes;
    } rows[] = {
        {"equal", "auto", "auto", true},
        {"both empty", "", "", true},
        {"another case", "Auto", "auto", false},
        {"value is longer", "autos", "auto", false},
        {"value is shorter", "aut", "auto", false},
        {"value is empty", "", "auto", false},
        {"text is empty", "auto", "", false},
        {"blank behind", "auto ", "auto", false},
        {"UTF-8", "\xC3\xA9", "\xC3\xA9", true},
        {"last byte differs", "\xC3\xA9", "\xC3\xA8", false},
        {"composed and decomposed", "\xC3\xA9", "e\xCC\x81", false},
        {"NUL behind", std::string("auto\0", 5), "auto", false},
        {"NUL inside", std::string("auto\0x", 6), "auto", false},
        {"NUL alone", std::string(1, '\0'), "", false},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(APIValidator::IsEqual(Given<std::string>(row.value), row.text), row.passes)
            << row.name;
        EXPECT_FALSE(APIValidator::IsEqual(Invalid<std::string>(row.value), row.text)) << row.name;
    }
}

TEST(IsEqual, RefusesNull) {
    EXPECT_FALSE(APIValidator::IsEqual(Given<std::string>("auto"), nullptr));
    EXPECT_FALSE(APIValidator::IsEqual(Given<std::string>(""), nullptr));
}

}  // namespace
