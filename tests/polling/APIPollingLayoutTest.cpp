#include <type_traits>

#include "tests/polling/PollingFixture.h"
#include "tests/support/Slots.h"

using support::SlotOf;
using TALO::APIBase;
using TALO::APIPolling;
using TALO::APIPollingPrivate;

// Programs built against an earlier release rely on these places.

namespace {

size_t Offset(const APIPollingPrivate& whole, const void* field) {
    return static_cast<size_t>(static_cast<const char*>(field) -
                               reinterpret_cast<const char*>(&whole));
}

TEST(PollingLayout, IsOnePointerWithoutVirtualOperations) {
    static_assert(!std::is_polymorphic<APIPolling>::value, "");
    static_assert(!std::is_copy_constructible<APIPolling>::value, "");
    static_assert(!std::is_copy_assignable<APIPolling>::value, "");
    EXPECT_EQ(sizeof(APIPolling), sizeof(void*));
}

TEST(PollingLayout, PointsToThePrivateHalfWithOwnerAndRequest) {
    TALO::APIRequest* request = reinterpret_cast<TALO::APIRequest*>(0x1000);
    const APIPolling polling(request);
    const APIPollingPrivate* d = polling::PrivateOf(polling);
    EXPECT_EQ(d->owner, &polling);
    EXPECT_EQ(d->request, request);
    EXPECT_EQ(d->error, 500);
}

TEST(PollingLayout, HasNoRequestUnlessGivenOne) {
    APIPolling polling;
    EXPECT_EQ(polling::PrivateOf(polling)->owner, &polling);
    EXPECT_EQ(polling::PrivateOf(polling)->request, nullptr);
    EXPECT_EQ(polling.GetError(), 500);
    TALO::APIRequest* request = reinterpret_cast<TALO::APIRequest*>(0x1000);
    polling.SetRequest(request);
    EXPECT_EQ(polling::PrivateOf(polling)->request, request);
}

TEST(PollingLayout, KeepsTheOrderOfItsFields) {
    const APIPollingPrivate whole(nullptr, nullptr);
    EXPECT_EQ(Offset(whole, &whole.owner), sizeof(APIBase));
    EXPECT_EQ(Offset(whole, &whole.request), sizeof(APIBase) + sizeof(void*));
    EXPECT_EQ(Offset(whole, &whole.error), sizeof(APIBase) + 2 * sizeof(void*));
    EXPECT_EQ(sizeof whole, sizeof(APIBase) + 3 * sizeof(void*));
    static_assert(std::is_same<decltype(whole.error), int>::value, "");
}

TEST(PollingLayout, OverridesNoneOfTheStoreOperations) {
    struct Deriving : APIPollingPrivate {
        Deriving() : APIPollingPrivate(nullptr, nullptr) {}
        virtual int First() {
            return 1;
        }
    };
    EXPECT_EQ(SlotOf(&APIPollingPrivate::HasData), 0);
    EXPECT_EQ(SlotOf(&APIPollingPrivate::GetData), 3);
    EXPECT_EQ(SlotOf(&APIPollingPrivate::ClearData), 4);
    EXPECT_EQ(SlotOf(&Deriving::First), 7);
    static_assert(
        std::is_same<decltype(&APIPollingPrivate::HasData), decltype(&APIBase::HasData)>::value,
        "");
    static_assert(
        std::is_same<decltype(&APIPollingPrivate::GetData), decltype(&APIBase::GetData)>::value,
        "");
    static_assert(
        std::is_same<decltype(&APIPollingPrivate::ClearData), decltype(&APIBase::ClearData)>::value,
        "");
}

TEST(PollingLayout, EndsThroughTheSixthAndSeventhSlot) {
    static int ended = 0;
    struct Deriving : APIPollingPrivate {
        Deriving() : APIPollingPrivate(nullptr, nullptr) {}
        ~Deriving() override {
            ++ended;
        }
    };
    alignas(Deriving) unsigned char place[sizeof(Deriving)];
    ended = 0;
    support::CallSlot(static_cast<APIPollingPrivate*>(new (place) Deriving()), 5);
    EXPECT_EQ(ended, 1);
    support::CallSlot(static_cast<APIPollingPrivate*>(new Deriving()), 6);
    EXPECT_EQ(ended, 2);
}

}  // namespace
