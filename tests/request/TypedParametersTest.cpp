#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/param/States.h"
#include "tests/support/Json.h"
#include "webapi/APIRequest.h"

using support::Parse;
using TALO::APIRequest;

namespace {

const APIRequest::PARAM_NECESSITY kRequired = APIRequest::REQUIRED;
const APIRequest::PARAM_NECESSITY kOptional = APIRequest::OPTIONAL;

template <typename T>
bool RefuseAll(const T&) {
    return false;
}

class TypedParameters : public ::testing::Test {
  protected:
    APIRequest request{Parse(R"({"environ": {"env": "1"}, "getParam": {
        "null": null, "true": true, "five": 5, "minus": -1, "real": 1.5, "whole": 5.0,
        "ten": "10", "text": "text", "list": [1, 2], "empty": [], "object": {"a": 1}, "none": {},
        "int+1": 2147483648, "unsigned": 4294967295, "unsigned+1": 4294967296,
        "long+1": 9223372036854775808}})")};
};

TEST_F(TypedParameters, ReadAnInt) {
    EXPECT_EQ(request.GetAndCheckInt("five", kRequired, nullptr).Get(7), 5);
    EXPECT_EQ(request.GetAndCheckInt("minus", kOptional, nullptr).Get(7), -1);
    EXPECT_EQ(request.GetAndCheckInt("whole", kOptional, nullptr).Get(7), 5);
    for (const char* name : {"ten", "text", "true", "real", "int+1", "list", "object"}) {
        EXPECT_EQ(StateOf(request.GetAndCheckInt(name, kOptional, nullptr)), kBad) << name;
    }
    EXPECT_EQ(request.GetAndCheckInt("ten", kOptional, nullptr).Get(7), 7);
}

TEST_F(TypedParameters, ReadABool) {
    EXPECT_TRUE(request.GetAndCheckBool("true", kRequired, nullptr).Get(false));
    for (const char* name : {"five", "text", "ten", "real", "list", "object"}) {
        EXPECT_EQ(StateOf(request.GetAndCheckBool(name, kOptional, nullptr)), kBad) << name;
    }
}

TEST_F(TypedParameters, ReadAReal) {
    EXPECT_EQ(request.GetAndCheckReal("real", kRequired, nullptr).Get(7), 1.5);
    EXPECT_EQ(request.GetAndCheckReal("five", kRequired, nullptr).Get(7), 5.0);
    EXPECT_EQ(request.GetAndCheckReal("minus", kRequired, nullptr).Get(7), -1.0);
    EXPECT_EQ(request.GetAndCheckReal("long+1", kRequired, nullptr).Get(7), 9223372036854775808.0);
    for (const char* name : {"ten", "true", "list", "object"}) {
        EXPECT_EQ(StateOf(request.GetAndCheckReal(name, kOptional, nullptr)), kBad) << name;
    }
}

TEST_F(TypedParameters, ReadAString) {
    EXPECT_EQ(request.GetAndCheckString("text", kRequired, nullptr).Get("x"), "text");
    EXPECT_EQ(request.GetAndCheckString("ten", kRequired, nullptr).Get("x"), "10");
    for (const char* name : {"five", "true", "real", "list", "object"}) {
        EXPECT_EQ(StateOf(request.GetAndCheckString(name, kOptional, nullptr)), kBad) << name;
    }
}

TEST_F(TypedParameters, ReadAnObject) {
    EXPECT_EQ(request.GetAndCheckObject("object", kRequired, nullptr).Get(Json::Value()),
              Parse(R"({"a": 1})"));
    EXPECT_EQ(StateOf(request.GetAndCheckObject("none", kRequired, nullptr)), kValid);
    for (const char* name : {"list", "empty", "text", "five", "true"}) {
        EXPECT_EQ(StateOf(request.GetAndCheckObject(name, kOptional, nullptr)), kBad) << name;
    }
}

