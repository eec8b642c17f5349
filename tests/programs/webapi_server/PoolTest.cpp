#include "programs/webapi_server/Pool.h"

#include <gtest/gtest.h>

namespace {

constexpr int kGeneration = 1;

class PoolTest : public testing::Test {
  protected:
    // So many more workers, in this state since then.
    void Have(int count, WorkerState state, long long since = 0, int generation = kGeneration) {
        for (; count > 0; --count) {
            const int index = pool.Reserve(generation, since);
            ASSERT_GE(index, 0);
            pool.SetState(index, state, since);
        }
    }

    Pool pool{2, 5, 3};
};

TEST_F(PoolTest, StartsTheMinimum) {
    EXPECT_EQ(pool.ToStart(kGeneration, 0), 2);
    Have(1, WorkerState::kStarting);
    EXPECT_EQ(pool.ToStart(kGeneration, 0), 1);
    Have(1, WorkerState::kIdle);
    EXPECT_EQ(pool.ToStart(kGeneration, 0), 0);
}

TEST_F(PoolTest, HasTwoReadyAheadBelowTheMaximum) {
    Have(2, WorkerState::kBusy);
    EXPECT_EQ(pool.ToStart(kGeneration, 0), 2);
    Have(1, WorkerState::kIdle);
    EXPECT_EQ(pool.ToStart(kGeneration, 0), 1);
    Have(1, WorkerState::kBusy);
    EXPECT_EQ(pool.ToStart(kGeneration, 0), 1);
    Have(1, WorkerState::kBusy);
    EXPECT_EQ(pool.ToStart(kGeneration, 0), 0);
}

TEST_F(PoolTest, LetsNoMoreBeginThanMayBeNewAtTheSameTime) {
    Have(2, WorkerState::kBusy, 100);
    Have(5, WorkerState::kIdle, 100);
    EXPECT_TRUE(pool.MayBegin(100));
    Have(1, WorkerState::kBusy, 102);
    EXPECT_FALSE(pool.MayBegin(102));
    EXPECT_FALSE(pool.MayBegin(104));
    // The first two wait for something.
    EXPECT_TRUE(pool.MayBegin(105));
    pool.SetState(7, WorkerState::kIdle, 102);
    EXPECT_TRUE(pool.MayBegin(102));
}

TEST_F(PoolTest, TakesAWorkerForNewThatHasGoneOnWithAnotherRequest) {
    Have(3, WorkerState::kBusy, 100);
    EXPECT_TRUE(pool.MayBegin(110));
    for (int index = 0; index < 3; ++index) {
        pool.BeginAnother(index, 108);
    }
    EXPECT_FALSE(pool.MayBegin(110));
    pool.BeginAnother(0, 0);
    EXPECT_FALSE(pool.MayBegin(110));
    EXPECT_TRUE(pool.MayBegin(113));
}

TEST_F(PoolTest, KnowsWhoHasBegunLately) {
    Have(1, WorkerState::kBusy, 100);
    Have(1, WorkerState::kIdle, 100);
    EXPECT_TRUE(pool.IsNew(0, 104));
    EXPECT_FALSE(pool.IsNew(0, 105));
    EXPECT_FALSE(pool.IsNew(1, 104));
}

TEST_F(PoolTest, FollowsWhatWaitsUpToTheMaximum) {
    Have(1, WorkerState::kBusy);
    EXPECT_EQ(pool.ToStart(kGeneration, 3), 3);
    EXPECT_EQ(pool.ToStart(kGeneration, 1000), 4);
    Have(4, WorkerState::kBusy);
    EXPECT_EQ(pool.ToStart(kGeneration, 1000), 0);
}

TEST_F(PoolTest, DoesNotCountWhoLeavesOrIsOfAnotherGeneration) {
    Have(2, WorkerState::kLeaving);
    Have(2, WorkerState::kIdle, 0, kGeneration + 1);
    EXPECT_EQ(pool.ToStart(kGeneration, 0), 2);
}

TEST_F(PoolTest, HasRoomForTwiceTheMaximumAndNoMore) {
    Have(10, WorkerState::kBusy);
    EXPECT_EQ(pool.Reserve(kGeneration, 0), -1);
    pool.Free(3);
    EXPECT_EQ(pool.Reserve(kGeneration, 0), 3);
}

TEST_F(PoolTest, ChoosesWhoWasIdleForTheShortestTimeOfTheNewestGeneration) {
    EXPECT_EQ(pool.ChooseIdle(), -1);
    Have(1, WorkerState::kIdle, 10);
    Have(1, WorkerState::kIdle, 30);
    Have(1, WorkerState::kIdle, 20);
    EXPECT_EQ(pool.ChooseIdle(), 1);
    Have(1, WorkerState::kIdle, 5, kGeneration + 1);
    EXPECT_EQ(pool.ChooseIdle(), 3);
}

TEST_F(PoolTest, LetsTheLongestIdleGoAfterAWhileButNotBelowTheMinimum) {
    Have(1, WorkerState::kIdle, 2000);
    Have(1, WorkerState::kIdle, 1000);
    Have(1, WorkerState::kIdle, 3000);
    EXPECT_EQ(pool.Surplus(kGeneration, 0, 4000), -1);
    EXPECT_EQ(pool.Surplus(kGeneration, 0, 3600000), 1);
    pool.Free(1);
    EXPECT_EQ(pool.Surplus(kGeneration, 0, 3600000), -1);
}

TEST_F(PoolTest, KeepsWhoIsNeededForWhatWaits) {
    Have(3, WorkerState::kIdle, 0);
    EXPECT_EQ(pool.Surplus(kGeneration, 3, 3600000), -1);
}

TEST_F(PoolTest, FindsAWorkerOnlyWhileItHasItsPlace) {
    const int index = pool.Reserve(kGeneration, 0);
    const unsigned serial = pool.At(index).serial;
    EXPECT_EQ(pool.Find(index, serial), index);
    pool.Free(index);
    EXPECT_EQ(pool.Find(index, serial), -1);
    EXPECT_EQ(pool.Reserve(kGeneration, 0), index);
    EXPECT_EQ(pool.Find(index, serial), -1);
    EXPECT_EQ(pool.Find(-1, serial), -1);
    EXPECT_EQ(pool.Find(pool.Size(), serial), -1);
    EXPECT_EQ(pool.Find(index, 0), -1);
}

TEST_F(PoolTest, FindsAWorkerByItsProcess) {
    Have(2, WorkerState::kBusy);
    pool.At(1).pid = 4711;
    EXPECT_EQ(pool.FindProcess(4711), 1);
    pool.Free(1);
    EXPECT_EQ(pool.FindProcess(4711), -1);
}

TEST_F(PoolTest, CountsByStateAndGeneration) {
    Have(2, WorkerState::kIdle);
    Have(1, WorkerState::kIdle, 0, kGeneration + 1);
    EXPECT_EQ(pool.Count(WorkerState::kIdle), 3);
    EXPECT_EQ(pool.Count(WorkerState::kIdle, kGeneration + 1), 1);
    EXPECT_EQ(pool.Count(WorkerState::kBusy, kGeneration), 0);
    EXPECT_EQ(pool.Count(WorkerState::kFree), 7);
}

}  // namespace
