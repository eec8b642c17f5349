#include <gtest/gtest.h>

#include <cstring>
#include <list>
#include <type_traits>
#include <utility>

#include "src/response/APIResponsePrivate.h"
#include "tests/support/Slots.h"

using support::SlotOf;
using TALO::APIBase;
using TALO::APIResponse;
using TALO::APIResponsePrivate;

// Programs built against an earlier release rely on these places.

namespace {

size_t Offset(const APIResponsePrivate& whole, const void* field) {
    return static_cast<size_t>(static_cast<const char*>(field) -
                               reinterpret_cast<const char*>(&whole));
}

TEST(ResponseLayout, IsOnePointerWithoutVirtualOperations) {
    static_assert(!std::is_polymorphic<APIResponse>::value, "");
    static_assert(!std::is_copy_constructible<APIResponse>::value, "");
    static_assert(!std::is_copy_assignable<APIResponse>::value, "");
    EXPECT_EQ(sizeof(APIResponse), sizeof(void*));
}

TEST(ResponseLayout, PointsToThePrivateHalfWithRequestAndOwner) {
    TALO::APIRequest* request = reinterpret_cast<TALO::APIRequest*>(0x1000);
    const APIResponse response(request);
    APIResponsePrivate* d = nullptr;
    std::memcpy(&d, &response, sizeof d);
    EXPECT_EQ(d->request, request);
    EXPECT_EQ(d->owner, &response);
    EXPECT_EQ(d->task, nullptr);
    EXPECT_EQ(d->error, 0);
    EXPECT_TRUE(d->callbacks.empty());
}

TEST(ResponseLayout, KeepsTheOrderOfItsFields) {
    const APIResponsePrivate whole(nullptr, nullptr);
    EXPECT_EQ(Offset(whole, &whole.request), sizeof(APIBase));
    EXPECT_EQ(Offset(whole, &whole.owner), Offset(whole, &whole.request) + sizeof(void*));
    EXPECT_EQ(Offset(whole, &whole.task), Offset(whole, &whole.owner) + sizeof(void*));
    EXPECT_EQ(Offset(whole, &whole.error), Offset(whole, &whole.task) + sizeof(void*));
    EXPECT_EQ(Offset(whole, &whole.callbacks), Offset(whole, &whole.error) + sizeof(void*));
    EXPECT_EQ(sizeof whole, Offset(whole, &whole.callbacks) + sizeof whole.callbacks);
    static_assert(std::is_same<decltype(whole.error), int>::value, "");
    static_assert(std::is_same<decltype(whole.callbacks),
                               std::list<std::pair<void (*)(void*), void*>>>::value,
                  "");
}

TEST(ResponseLayout, OverridesNoneOfTheStoreOperations) {
    struct Deriving : APIResponsePrivate {
        Deriving() : APIResponsePrivate(nullptr, nullptr) {}
        virtual int First() {
            return 1;
        }
    };
    EXPECT_EQ(SlotOf(&APIResponsePrivate::HasData), 0);
    EXPECT_EQ(SlotOf(&APIResponsePrivate::GetData), 3);
    EXPECT_EQ(SlotOf(&APIResponsePrivate::ClearData), 4);
    EXPECT_EQ(SlotOf(&Deriving::First), 7);
    static_assert(
        std::is_same<decltype(&APIResponsePrivate::HasData), decltype(&APIBase::HasData)>::value,
        "");
    static_assert(
        std::is_same<decltype(&APIResponsePrivate::GetData), decltype(&APIBase::GetData)>::value,
        "");
    static_assert(std::is_same<decltype(&APIResponsePrivate::ClearData),
                               decltype(&APIBase::ClearData)>::value,
                  "");
}

TEST(ResponseLayout, EndsThroughTheSixthAndSeventhSlot) {
    static int ended = 0;
    struct Deriving : APIResponsePrivate {
        Deriving() : APIResponsePrivate(nullptr, nullptr) {}
        ~Deriving() override {
            ++ended;
        }
    };
    alignas(Deriving) unsigned char place[sizeof(Deriving)];
    ended = 0;
    support::CallSlot(static_cast<APIResponsePrivate*>(new (place) Deriving()), 5);
    EXPECT_EQ(ended, 1);
    support::CallSlot(static_cast<APIResponsePrivate*>(new Deriving()), 6);
    EXPECT_EQ(ended, 2);
}

}  // namespace