TEST_F(TypedParameters, ReadAnArray) {
    EXPECT_EQ(request.GetAndCheckArray("list", kRequired, nullptr).Get(Json::Value()),
              Parse("[1, 2]"));
    EXPECT_EQ(StateOf(request.GetAndCheckArray("empty", kRequired, nullptr)), kValid);
    for (const char* name : {"object", "none", "text", "five", "true"}) {
        EXPECT_EQ(StateOf(request.GetAndCheckArray(name, kOptional, nullptr)), kBad) << name;
    }
}

TEST_F(TypedParameters, ReadAnUnsignedInt) {
    const auto read = [&](const char* name) {
        return request.GetAndCheckIntegral<unsigned int>(name, kRequired, nullptr);
    };
    EXPECT_EQ(read("int+1").Get(7), 2147483648u);
    EXPECT_EQ(read("unsigned").Get(7), 4294967295u);
    EXPECT_EQ(StateOf(read("unsigned+1")), kBad);
    EXPECT_EQ(StateOf(read("minus")), kBad);
    EXPECT_EQ(StateOf(read("ten")), kBad);
}

TEST_F(TypedParameters, ReadALongLong) {
    const auto read = [&](const char* name) {
        return request.GetAndCheckIntegral<long long>(name, kRequired, nullptr);
    };
    EXPECT_EQ(read("int+1").Get(7), 2147483648ll);
    EXPECT_EQ(read("unsigned+1").Get(7), 4294967296ll);
    EXPECT_EQ(read("minus").Get(7), -1);
    EXPECT_EQ(StateOf(read("long+1")), kBad);
    EXPECT_EQ(StateOf(read("real")), kBad);
}

TEST_F(TypedParameters, ReadAnUnsignedLongLong) {
    const auto read = [&](const char* name) {
        return request.GetAndCheckIntegral<unsigned long long>(name, kRequired, nullptr);
    };
    EXPECT_EQ(read("long+1").Get(7), 9223372036854775808u);
    EXPECT_EQ(read("five").Get(7), 5u);
    EXPECT_EQ(StateOf(read("minus")), kBad);
    EXPECT_EQ(StateOf(read("true")), kBad);
}

struct UnitRow {
    const char* name;
    const char* array;
};

const UnitRow kUnits[] = {
    {"text", R"(["text"])"}, {"five", "[5]"},    {"true", "[true]"}, {"object", R"([{"a": 1}])"},
    {"none", "[{}]"},        {"null", "[null]"}, {"list", "[1, 2]"}, {"empty", "[]"},
};

TEST_F(TypedParameters, WrapASingleValueIntoAnArray) {
    for (const UnitRow& row : kUnits) {
        const auto parameter = request.GetAndCheckUnitArray(row.name, kRequired, nullptr);
        EXPECT_EQ(StateOf(parameter), kValid) << row.name;
        EXPECT_EQ(parameter.Get(), Parse(row.array)) << row.name;
    }
    EXPECT_EQ(request.GetParam("text", Json::Value()), Json::Value("text"));
}

TEST_F(TypedParameters, HandTheWrappedArrayToTheValidator) {
    const auto isOneText = [](const Json::Value& value) {
        return value.size() == 1 && value[0].isString();
    };
    EXPECT_EQ(StateOf(request.GetAndCheckUnitArray("text", kRequired, isOneText)), kValid);
    EXPECT_EQ(StateOf(request.GetAndCheckUnitArray("list", kRequired, isOneText)), kBad);
    EXPECT_EQ(StateOf(request.GetAndCheckUnitArray("null", kRequired, isOneText)), kBad);
}

