#include "tests/polling/PollingFixture.h"

using polling::Parse;

namespace {

class ListTasks : public polling::Fixture {
  protected:
    ListTasks() {
        for (const char* user : {"ann", "@users", "@administrators", "bob"}) {
            for (const char* id : {"copy-1", "index-1", "index-2"}) {
                fake::PutTask(user, id, Json::Value(Json::objectValue));
            }
        }
    }

    Json::Value Listed(const std::string& prefix, const std::string& groups) {
        Json::Value out;
        EXPECT_TRUE(polling.List(prefix, Parse(groups), out)) << groups;
        EXPECT_EQ(polling.GetError(), 500);
        return out;
    }
};

TEST_F(ListTasks, WithoutARequestFailsWith502) {
    polling.SetRequest(nullptr);
    Json::Value out("before");
    EXPECT_FALSE(polling.List("", Parse(R"(["user"])"), out));
    EXPECT_EQ(polling.GetError(), 502);
    EXPECT_EQ(out, "before");
    EXPECT_EQ(Messages(), std::vector<std::string>{"unknown request"});
    EXPECT_TRUE(Logged("unknown request"));
}

TEST_F(ListTasks, OfGroupsThatAreNoArrayFailsWith502) {
    for (const char* groups : {R"("user")", "null", R"({"a": "user"})", "1"}) {
        polling.SetError(500);
        Json::Value out("before");
        EXPECT_FALSE(polling.List("", Parse(groups), out)) << groups;
        EXPECT_EQ(polling.GetError(), 502) << groups;
        EXPECT_EQ(out, "before");
    }
    EXPECT_EQ(Messages(), std::vector<std::string>(4, "bad parameters"));
    EXPECT_TRUE(Logged("bad parameters"));
}

TEST_F(ListTasks, AnswersAllTasksOfEachGroup) {
    EXPECT_EQ(Listed("", R"(["user", "everyone"])"),
              Parse(R"({"user": ["ann/copy-1", "ann/index-1", "ann/index-2"],
                        "everyone": ["@users/copy-1", "@users/index-1", "@users/index-2"]})"));
    LogIn("root", true);
    EXPECT_EQ(Listed("", R"(["admin"])"),
              Parse(R"({"admin": ["@administrators/copy-1", "@administrators/index-1",
                                  "@administrators/index-2"]})"));
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(ListTasks, SelectsByThePrefix) {
    EXPECT_EQ(Listed("index-", R"(["user"])"),
              Parse(R"({"user": ["ann/index-1", "ann/index-2"]})"));
    EXPECT_EQ(Listed("index-2", R"(["user"])"), Parse(R"({"user": ["ann/index-2"]})"));
}

TEST_F(ListTasks, HandsThePrefixOnOrNull) {
    (void)Listed("", R"(["user"])");
    (void)Listed("copy", R"(["user"])");
    std::vector<std::string> prefixes;
    for (const fake::TaskCall& call : fake::TaskCalls()) {
        if (call.operation == "TaskMgr.getAllTaskId") {
            prefixes.push_back(call.detail);
        }
    }
    EXPECT_EQ(prefixes, (std::vector<std::string>{"(null)", "copy"}));
}

TEST_F(ListTasks, AnswersNullWhereThereAreNone) {
    EXPECT_EQ(Listed("none", R"(["user", "everyone"])"),
              Parse(R"({"user": null, "everyone": null})"));
}

TEST_F(ListTasks, OfNoGroupsIsAnEmptyObject) {
    EXPECT_EQ(Listed("", "[]"), Json::Value(Json::objectValue));
}

TEST_F(ListTasks, OfTheAdministratorsFailsWith505ForOthers) {
    Json::Value out;
    EXPECT_FALSE(polling.List("", Parse(R"(["everyone", "admin", "user"])"), out));
    EXPECT_EQ(polling.GetError(), 505);
    EXPECT_EQ(out.getMemberNames(), std::vector<std::string>{"everyone"});
}

TEST_F(ListTasks, OfAnUnknownGroupFailsWith503AfterTheOnesBefore) {
    for (const char* name : {R"("friends")", R"("")", R"("@users")", "7", "null", "[]"}) {
        polling.SetError(500);
        Json::Value out;
        EXPECT_FALSE(polling.List("copy", Parse(std::string(R"(["user", )") + name + "]"), out));
        EXPECT_EQ(polling.GetError(), 503) << name;
        EXPECT_EQ(out, Parse(R"({"user": ["ann/copy-1"]})")) << name;
    }
}

TEST_F(ListTasks, WithoutAManagerFailsWith504) {
    fake::Now().FailCall("TaskMgr.TaskMgr", 2);
    Json::Value out;
    EXPECT_FALSE(polling.List("copy", Parse(R"(["user", "everyone", "user"])"), out));
    EXPECT_EQ(polling.GetError(), 504);
    EXPECT_EQ(out, Parse(R"({"user": ["ann/copy-1"]})"));
    EXPECT_EQ(Messages(), std::vector<std::string>{"Cannot get task manager"});
    EXPECT_TRUE(Logged("Cannot get task manager"));
}

TEST_F(ListTasks, OfNobodyFailsWith504) {
    LogIn("", false);
    Json::Value out;
    EXPECT_FALSE(polling.List("", Parse(R"(["user"])"), out));
    EXPECT_EQ(polling.GetError(), 504);
}

TEST_F(ListTasks, ShowsWhatWasStarted) {
    polling.SetPrefixAttr("new-");
    const std::string id = RunTask();
    EXPECT_EQ(Listed("new-", R"(["user"])")["user"][0], id);
}

}  // namespace
