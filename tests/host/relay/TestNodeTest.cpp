#include <set>

#include "platform/Paths.h"
#include "tests/host/relay/RelayFixture.h"

#include <filesystem>

namespace {

using talo::RelayError;

class TestNode : public RelayTest {};

TEST_F(TestNode, OpensASessionForTheUserAndKeepsNone) {
    LogOut();
    EXPECT_EQ(talo::TestNode(2, "bert"), RelayError::kNone);
    ASSERT_EQ(target.Requests().size(), 1);
    EXPECT_NE(target.Requests()[0]["body"].asString().find("user=%22bert%22"), std::string::npos);
    EXPECT_FALSE(std::filesystem::exists(TALO_RELAY_DIR));
}

TEST_F(TestNode, SaysWhatIsWrong) {
    EXPECT_EQ(talo::TestNode(9, "bert"), RelayError::kUnknownNode);
    target.Plan(R"({"TALO.Relay":{"body":"{\"success\":false}"}})");
    EXPECT_EQ(talo::TestNode(2, "bert"), RelayError::kRefused);
    target.Plan(R"({"TALO.Relay":{"status":500}})");
    EXPECT_EQ(talo::TestNode(2, "bert"), RelayError::kStatus);
    talo::Node node = NodeOf(target);
    node.authority = certificates.OtherAuthority();
    Enter(node);
    EXPECT_EQ(talo::TestNode(2, "bert"), RelayError::kNotTrusted);
    target.Stop();
    EXPECT_EQ(talo::TestNode(2, "bert"), RelayError::kNotReached);
}

TEST(RelayErrorText, IsAnotherOneForEachError) {
    std::set<std::string> texts;
    for (int number = Number(RelayError::kNone); number <= Number(RelayError::kBadBody); ++number) {
        texts.insert(talo::RelayErrorText(static_cast<RelayError>(number)));
    }
    EXPECT_EQ(texts.size(), 13);
    EXPECT_EQ(texts.count(talo::RelayErrorText(static_cast<RelayError>(99))), 0);
}

}  // namespace
