#include <gtest/gtest.h>

#include <cstring>
#include <type_traits>

#include "webapi/APIParameter.h"

using TALO::APIParameter;

// API libraries built against an earlier release carry these in their code.

namespace {

template <typename T>
class ParameterLayout : public ::testing::Test {};

typedef ::testing::Types<int, unsigned int, long long, unsigned long long, bool, double,
                         std::string, Json::Value>
    ParameterTypes;
TYPED_TEST_SUITE(ParameterLayout, ParameterTypes, );

template <typename T>
const unsigned char* Record(const APIParameter<T>& parameter) {
    const unsigned char* record = nullptr;
    std::memcpy(&record, &parameter, sizeof record);
    return record;
}

TYPED_TEST(ParameterLayout, IsOnePointer) {
    EXPECT_EQ(sizeof(APIParameter<TypeParam>), sizeof(void*));
    EXPECT_FALSE(std::is_polymorphic<APIParameter<TypeParam>>::value);
}

TYPED_TEST(ParameterLayout, KeepsTheFlagsInOrderBeforeTheValue) {
    APIParameter<TypeParam> parameter;
    const unsigned char* record = Record(parameter);
    EXPECT_EQ(record[0] + record[1] + record[2], 0);
    parameter.MarkSet();
    EXPECT_EQ(record[0], 1);
    EXPECT_EQ(record[1] + record[2], 0);
    parameter.MarkReset();
    EXPECT_EQ(record[1], 1);
    EXPECT_EQ(record[2], 0);
    parameter.MarkInvalid();
    EXPECT_EQ(record[2], 1);
    const size_t aligned = (3 + alignof(TypeParam) - 1) / alignof(TypeParam) * alignof(TypeParam);
    EXPECT_EQ(static_cast<const void*>(&parameter.Get()), record + aligned);
}

TYPED_TEST(ParameterLayout, OwnsItsOwnRecord) {
    const APIParameter<TypeParam> first;
    const APIParameter<TypeParam> copy(first);
    APIParameter<TypeParam> assigned;
    const unsigned char* before = Record(assigned);
    assigned = first;
    EXPECT_NE(Record(first), Record(copy));
    EXPECT_EQ(Record(assigned), before);
}

TEST(ParameterNecessity, KeepsItsValues) {
    EXPECT_EQ(static_cast<int>(TALO::REQUIRED), 0);
    EXPECT_EQ(static_cast<int>(TALO::OPTIONAL), 1);
}

}  // namespace
