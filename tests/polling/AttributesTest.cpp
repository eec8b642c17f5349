#include "tests/polling/PollingFixture.h"

namespace {

class PollingAttributes : public polling::Fixture {
  protected:
    Json::Value Attributes() const {
        return polling::PrivateOf(polling)->GetData("polling_attribute", "", "nothing stored");
    }
};

TEST_F(PollingAttributes, AreNoneAtFirst) {
    EXPECT_EQ(Attributes(), Json::Value(Json::objectValue));
}

TEST_F(PollingAttributes, AreKeptUnderTheirNames) {
    EXPECT_TRUE(polling.SetPrefixAttr("index-"));
    EXPECT_TRUE(polling.SetRemoveAttr(false));
    EXPECT_TRUE(polling.SetGroupAttr("everyone"));
    EXPECT_EQ(Attributes(), polling::Parse(R"({"task_id_prefix": "index-", "auto_remove": false,
                                               "share_to_group": "everyone"})"));
    EXPECT_TRUE(polling.SetPrefixAttr(""));
    EXPECT_TRUE(polling.SetRemoveAttr(true));
    EXPECT_TRUE(polling.SetGroupAttr(""));
    EXPECT_EQ(Attributes(), polling::Parse(R"({"task_id_prefix": "", "auto_remove": true,
                                               "share_to_group": ""})"));
    EXPECT_EQ(polling.GetError(), 500);
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(PollingAttributes, RefuseAGroupThatThereIsNotWith502) {
    for (const char* group :
         {"user", "Admin", "admin ", "everyone,admin", "administrators", "@users", "0"}) {
        polling.SetError(500);
        EXPECT_FALSE(polling.SetGroupAttr(group)) << group;
        EXPECT_EQ(polling.GetError(), 502) << group;
    }
    EXPECT_EQ(Messages(), std::vector<std::string>(7, "bad parameters"));
    EXPECT_TRUE(Logged("bad parameters"));
    EXPECT_EQ(log.Lines()[0].priority, 3);
    EXPECT_EQ(Attributes(), Json::Value(Json::objectValue));
}

TEST_F(PollingAttributes, RefuseAnAdministratorsTaskOfSomebodyElseWith505) {
    EXPECT_FALSE(polling.SetGroupAttr("admin"));
    EXPECT_EQ(polling.GetError(), 505);
    EXPECT_TRUE(Logged("No permission"));
    EXPECT_EQ(Attributes(), Json::Value(Json::objectValue));
}

TEST_F(PollingAttributes, RefuseAnAdministratorsTaskWithoutARequestWith505) {
    polling.SetRequest(nullptr);
    EXPECT_FALSE(polling.SetGroupAttr("admin"));
    EXPECT_EQ(polling.GetError(), 505);
    EXPECT_EQ(Messages(), std::vector<std::string>{"No permission"});
    EXPECT_FALSE(polling.SetGroupAttr("none"));
    EXPECT_EQ(polling.GetError(), 502);
    EXPECT_TRUE(polling.SetGroupAttr("everyone"));
    EXPECT_TRUE(polling.SetGroupAttr(""));
    EXPECT_EQ(polling.GetError(), 502);
}

TEST_F(PollingAttributes, LetAnAdministratorShareWithTheOthers) {
    LogIn("root", true);
    EXPECT_TRUE(polling.SetGroupAttr("admin"));
    EXPECT_EQ(Attributes()["share_to_group"], "admin");
    EXPECT_EQ(polling.GetError(), 500);
}

TEST_F(PollingAttributes, KeepTheGroupThatWasSetBeforeARefusedOne) {
    EXPECT_TRUE(polling.SetGroupAttr("everyone"));
    EXPECT_FALSE(polling.SetGroupAttr("admin"));
    EXPECT_EQ(Attributes()["share_to_group"], "everyone");
}

TEST_F(PollingAttributes, LetTheErrorBeSetAndRead) {
    for (const int code : {0, -1, 501, 507, 2147483647}) {
        polling.SetError(code);
        EXPECT_EQ(polling.GetError(), code);
    }
}

}  // namespace
