#include <gtest/gtest.h>

#include <cstdint>
#include <type_traits>

#include "tests/request/Private.h"
#include "tests/support/Slots.h"

using support::SlotOf;
using TALO::APIBase;
using TALO::APIRequest;
using TALO::APIRequestPrivate;

// Programs built against an earlier release rely on these places.

namespace {

size_t Offset(const APIRequestPrivate& whole, const void* field) {
    return static_cast<size_t>(static_cast<const char*>(field) -
                               reinterpret_cast<const char*>(&whole));
}

TEST(RequestLayout, IsATableAndOnePointer) {
    static_assert(std::is_polymorphic<APIRequest>::value, "");
    static_assert(std::has_virtual_destructor<APIRequest>::value, "");
    static_assert(!std::is_copy_constructible<APIRequest>::value, "");
    static_assert(!std::is_copy_assignable<APIRequest>::value, "");
    EXPECT_EQ(sizeof(APIRequest), 2 * sizeof(void*));
}

TEST(RequestLayout, HasNoVirtualOperationButItsDestructor) {
    struct Deriving : APIRequest {
        Deriving() : APIRequest(Json::Value()) {}
        virtual int First() {
            return 1;
        }
    };
    EXPECT_EQ(SlotOf(&Deriving::First), 2);
    EXPECT_EQ(SlotOf(&APIRequest::InitEnv), -1);
    EXPECT_EQ(SlotOf(&APIRequest::GetParam), -1);
}

TEST(RequestLayout, EndsThroughItsTwoSlots) {
    static int ended = 0;
    struct Deriving : APIRequest {
        Deriving() : APIRequest(Json::Value()) {}
        ~Deriving() override {
            ++ended;
        }
    };
    alignas(Deriving) unsigned char place[sizeof(Deriving)];
    ended = 0;
    support::CallSlot(static_cast<APIRequest*>(new (place) Deriving()), 0);
    EXPECT_EQ(ended, 1);
    support::CallSlot(static_cast<APIRequest*>(new Deriving()), 1);
    EXPECT_EQ(ended, 2);
}

TEST(RequestLayout, PointsToThePrivateHalfWhichKnowsItsOwner) {
    const APIRequest request((Json::Value()));
    EXPECT_EQ(PrivateOf(request)->owner, &request);
}

TEST(RequestLayout, KeepsTheOrderOfTheFields) {
    const APIRequestPrivate whole(nullptr);
    static_assert(std::is_same<decltype(whole.api), std::string>::value, "");
    static_assert(std::is_same<decltype(whole.version), std::int32_t>::value, "");
    static_assert(std::is_same<decltype(whole.method), std::string>::value, "");
    static_assert(std::is_same<decltype(whole.requestMethod), std::int32_t>::value, "");
    static_assert(std::is_same<decltype(whole.owner), APIRequest*>::value, "");
    static_assert(std::is_same<decltype(whole.unused), Json::Value>::value, "");
    EXPECT_EQ(Offset(whole, &whole.api), sizeof(APIBase));
    EXPECT_EQ(Offset(whole, &whole.version), Offset(whole, &whole.api) + sizeof(std::string));
    EXPECT_EQ(Offset(whole, &whole.method), Offset(whole, &whole.version) + sizeof(void*));
    EXPECT_EQ(Offset(whole, &whole.requestMethod),
              Offset(whole, &whole.method) + sizeof(std::string));
    EXPECT_EQ(Offset(whole, &whole.owner), Offset(whole, &whole.requestMethod) + sizeof(void*));
    EXPECT_EQ(Offset(whole, &whole.unused), Offset(whole, &whole.owner) + sizeof(void*));
    EXPECT_EQ(sizeof whole, Offset(whole, &whole.unused) + sizeof(Json::Value));
}

TEST(RequestLayout, StartsWithEmptyFields) {
    const APIRequestPrivate whole(nullptr);
    EXPECT_EQ(whole.api, "");
    EXPECT_EQ(whole.version, 0);
    EXPECT_EQ(whole.method, "");
    EXPECT_EQ(whole.requestMethod, 0);
    EXPECT_EQ(whole.owner, nullptr);
    EXPECT_TRUE(whole.unused.isNull());
}

TEST(RequestLayout, EndsThePrivateHalfThroughTheSixthAndSeventhSlot) {
    static int ended = 0;
    struct Deriving : APIRequestPrivate {
        Deriving() : APIRequestPrivate(nullptr) {}
        ~Deriving() override {
            ++ended;
        }
        virtual int First() {
            return 1;
        }
    };
    EXPECT_EQ(SlotOf(&Deriving::First), 7);
    alignas(Deriving) unsigned char place[sizeof(Deriving)];
    ended = 0;
    support::CallSlot(static_cast<APIRequestPrivate*>(new (place) Deriving()), 5);
    EXPECT_EQ(ended, 1);
    support::CallSlot(static_cast<APIRequestPrivate*>(new Deriving()), 6);
    EXPECT_EQ(ended, 2);
}

TEST(RequestLayout, KeepsTheNumbersOfTheMethodsAndTheNecessity) {
    EXPECT_EQ(static_cast<int>(TALO::kMethodOther), 0);
    EXPECT_EQ(static_cast<int>(TALO::kMethodGet), 1);
    EXPECT_EQ(static_cast<int>(TALO::kMethodPost), 2);
    EXPECT_EQ(static_cast<int>(TALO::kMethodHead), 3);
    EXPECT_EQ(static_cast<int>(APIRequest::REQUIRED), 0);
    EXPECT_EQ(static_cast<int>(APIRequest::OPTIONAL), 1);
}

}  // namespace
