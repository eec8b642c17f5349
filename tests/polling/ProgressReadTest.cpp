#include "tests/polling/PollingFixture.h"

using polling::Parse;

namespace {

class ReadProgress : public polling::Fixture {
  protected:
    void Fails(const std::string& id, int code, const std::vector<std::string>& messages) {
        const size_t before = log.Lines().size();
        polling.SetError(500);
        Json::Value out("before");
        EXPECT_FALSE(polling.Progress(id, out)) << id;
        EXPECT_EQ(polling.GetError(), code) << id;
        EXPECT_EQ(out, "before") << id;
        std::vector<std::string> all = Messages();
        EXPECT_EQ(std::vector<std::string>(all.begin() + static_cast<long>(before), all.end()),
                  messages)
            << id;
    }

    Json::Value ProgressOf(const std::string& id) {
        Json::Value out("before");
        EXPECT_TRUE(polling.Progress(id, out)) << id;
        EXPECT_EQ(polling.GetError(), 500);
        return out;
    }
};

TEST_F(ReadProgress, FailsAsStatusDoes) {
    fake::PutTask("bob", "1", Json::Value(Json::objectValue));
    fake::PutTask("ann", "1", Json::Value(Json::objectValue));
    fake::PutTask("@administrators", "1", Json::Value(Json::objectValue));
    Fails("", 502, {"bad parameters"});
    Fails("ann", 503, {"Invalid task id[ann]"});
    Fails("bob/1", 503, {"Invalid task id", "Invalid task id[bob/1]"});
    Fails("@administrators/1", 503, {"Permission denied", "Invalid task id[@administrators/1]"});
    Fails("ann/2", 508, {"No such task id[ann/2]"});
    fake::Now().FailCall("Task.Task", 1);
    Fails("ann/1", 504, {"Cannot get task"});
    polling.SetRequest(nullptr);
    Fails("ann/1", 502, {"unknown request"});
}

TEST_F(ReadProgress, AnswersWhatWasTold) {
    fake::PutTask("@users", "1", Parse(R"({"progress": {"percent": 12.5, "text": "b.mp3",
                                           "log": ["one", "two"], "log_first": 7, "time": 99}})"));
    EXPECT_EQ(ProgressOf("@users/1"),
              Parse(R"({"percent": 12.5, "text": "b.mp3", "log": ["one", "two"], "log_first": 7,
                        "time": 99, "finish": false})"));
}

TEST_F(ReadProgress, AnswersTheSameMembersWhenNothingWasTold) {
    const Json::Value nothing = Parse(R"({"percent": null, "text": "", "log": [], "log_first": 0,
                                          "time": null, "finish": true})");
    for (const char* properties : {"{}", R"({"progress": null})", R"({"progress": [1]})",
                                   R"({"progress": {"log": 3, "text": [], "log_first": "x"}})"}) {
        fake::PutTask("ann", "1", Parse(properties), 0, true);
        EXPECT_EQ(ProgressOf("ann/1"), nothing) << properties;
    }
}

TEST_F(ReadProgress, OfTheAdministratorsIsForThem) {
    fake::PutTask("@administrators", "1", Json::Value(Json::objectValue));
    LogIn("root", true);
    EXPECT_EQ(ProgressOf("@administrators/1")["finish"], false);
}

// The manager takes C strings: nothing may pass for what is in front of a NUL.
TEST_F(ReadProgress, AndStatusTakeNoIdWithANulInIt) {
    fake::PutTask("ann", "1", Json::Value(Json::objectValue));
    const std::string id("ann/1\0x", 7);
    Json::Value out;
    EXPECT_FALSE(polling.Progress(id, out));
    EXPECT_EQ(polling.GetError(), 508);
    polling.SetError(500);
    EXPECT_FALSE(polling.Status(id, out));
    EXPECT_EQ(polling.GetError(), 508);
    polling.SetError(500);
    EXPECT_FALSE(polling.Stop(id, true));
    EXPECT_EQ(polling.GetError(), 508);
    EXPECT_EQ(fake::TaskRecord("ann", "1")["finished"], false);
    EXPECT_TRUE(polling.List(std::string("1\0x", 3), Parse(R"(["user"])"), out));
    EXPECT_EQ(out, Parse(R"({"user": null})"));
}

}  // namespace
