#include "programs/webapi_server/Deadline.h"

#include <gtest/gtest.h>
#include <unistd.h>

namespace {

constexpr long long kBegan = 1000000;
constexpr long long kSecond = 1000;
constexpr long long kMinute = 60 * kSecond;

// This process is the worker: what it reads and writes is its progress.
class DeadlineTest : public testing::Test {
  protected:
    DeadlineTest() {
        slot_.began = kBegan;
        slot_.allowedMs = 4 * kSecond;
    }

    bool IsPast(long long afterBegin) {
        return IsPastDeadline(slot_, getpid(), &watch_, kBegan + afterBegin);
    }
    bool IsPastAsOrphan(long long afterBegin) {
        return IsPastOrphansDeadline(slot_, getpid(), &watch_, kBegan + afterBegin);
    }
    Slot slot_ = {};
    Watch watch_;
};

TEST_F(DeadlineTest, IsWhatTheSlotAllows) {
    EXPECT_FALSE(IsPast(4 * kSecond));
    EXPECT_TRUE(IsPast(4 * kSecond + 1));
}

TEST_F(DeadlineTest, IsNoneWhereTheSlotAllowsAnything) {
    slot_.allowedMs = 0;
    EXPECT_FALSE(IsPast(24 * 60 * kMinute));
}

TEST_F(DeadlineTest, MovesOnWithATransfer) {
    slot_.transfers = 1;
    EXPECT_FALSE(IsPast(4 * kSecond));
    // The look itself has read something since.
    EXPECT_FALSE(IsPast(8 * kSecond));
    EXPECT_FALSE(IsPast(12 * kSecond));
}

TEST_F(DeadlineTest, DoesNotMoveOnWithATransferThatRests) {
    slot_.transfers = 1;
    constexpr pid_t kNobody = 0;
    EXPECT_FALSE(IsPastDeadline(slot_, kNobody, &watch_, kBegan + 4 * kSecond));
    EXPECT_TRUE(IsPastDeadline(slot_, kNobody, &watch_, kBegan + 4 * kSecond + 1));
}

TEST_F(DeadlineTest, IsAFewSecondsForAWorkerThatDoesNotBegin) {
    slot_.began = 0;
    EXPECT_FALSE(IsPast(0));
    EXPECT_FALSE(IsPast(15 * kSecond));
    EXPECT_TRUE(IsPast(16 * kSecond));
}

TEST_F(DeadlineTest, IsTheSameForAnOrphan) {
    EXPECT_FALSE(IsPastAsOrphan(4 * kSecond));
    EXPECT_TRUE(IsPastAsOrphan(4 * kSecond + 1));
}

TEST_F(DeadlineTest, IsTenMinutesOfSilenceForAnOrphanThatMayTakeAnyTime) {
    slot_.allowedMs = 0;
    constexpr pid_t kNobody = 0;
    EXPECT_FALSE(IsPastOrphansDeadline(slot_, kNobody, &watch_, kBegan + 10 * kMinute));
    EXPECT_TRUE(IsPastOrphansDeadline(slot_, kNobody, &watch_, kBegan + 10 * kMinute + 1));
    EXPECT_FALSE(IsPastAsOrphan(11 * kMinute));
    EXPECT_FALSE(IsPastAsOrphan(20 * kMinute));
}

}  // namespace