// The state in which each operation answers a parameter.
std::vector<State> States(const APIRequest& request, const char* name,
                          APIRequest::PARAM_NECESSITY necessity) {
    return {StateOf(request.GetAndCheckInt(name, necessity, nullptr)),
            StateOf(request.GetAndCheckBool(name, necessity, nullptr)),
            StateOf(request.GetAndCheckReal(name, necessity, nullptr)),
            StateOf(request.GetAndCheckString(name, necessity, nullptr)),
            StateOf(request.GetAndCheckObject(name, necessity, nullptr)),
            StateOf(request.GetAndCheckArray(name, necessity, nullptr)),
            StateOf(request.GetAndCheckIntegral<unsigned int>(name, necessity, nullptr)),
            StateOf(request.GetAndCheckIntegral<long long>(name, necessity, nullptr)),
            StateOf(request.GetAndCheckIntegral<unsigned long long>(name, necessity, nullptr)),
            StateOf(request.GetAndCheckUnitArray(name, necessity, nullptr))};
}

TEST_F(TypedParameters, TellAbsentFromMissing) {
    for (const char* name : {"absent", "env", ""}) {
        SCOPED_TRACE(name);
        EXPECT_EQ(States(request, name, kOptional), std::vector<State>(10, kAbsent));
        EXPECT_EQ(States(request, name, kRequired), std::vector<State>(10, kMissing));
        EXPECT_EQ(request.GetAndCheckInt(name, kOptional, nullptr).Get(7), 7);
        EXPECT_EQ(request.GetAndCheckInt(name, kRequired, nullptr).Get(7), 7);
    }
}

TEST_F(TypedParameters, CountAnyNecessityButRequiredAsOptional) {
    for (const int necessity : {2, -1, 1000}) {
        EXPECT_EQ(States(request, "absent", static_cast<APIRequest::PARAM_NECESSITY>(necessity)),
                  std::vector<State>(10, kAbsent));
    }
}

TEST_F(TypedParameters, ReadANullButNeverAsAUnitArray) {
    std::vector<State> wanted(10, kNull);
    wanted.back() = kValid;
    EXPECT_EQ(States(request, "null", kRequired), wanted);
    EXPECT_EQ(States(request, "null", kOptional), wanted);
    EXPECT_EQ(request.GetAndCheckInt("null", kRequired, nullptr).Get(7), 0);
}

TEST_F(TypedParameters, KeepTheValueThatTheValidatorRefuses) {
    const auto number = request.GetAndCheckInt("five", kOptional, RefuseAll<int>);
    EXPECT_EQ(StateOf(number), kBad);
    EXPECT_EQ(number.Get(), 5);
    EXPECT_EQ(number.Get(7), 7);
    EXPECT_EQ(request.GetAndCheckBool("true", kOptional, RefuseAll<bool>).Get(), true);
    EXPECT_EQ(StateOf(request.GetAndCheckBool("true", kOptional, RefuseAll<bool>)), kBad);
    EXPECT_EQ(StateOf(request.GetAndCheckReal("real", kOptional, RefuseAll<double>)), kBad);
    EXPECT_EQ(StateOf(request.GetAndCheckString("text", kOptional, RefuseAll<std::string>)), kBad);
    EXPECT_EQ(StateOf(request.GetAndCheckObject("object", kOptional, RefuseAll<Json::Value>)),
              kBad);
    EXPECT_EQ(StateOf(request.GetAndCheckArray("list", kOptional, RefuseAll<Json::Value>)), kBad);
    EXPECT_EQ(
        StateOf(request.GetAndCheckIntegral<long long>("five", kOptional, RefuseAll<long long>)),
        kBad);
}

TEST_F(TypedParameters, DoNotAskTheValidatorAboutNullOrAbsence) {
    EXPECT_EQ(StateOf(request.GetAndCheckInt("null", kOptional, RefuseAll<int>)), kNull);
    EXPECT_EQ(StateOf(request.GetAndCheckInt("absent", kOptional, RefuseAll<int>)), kAbsent);
    EXPECT_EQ(StateOf(request.GetAndCheckUnitArray("absent", kOptional, RefuseAll<Json::Value>)),
              kAbsent);
}

}  // namespace
