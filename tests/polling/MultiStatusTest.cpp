#include "tests/polling/PollingFixture.h"

using polling::Parse;

namespace {

class TaskStatuses : public polling::Fixture {
  protected:
    Json::Value StatusOf(const std::string& ids) {
        Json::Value out("before");
        EXPECT_TRUE(polling.Status(Parse(ids), out)) << ids;
        EXPECT_EQ(polling.GetError(), 500);
        return out;
    }
};

TEST_F(TaskStatuses, WithoutARequestFailWith502) {
    polling.SetRequest(nullptr);
    Json::Value out("before");
    EXPECT_FALSE(polling.Status(Parse("[]"), out));
    EXPECT_EQ(polling.GetError(), 502);
    EXPECT_EQ(out, "before");
    EXPECT_EQ(Messages(), std::vector<std::string>{"unknown request"});
    EXPECT_TRUE(Logged("unknown request"));
}

TEST_F(TaskStatuses, OfWhatIsNoArrayFailWith502) {
    for (const char* ids : {R"("ann/1")", "null", "7", R"({"a": "ann/1"})", "true"}) {
        polling.SetError(500);
        Json::Value out("before");
        EXPECT_FALSE(polling.Status(Parse(ids), out)) << ids;
        EXPECT_EQ(polling.GetError(), 502) << ids;
        EXPECT_EQ(out, "before") << ids;
    }
    EXPECT_EQ(Messages(), std::vector<std::string>(5, "bad parameters"));
    EXPECT_TRUE(Logged("bad parameters"));
}

TEST_F(TaskStatuses, OfNoneAreAnEmptyObject) {
    EXPECT_EQ(StatusOf("[]"), Json::Value(Json::objectValue));
}

TEST_F(TaskStatuses, StandUnderTheFullIds) {
    const std::string id = RunTask();
    fake::PutTask("@users", "2", Parse(R"({"auto_remove": false})"));
    Json::Value ids(Json::arrayValue);
    ids.append(id);
    ids.append("@users/2");
    Json::Value out;
    EXPECT_TRUE(polling.Status(ids, out));
    Json::Value single;
    EXPECT_TRUE(polling.Status(id, single));
    EXPECT_EQ(out.size(), 2u);
    EXPECT_EQ(out[id], single);
    EXPECT_EQ(out["@users/2"], Parse(R"({"finish": false, "auto_remove": false})"));
}

TEST_F(TaskStatuses, LeaveOutMalformedIdsAndOtherPeoples) {
    fake::PutTask("bob", "1", Json::Value(Json::objectValue));
    fake::PutTask("@administrators", "1", Json::Value(Json::objectValue));
    EXPECT_EQ(StatusOf(R"(["none", "bob/1", "@administrators/1", "", 7, null, "@users/9"])"),
              Parse(R"({"@users/9": {}})"));
    EXPECT_EQ(Messages(), (std::vector<std::string>{
                              "Invalid task id[none]", "Invalid task id", "Invalid task id[bob/1]",
                              "Permission denied", "Invalid task id[@administrators/1]",
                              "Invalid task id[]", "Invalid task id[7]", "Invalid task id[]"}));
    EXPECT_TRUE(Logged("Invalid task id[none]"));
}

TEST_F(TaskStatuses, OfATaskThatThereIsNotIsEmpty) {
    EXPECT_EQ(StatusOf(R"(["ann/1", "ann/", "@users/x"])"),
              Parse(R"({"ann/1": {}, "ann/": {}, "@users/x": {}})"));
    EXPECT_TRUE(log.Lines().empty());
    EXPECT_TRUE(fake::TaskIds("ann").empty());
}

TEST_F(TaskStatuses, WithoutAHandleIsEmpty) {
    fake::PutTask("ann", "1", Json::Value(Json::objectValue));
    fake::PutTask("ann", "2", Json::Value(Json::objectValue));
    fake::Now().FailCall("Task.Task", 1);
    EXPECT_EQ(StatusOf(R"(["ann/1", "ann/2"])"),
              Parse(R"({"ann/1": {}, "ann/2": {"finish": false, "auto_remove": null}})"));
    EXPECT_EQ(Messages(), std::vector<std::string>{"Cannot get task"});
    EXPECT_TRUE(Logged("Cannot get task"));
}

TEST_F(TaskStatuses, BearAnIdThatIsAskedForTwice) {
    fake::PutTask("ann", "1", Json::Value(Json::objectValue));
    EXPECT_EQ(StatusOf(R"(["ann/1", "ann/1"])"),
              Parse(R"({"ann/1": {"finish": false, "auto_remove": null}})"));
}

TEST_F(TaskStatuses, MayBeAskedForWithTheListAsOutput) {
    fake::PutTask("ann", "1", Json::Value(Json::objectValue));
    Json::Value both = Parse(R"(["ann/1"])");
    EXPECT_TRUE(polling.Status(both, both));
    EXPECT_EQ(both, Parse(R"({"ann/1": {"finish": false, "auto_remove": null}})"));
}

TEST_F(TaskStatuses, KeepAnErrorThatWasThereBefore) {
    polling.SetError(508);
    Json::Value out;
    EXPECT_TRUE(polling.Status(Parse(R"(["x", "ann/9"])"), out));
    EXPECT_EQ(polling.GetError(), 508);
}

}  // namespace
