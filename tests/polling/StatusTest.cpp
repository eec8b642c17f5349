#include "tests/polling/PollingFixture.h"

using polling::Parse;

namespace {

class TaskStatus : public polling::Fixture {
  protected:
    // Fails with a code, one more log line at the end, and the output as it was.
    void Fails(const std::string& id, int code, const std::vector<std::string>& messages) {
        const size_t before = log.Lines().size();
        polling.SetError(500);
        Json::Value out("before");
        EXPECT_FALSE(polling.Status(id, out)) << id;
        EXPECT_EQ(polling.GetError(), code) << id;
        EXPECT_EQ(out, "before") << id;
        std::vector<std::string> all = Messages();
        EXPECT_EQ(std::vector<std::string>(all.begin() + static_cast<long>(before), all.end()),
                  messages)
            << id;
        for (const std::string& message : messages) {
            EXPECT_TRUE(Logged(message));
        }
    }

    Json::Value StatusOf(const std::string& id) {
        Json::Value out;
        EXPECT_TRUE(polling.Status(id, out)) << id;
        return out;
    }
};

const char kInfo[] = R"({"api": "A", "version": 1, "method": "m", "param": {}, "group": "",
                         "prefix": ""})";

TEST_F(TaskStatus, WithoutARequestFailsWith502) {
    polling.SetRequest(nullptr);
    Fails("ann/1", 502, {"unknown request"});
    Fails("", 502, {"unknown request"});
}

TEST_F(TaskStatus, OfAnEmptyIdFailsWith502) {
    Fails("", 502, {"bad parameters"});
    Json::Value out;
    EXPECT_FALSE(polling.Status("", out));
    EXPECT_EQ(polling.GetError(), 502);
}

TEST_F(TaskStatus, OfNoTextFailsWith502) {
    Json::Value out;
    EXPECT_FALSE(polling.Status(static_cast<const char*>(nullptr), out));
    EXPECT_EQ(polling.GetError(), 502);
}

TEST_F(TaskStatus, OfAMalformedIdFailsWith503) {
    Fails("ann", 503, {"Invalid task id[ann]"});
    Fails("@users", 503, {"Invalid task id[@users]"});
}

TEST_F(TaskStatus, OfAnotherUsersTaskFailsWith503WhoeverAsks) {
    fake::PutTask("bob", "1", Json::Value(Json::objectValue));
    Fails("bob/1", 503, {"Invalid task id", "Invalid task id[bob/1]"});
    Fails("/1", 503, {"Invalid task id", "Invalid task id[/1]"});
    LogIn("root", true);
    Fails("bob/1", 503, {"Invalid task id", "Invalid task id[bob/1]"});
}

TEST_F(TaskStatus, OfTheAdministratorsTaskFailsWith503ForOthers) {
    fake::PutTask("@administrators", "1", Json::Value(Json::objectValue));
    Fails("@administrators/1", 503, {"Permission denied", "Invalid task id[@administrators/1]"});
    LogIn("root", true);
    EXPECT_EQ(StatusOf("@administrators/1")["finish"], false);
}

TEST_F(TaskStatus, OfATaskThatThereIsNotFailsWith508) {
    Fails("ann/1", 508, {"No such task id[ann/1]"});
    Fails("ann/", 508, {"No such task id[ann/]"});
    Fails("@users/a/b", 508, {"No such task id[@users/a/b]"});
    EXPECT_TRUE(fake::TaskIds("ann").empty());
    EXPECT_TRUE(fake::TaskIds("@users").empty());
}

TEST_F(TaskStatus, WithoutAHandleFailsWith504) {
    fake::PutTask("ann", "1", Json::Value(Json::objectValue));
    fake::Now().FailCall("Task.Task", 1);
    Fails("ann/1", 504, {"Cannot get task"});
}

TEST_F(TaskStatus, TellsResultStateAndCall) {
    const std::string id = RunTask();
    Json::Value wanted = Parse(R"({"success": true, "data": {"n": 1}, "finish": true,
                                   "auto_remove": true, "info": {"api": "Acme.Index",
                                   "version": 2, "method": "start", "group": "", "prefix": "",
                                   "param": {"folder": "/music", "depth": 3}}})");
    EXPECT_EQ(StatusOf(id), wanted);
    Json::Value out;
    EXPECT_TRUE(polling.Status(id.c_str(), out));
    EXPECT_EQ(out, wanted);
    EXPECT_EQ(polling.GetError(), 500);
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(TaskStatus, TellsOfATaskWithoutAResult) {
    Json::Value properties;
    properties["auto_remove"] = false;
    properties["info"] = Parse(kInfo);
    fake::PutTask("ann", "1", properties);
    Json::Value wanted = Parse(R"({"finish": false, "auto_remove": false})");
    wanted["info"] = Parse(kInfo);
    EXPECT_EQ(StatusOf("ann/1"), wanted);
}

TEST_F(TaskStatus, TellsOfATaskWithoutAnything) {
    fake::PutTask("ann", "1", Json::Value(Json::objectValue));
    EXPECT_EQ(StatusOf("ann/1"), Parse(R"({"finish": false, "auto_remove": null})"));
}

TEST_F(TaskStatus, TellsOfAFailure) {
    fake::PutTask("@users", "1", Parse(R"({"body": {"success": false, "error": {"code": 400}},
                            "auto_remove": true, "task_run": true, "progress": {"percent": 1}})"),
                  0, true);
    EXPECT_EQ(StatusOf("@users/1"), Parse(R"({"success": false, "error": {"code": 400},
                                              "finish": true, "auto_remove": true})"));
}

TEST_F(TaskStatus, ReplacesWhatTheOutputHeld) {
    fake::PutTask("ann", "1", Json::Value(Json::objectValue));
    for (const char* before : {R"({"old": 1, "finish": true, "success": true})", "[1, 2]", "7"}) {
        Json::Value out = Parse(before);
        EXPECT_TRUE(polling.Status("ann/1", out));
        EXPECT_EQ(out, Parse(R"({"finish": false, "auto_remove": null})"));
    }
}

// Whatever a work function reports, these say what the manager knows.
TEST_F(TaskStatus, LetsNoResultPassForTheManagersOwnFacts) {
    fake::PutTask("ann", "1",
                  Parse(R"({"body": {"success": true, "finish": "x", "auto_remove": 9, "info": 9},
                            "auto_remove": true, "info": {"api": "A"}})"));
    EXPECT_EQ(StatusOf("ann/1"), Parse(R"({"success": true, "finish": false, "auto_remove": true,
                                           "info": {"api": "A"}})"));
}

TEST_F(TaskStatus, BearsARecordOfAnotherShape) {
    for (const char* body : {"[1]", R"("text")", "7", "null"}) {
        Json::Value properties;
        properties["body"] = Parse(body);
        fake::PutTask("ann", "1", properties);
        EXPECT_EQ(StatusOf("ann/1"), Parse(R"({"finish": false, "auto_remove": null})")) << body;
    }
}

TEST_F(TaskStatus, IsAskedAnewEachTime) {
    fake::PutTask("ann", "1", Json::Value(Json::objectValue));
    EXPECT_EQ(StatusOf("ann/1")["finish"], false);
    fake::PutTask("ann", "1", Json::Value(Json::objectValue), 0, true);
    EXPECT_EQ(StatusOf("ann/1")["finish"], true);
}

TEST_F(TaskStatus, CannotForgeALogLine) {
    Fails("ann\n1", 503, {"Invalid task id[ann\\x0a1]"});
}

}  // namespace
