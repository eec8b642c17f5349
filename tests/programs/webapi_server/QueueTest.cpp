#include "programs/webapi_server/Queue.h"

#include <gtest/gtest.h>

namespace {

int Next(ConnectionQueue& queue) {
    Waiting waiting;
    return queue.Take(&waiting) ? waiting.connection : -1;
}

TEST(ConnectionQueue, ServesWhoCameFirstAlsoAfterManyRounds) {
    ConnectionQueue queue(3);
    for (int round = 0; round < 10000; ++round) {
        ASSERT_TRUE(queue.Add({2 * round, 0}));
        ASSERT_TRUE(queue.Add({2 * round + 1, 0}));
        ASSERT_EQ(Next(queue), 2 * round);
        ASSERT_EQ(Next(queue), 2 * round + 1);
    }
    EXPECT_EQ(queue.Size(), 0);
    EXPECT_EQ(Next(queue), -1);
}

TEST(ConnectionQueue, HasNoRoomBeyondItsSize) {
    ConnectionQueue queue(2);
    EXPECT_TRUE(queue.Add({1, 0}));
    EXPECT_TRUE(queue.Add({2, 0}));
    EXPECT_FALSE(queue.Add({3, 0}));
    EXPECT_EQ(queue.Size(), 2);
    EXPECT_EQ(Next(queue), 1);
    EXPECT_TRUE(queue.Add({4, 0}));
}

TEST(ConnectionQueue, TakesBackInFrontOfAllOthersEvenWhenFull) {
    ConnectionQueue queue(2);
    EXPECT_TRUE(queue.Add({1, 0}));
    EXPECT_TRUE(queue.Add({2, 0}));
    queue.PutBack({9, 3});
    Waiting first;
    ASSERT_TRUE(queue.Take(&first));
    EXPECT_EQ(first.connection, 9);
    EXPECT_EQ(first.returns, 3);
    EXPECT_EQ(Next(queue), 1);
    EXPECT_EQ(Next(queue), 2);
}

}  // namespace
