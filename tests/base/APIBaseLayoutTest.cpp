#include <gtest/gtest.h>

#include <type_traits>

#include "tests/support/Slots.h"
#include "webapi/APIBase.h"

using support::SlotOf;
using TALO::APIBase;

// Programs built against an earlier release call through these slots.

namespace {

typedef bool (APIBase::*Merge)(const std::string&, const Json::Value&, bool);
typedef bool (APIBase::*SetKey)(const std::string&, const std::string&, const Json::Value&, bool);

TEST(KeyedStoreLayout, KeepsTheOrderOfItsSlots) {
    EXPECT_EQ(SlotOf(&APIBase::HasData), 0);
    EXPECT_EQ(SlotOf(static_cast<Merge>(&APIBase::SetData)), 1);
    EXPECT_EQ(SlotOf(static_cast<SetKey>(&APIBase::SetData)), 2);
    EXPECT_EQ(SlotOf(&APIBase::GetData), 3);
    EXPECT_EQ(SlotOf(&APIBase::ClearData), 4);
}

TEST(KeyedStoreLayout, LeavesTheSixthSlotToTheDerivingClass) {
    struct Deriving : APIBase {
        virtual ~Deriving() {}
        virtual int First() {
            return 1;
        }
    };
    struct WithoutDestructor : APIBase {
        virtual int First() {
            return 1;
        }
    };
    EXPECT_EQ(SlotOf(&WithoutDestructor::First), 5);
    EXPECT_EQ(SlotOf(&Deriving::First), 7);
}

TEST(KeyedStoreLayout, HoldsItsDocumentAndNothingElse) {
    static_assert(std::is_polymorphic<APIBase>::value, "");
    static_assert(!std::has_virtual_destructor<APIBase>::value, "");
    static_assert(!std::is_copy_constructible<APIBase>::value, "");
    static_assert(!std::is_copy_assignable<APIBase>::value, "");
    EXPECT_EQ(sizeof(APIBase), sizeof(void*) + sizeof(Json::Value));
}

}  // namespace
