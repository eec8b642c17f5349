#include <gtest/gtest.h>

#include "tests/param/States.h"
#include "tests/support/Json.h"
#include "webapi/APIParameter.h"

using support::Parse;
using TALO::APIParameter;
using TALO::APIParameterFactory;
using TALO::OPTIONAL;
using TALO::REQUIRED;

namespace {

template <typename T>
APIParameter<T> Read(const char* object, TALO::PARAM_NECESSITY necessity = OPTIONAL,
                     typename APIParameter<T>::Validator validator = nullptr) {
    return TALO::APIParameterFactoryBasicImpl<T>::FromJson(Parse(object), "it", necessity,
                                                           validator);
}

TEST(ParameterFactory, ReadsEachScalarType) {
    EXPECT_EQ(Read<int>(R"({"it": -5})").Get(7), -5);
    EXPECT_EQ(Read<unsigned int>(R"({"it": 4294967295})").Get(7), 4294967295u);
    EXPECT_EQ(Read<long long>(R"({"it": -5000000000})").Get(7), -5000000000ll);
    EXPECT_EQ(Read<unsigned long long>(R"({"it": 18446744073709551615})").Get(7),
              18446744073709551615u);
    EXPECT_TRUE(Read<bool>(R"({"it": true})").Get(false));
    EXPECT_EQ(Read<double>(R"({"it": 1})").Get(7), 1.0);
    EXPECT_EQ(Read<std::string>(R"({"it": "text"})").Get("none"), "text");
}

TEST(ParameterFactory, RefusesEachScalarOfAnotherType) {
    EXPECT_EQ(StateOf(Read<int>(R"({"it": "5"})")), kBad);
    EXPECT_EQ(StateOf(Read<unsigned int>(R"({"it": -1})")), kBad);
    EXPECT_EQ(StateOf(Read<long long>(R"({"it": 9223372036854775808})")), kBad);
    EXPECT_EQ(StateOf(Read<unsigned long long>(R"({"it": -1})")), kBad);
    EXPECT_EQ(StateOf(Read<bool>(R"({"it": 1})")), kBad);
    EXPECT_EQ(StateOf(Read<double>(R"({"it": "1.5"})")), kBad);
    EXPECT_EQ(StateOf(Read<std::string>(R"({"it": 5})")), kBad);
}

TEST(ParameterFactory, TellsAbsentFromMissing) {
    EXPECT_EQ(StateOf(Read<int>(R"({"other": 5})", OPTIONAL)), kAbsent);
    EXPECT_EQ(StateOf(Read<int>(R"({"other": 5})", REQUIRED)), kMissing);
    EXPECT_EQ(StateOf(Read<int>("{}", OPTIONAL)), kAbsent);
    EXPECT_EQ(StateOf(Read<int>("{}", REQUIRED)), kMissing);
    EXPECT_EQ(Read<int>("{}", OPTIONAL).Get(7), 7);
    EXPECT_EQ(Read<int>("{}", REQUIRED).Get(7), 7);
}

TEST(ParameterFactory, CountsAnyNecessityButRequiredAsOptional) {
    for (const int necessity : {1, 2, -1, 1000}) {
        EXPECT_EQ(StateOf(Read<int>("{}", static_cast<TALO::PARAM_NECESSITY>(necessity))), kAbsent);
    }
}

TEST(ParameterFactory, ReadsANullMember) {
    EXPECT_EQ(StateOf(Read<int>(R"({"it": null})", REQUIRED)), kNull);
    EXPECT_EQ(StateOf(Read<int>(R"({"it": null})", OPTIONAL)), kNull);
    EXPECT_EQ(Read<int>(R"({"it": null})").Get(7), 0);
}

TEST(ParameterFactory, CountsASourceThatIsNoObjectAsMissing) {
    for (const char* source : {"[5]", "[]", "null", "5", R"("it")", "true"}) {
        SCOPED_TRACE(source);
        EXPECT_EQ(StateOf(Read<int>(source, OPTIONAL)), kMissing);
        EXPECT_EQ(StateOf(Read<int>(source, REQUIRED)), kMissing);
        const Json::Value json = Parse(source);
        EXPECT_EQ(StateOf(APIParameterFactory::ObjectFromJson(json, "it", OPTIONAL, nullptr)),
                  kMissing);
        EXPECT_EQ(StateOf(APIParameterFactory::ArrayFromJson(json, "it", OPTIONAL, nullptr)),
                  kMissing);
    }
}

TEST(ParameterFactory, AsksTheValidator) {
    const auto isSmall = [](const int& value) { return value < 10; };
    EXPECT_EQ(StateOf(Read<int>(R"({"it": 9})", REQUIRED, isSmall)), kValid);
    const APIParameter<int> refused = Read<int>(R"({"it": 10})", REQUIRED, isSmall);
    EXPECT_EQ(StateOf(refused), kBad);
    EXPECT_EQ(refused.Get(), 10);
}

TEST(ParameterFactory, TakesAnObjectOnlyWhereOneIsDemanded) {
    const Json::Value source =
        Parse(R"({"object": {"a": 1}, "empty": {}, "array": [1], "text": "a", "null": null})");
    const auto read = [&](const char* name, TALO::PARAM_NECESSITY necessity = OPTIONAL) {
        return APIParameterFactory::ObjectFromJson(source, name, necessity, nullptr);
    };
    EXPECT_EQ(StateOf(read("object")), kValid);
    EXPECT_EQ(read("object").Get(), Parse(R"({"a": 1})"));
    EXPECT_EQ(StateOf(read("empty")), kValid);
    EXPECT_EQ(StateOf(read("array")), kBad);
    EXPECT_EQ(StateOf(read("text")), kBad);
    EXPECT_EQ(StateOf(read("null")), kNull);
    EXPECT_EQ(StateOf(read("none")), kAbsent);
    EXPECT_EQ(StateOf(read("none", REQUIRED)), kMissing);
}

TEST(ParameterFactory, TakesAnArrayOnlyWhereOneIsDemanded) {
    const Json::Value source =
        Parse(R"({"object": {"a": 1}, "empty": [], "array": [1], "text": "a", "null": null})");
    const auto read = [&](const char* name, TALO::PARAM_NECESSITY necessity = OPTIONAL) {
        return APIParameterFactory::ArrayFromJson(source, name, necessity, nullptr);
    };
    EXPECT_EQ(StateOf(read("array")), kValid);
    EXPECT_EQ(read("array").Get(), Parse("[1]"));
    EXPECT_EQ(StateOf(read("empty")), kValid);
    EXPECT_EQ(StateOf(read("object")), kBad);
    EXPECT_EQ(StateOf(read("text")), kBad);
    EXPECT_EQ(StateOf(read("null")), kNull);
    EXPECT_EQ(StateOf(read("none")), kAbsent);
    EXPECT_EQ(StateOf(read("none", REQUIRED)), kMissing);
}

TEST(ParameterFactory, HandsDocumentsToTheValidator) {
    const auto hasTwo = [](const Json::Value& value) { return value.size() == 2; };
    const Json::Value source = Parse(R"({"one": [1], "two": [1, 2], "o1": {"a": 1}})");
    EXPECT_EQ(StateOf(APIParameterFactory::ArrayFromJson(source, "two", REQUIRED, hasTwo)), kValid);
    EXPECT_EQ(StateOf(APIParameterFactory::ArrayFromJson(source, "one", REQUIRED, hasTwo)), kBad);
    EXPECT_EQ(StateOf(APIParameterFactory::ObjectFromJson(source, "o1", REQUIRED, hasTwo)), kBad);
}

}  // namespace
