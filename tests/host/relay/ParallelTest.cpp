#include <algorithm>

#include "tests/host/relay/RelayFixture.h"

namespace {

using talo::RelayError;

class Parallel : public RelayTest {
  protected:
    void Queue(int count) {
        for (int number = 0; number < count; ++number) {
            const int index =
                manager.AddWebAPIRequest(2, "TALO.Test", number + 1, "do", Json::Value());
            EXPECT_EQ(index, number);
            manager.GetRequest(index)->SetResponseTimeout(50);
        }
    }
    TALO::CredRequestMgr manager;
};

// The target answers none before all are there.
TEST_F(Parallel, CallsAreMadeAtOnce) {
    target.Plan(R"({"TALO.Test":{"meet":3}})");
    Queue(3);
    EXPECT_TRUE(manager.Run());
}

TEST_F(Parallel, CallsAreMadeEightAtATime) {
    target.Plan(R"({"TALO.Test":{"meet":8}})");
    Queue(20);
    EXPECT_TRUE(manager.Run());
    int most = 0;
    for (const Json::Value& request : target.Requests()) {
        most = std::max(most, request["inside"].asInt());
    }
    EXPECT_EQ(most, 8);
    EXPECT_EQ(target.Requests("TALO.Test").size(), 20);
}

TEST_F(Parallel, CallsOfSeveralAppliancesEachHaveTheirAnswer) {
    Target other(certificates);
    other.Plan(R"({"*":{"body":"other"}})");
    target.Plan(R"({"TALO.Test":{"body":"target"}})");
    other.Plan(R"({"TALO.Test":{"body":"other"}})");
    Enter(NodeOf(other, 3));
    EXPECT_EQ(manager.AddWebAPIRequest(3, "TALO.Test", 1, "do", Json::Value()), 0);
    EXPECT_EQ(manager.AddWebAPIRequest(2, "TALO.Test", 1, "do", Json::Value()), 1);
    EXPECT_TRUE(manager.Run());
    EXPECT_EQ(manager.GetResponse(0), "other");
    EXPECT_EQ(manager.GetResponse(1), "target");
}

TEST_F(Parallel, OneFailureFailsTheRunAndLeavesTheOtherAnswers) {
    Queue(1);
    EXPECT_EQ(manager.AddWebAPIRequest(9, "TALO.Test", 1, "do", Json::Value()), 1);
    EXPECT_EQ(manager.AddWebAPIRequest(2, "TALO.Bad", 1, "do", Json::Value()), 2);
    EXPECT_EQ(manager.AddWebAPIRequest(2, "TALO.Test", 1, "do", Json::Value()), 3);
    target.Plan(R"({"TALO.Bad":{"status":500}})");
    EXPECT_FALSE(manager.Run());
    EXPECT_EQ(manager.GetError(), Number(RelayError::kUnknownNode));
    EXPECT_EQ(manager.GetResponse(0), "{\"success\":true}");
    EXPECT_EQ(manager.GetResponse(1), "");
    EXPECT_EQ(manager.GetResponse(2), "");
    EXPECT_EQ(manager.GetResponse(3), "{\"success\":true}");
}

TEST_F(Parallel, ASlowCallOnlyUsesUpItsOwnLimit) {
    EXPECT_EQ(manager.AddWebAPIRequest(2, "TALO.Slow", 1, "do", Json::Value()), 0);
    manager.GetRequest(0)->SetResponseTimeout(1);
    EXPECT_EQ(manager.AddWebAPIRequest(2, "TALO.Test", 1, "do", Json::Value()), 1);
    target.Plan(R"({"TALO.Slow":{"silent":true},"TALO.Test":{"delay":2}})");
    EXPECT_FALSE(manager.Run());
    EXPECT_EQ(manager.GetError(), Number(RelayError::kTimedOut));
    EXPECT_EQ(manager.GetResponse(1), "{\"success\":true}");
}

}  // namespace
