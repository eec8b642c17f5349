#include "webapi/APIParameter.h"

#include <gtest/gtest.h>

#include <limits>

#include "tests/param/States.h"
#include "tests/support/Json.h"

using support::Parse;
using TALO::APIParameter;

namespace {

bool Accept(const int&) {
    return true;
}
bool Refuse(const int&) {
    return false;
}
int asked = 0;
int seen = 0;
bool Ask(const int& value) {
    ++asked;
    seen = value;
    return value < 100;
}

TEST(Parameter, StartsAbsentWithAnEmptyValue) {
    EXPECT_EQ(StateOf(APIParameter<int>()), kAbsent);
    EXPECT_EQ(APIParameter<int>().Get(), 0);
    EXPECT_EQ(APIParameter<unsigned int>().Get(), 0u);
    EXPECT_EQ(APIParameter<long long>().Get(), 0);
    EXPECT_EQ(APIParameter<unsigned long long>().Get(), 0u);
    EXPECT_EQ(APIParameter<bool>().Get(), false);
    EXPECT_EQ(APIParameter<double>().Get(), 0.0);
    EXPECT_EQ(APIParameter<std::string>().Get(), "");
    EXPECT_EQ(APIParameter<Json::Value>().Get(), Json::Value());
}

TEST(Parameter, AnswersTheDefaultWhileAbsent) {
    const APIParameter<int> parameter;
    const int fallback = 7;
    EXPECT_EQ(&parameter.Get(fallback), &fallback);
    EXPECT_EQ(APIParameter<std::string>().Get("none"), "none");
}

TEST(Parameter, TakesAValueOfItsType) {
    APIParameter<int> parameter;
    parameter.CheckValueTypeAndGet(5, Json::intValue, nullptr);
    EXPECT_EQ(StateOf(parameter), kValid);
    EXPECT_EQ(parameter.Get(), 5);
    EXPECT_EQ(parameter.Get(7), 5);
}

TEST(Parameter, TakesAValueThatTheValidatorAccepts) {
    APIParameter<int> parameter;
    parameter.CheckValueTypeAndGet(5, Json::intValue, Accept);
    EXPECT_EQ(StateOf(parameter), kValid);
    EXPECT_EQ(parameter.Get(7), 5);
}

TEST(Parameter, HandsTheParsedValueToTheValidatorOnce) {
    asked = 0;
    APIParameter<int> small;
    small.CheckValueTypeAndGet(99, Json::intValue, Ask);
    EXPECT_EQ(asked, 1);
    EXPECT_EQ(seen, 99);
    EXPECT_EQ(StateOf(small), kValid);
    APIParameter<int> large;
    large.CheckValueTypeAndGet(100, Json::intValue, Ask);
    EXPECT_EQ(seen, 100);
    EXPECT_EQ(StateOf(large), kBad);
}

TEST(Parameter, KeepsTheParsedValueThatTheValidatorRefuses) {
    APIParameter<int> parameter;
    parameter.CheckValueTypeAndGet(5, Json::intValue, Refuse);
    EXPECT_EQ(StateOf(parameter), kBad);
    EXPECT_EQ(parameter.Get(), 5);
    EXPECT_EQ(parameter.Get(7), 7);
}

TEST(Parameter, CountsANullAsSetAndResetWithoutAskingTheValidator) {
    asked = 0;
    APIParameter<int> parameter;
    parameter.CheckValueTypeAndGet(Json::Value(), Json::intValue, Ask);
    EXPECT_EQ(StateOf(parameter), kNull);
    EXPECT_EQ(asked, 0);
    EXPECT_EQ(parameter.Get(), 0);
    EXPECT_EQ(parameter.Get(7), 0) << "a null is a value, no reason for the default";
}

TEST(Parameter, AnswersTheEmptyValueOfEachTypeForANull) {
    APIParameter<std::string> text;
    text.CheckValueTypeAndGet(Json::Value(), Json::stringValue, nullptr);
    EXPECT_EQ(text.Get("none"), "");
    APIParameter<bool> flag;
    flag.CheckValueTypeAndGet(Json::Value(), Json::booleanValue, nullptr);
    EXPECT_FALSE(flag.Get(true));
    APIParameter<Json::Value> object;
    object.CheckValueTypeAndGet(Json::Value(), Json::objectValue, nullptr);
    EXPECT_EQ(StateOf(object), kNull);
    EXPECT_EQ(object.Get(Json::Value("none")), Json::Value());
}

TEST(Parameter, RefusesAnotherTypeWithoutAskingTheValidator) {
    asked = 0;
    APIParameter<int> parameter;
    parameter.CheckValueTypeAndGet("10", Json::intValue, Ask);
    EXPECT_EQ(StateOf(parameter), kBad);
    EXPECT_EQ(asked, 0);
    EXPECT_EQ(parameter.Get(), 0);
    EXPECT_EQ(parameter.Get(7), 7);
}

TEST(Parameter, LeavesTheValueUntouchedWhenParsingFails) {
    APIParameter<int> parameter;
    ASSERT_TRUE(parameter.ParseValue(5, Json::intValue));
    EXPECT_FALSE(parameter.ParseValue("text", Json::intValue));
    EXPECT_EQ(parameter.Get(), 5);
}

TEST(Parameter, RaisesNoFlagByParsingAlone) {
    APIParameter<int> parameter;
    EXPECT_TRUE(parameter.ParseValue(5, Json::intValue));
    EXPECT_FALSE(parameter.ParseValue("text", Json::intValue));
    EXPECT_EQ(StateOf(parameter), kAbsent);
}

TEST(Parameter, RaisesEachFlagOnItsOwn) {
    APIParameter<int> set;
    set.MarkSet();
    EXPECT_EQ(StateOf(set), (State{true, false, false}));
    APIParameter<int> reset;
    reset.MarkReset();
    EXPECT_EQ(StateOf(reset), (State{false, true, false}));
    APIParameter<int> invalid;
    invalid.MarkInvalid();
    EXPECT_EQ(StateOf(invalid), (State{false, false, true}));
}

TEST(Parameter, NeverLowersAFlag) {
    APIParameter<int> parameter;
    parameter.MarkSet();
    parameter.MarkReset();
    parameter.MarkInvalid();
    parameter.MarkSet();
    parameter.MarkReset();
    parameter.MarkInvalid();
    parameter.CheckValueTypeAndGet(5, Json::intValue, nullptr);
    EXPECT_EQ(StateOf(parameter), (State{true, true, true}));
    EXPECT_EQ(parameter.Get(), 5);
}

TEST(Parameter, AnswersTheDefaultUnlessSetAndNotInvalid) {
    const bool kBools[] = {false, true};
    for (const bool set : kBools) {
        for (const bool reset : kBools) {
            for (const bool invalid : kBools) {
                APIParameter<int> parameter;
                ASSERT_TRUE(parameter.ParseValue(5, Json::intValue));
                set ? parameter.MarkSet() : void();
                reset ? parameter.MarkReset() : void();
                invalid ? parameter.MarkInvalid() : void();
                EXPECT_EQ(parameter.Get(), 5);
                EXPECT_EQ(parameter.Get(7), set && !invalid ? 5 : 7);
            }
        }
    }
}

APIParameter<std::string> Bad(const char* value) {
    APIParameter<std::string> parameter;
    parameter.CheckValueTypeAndGet(value, Json::stringValue,
                                   [](const std::string&) { return false; });
    return parameter;
}

TEST(Parameter, CopiesValueAndFlags) {
    const APIParameter<std::string> copy(Bad("text"));
    EXPECT_EQ(StateOf(copy), kBad);
    EXPECT_EQ(copy.Get(), "text");
}

TEST(Parameter, AssignsValueAndFlagsAlsoDownwards) {
    APIParameter<std::string> parameter = Bad("text");
    APIParameter<std::string> other;
    other.MarkReset();
    APIParameter<std::string>& result = parameter = other;
    EXPECT_EQ(&result, &parameter);
    EXPECT_EQ(StateOf(parameter), (State{false, true, false}));
    EXPECT_EQ(parameter.Get(), "");
}

TEST(Parameter, SurvivesAssignmentToItself) {
    APIParameter<std::string> parameter = Bad("text");
    const APIParameter<std::string>& same = parameter;
    parameter = same;
    EXPECT_EQ(StateOf(parameter), kBad);
    EXPECT_EQ(parameter.Get(), "text");
}

TEST(Parameter, LeavesTheOriginalAloneWhenACopyChanges) {
    APIParameter<int> original;
    original.CheckValueTypeAndGet(5, Json::intValue, nullptr);
    APIParameter<int> copy(original);
    APIParameter<int> assigned;
    assigned = original;
    ASSERT_TRUE(copy.ParseValue(6, Json::intValue));
    ASSERT_TRUE(assigned.ParseValue(7, Json::intValue));
    copy.MarkInvalid();
    assigned.MarkInvalid();
    EXPECT_EQ(original.Get(), 5);
    EXPECT_EQ(StateOf(original), kValid);
}

TEST(Parameter, ComparesValuesAndNeverFlags) {
    APIParameter<int> five;
    ASSERT_TRUE(five.ParseValue(5, Json::intValue));
    APIParameter<int> flagged(five);
    flagged.MarkSet();
    flagged.MarkInvalid();
    flagged.MarkReset();
    const APIParameter<int> zero;
    EXPECT_TRUE(five == flagged);
    EXPECT_FALSE(five != flagged);
    EXPECT_FALSE(five == zero);
    EXPECT_TRUE(five != zero);
    EXPECT_TRUE(five == 5);
    EXPECT_FALSE(five != 5);
    EXPECT_FALSE(five == 6);
    EXPECT_TRUE(five != 6);
}

TEST(Parameter, ComparesTextsByContent) {
    APIParameter<std::string> text;
    ASSERT_TRUE(text.ParseValue("text", Json::stringValue));
    EXPECT_TRUE(text == std::string("text"));
    EXPECT_TRUE(text != std::string("Text"));
    EXPECT_TRUE(text != std::string("text", 5));
}

TEST(Parameter, ComparesDoublesExactly) {
    APIParameter<double> real;
    ASSERT_TRUE(real.ParseValue(0.1 + 0.2, Json::realValue));
    EXPECT_FALSE(real == 0.3);
    EXPECT_TRUE(real == 0.1 + 0.2);
}

TEST(Parameter, ComparesDocumentsAsTheJsonLibraryDoes) {
    APIParameter<Json::Value> object;
    ASSERT_TRUE(object.ParseValue(Parse(R"({"a": [1, {"b": null}]})"), Json::objectValue));
    EXPECT_TRUE(object == Parse(R"({"a": [1, {"b": null}]})"));
    EXPECT_TRUE(object != Parse(R"({"a": [1.0, {"b": null}]})"));
}

}  // namespace
