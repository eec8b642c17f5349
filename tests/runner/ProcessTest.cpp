#include "tests/fake/FakePlatform.h"
#include "tests/runner/RunnerFixture.h"
#include "tests/runner/SystemProbe.h"

namespace {

using runner::Error;

// The order of the dispatch.
class Process : public runner::Fixture {
  protected:
    void SetUp() override {
        Install("Test.Basic");
        probe::LogIdentities().clear();
    }

    int Dispatch(const Json::Value& document) {
        request = std::make_unique<TALO::APIRequest>(document);
        response = std::make_unique<TALO::APIResponse>(request.get());
        return Runner().Process(request.get(), response.get());
    }

    std::unique_ptr<TALO::APIRequest> request;
    std::unique_ptr<TALO::APIResponse> response;
};

TEST_F(Process, NamesTheProcessBeforeItChecks) {
    EXPECT_EQ(Dispatch(Post("", 1, "ok")), 0);
    EXPECT_EQ(response->GetBody(), Error(101));
    EXPECT_TRUE(probe::LogIdentities().empty());
    EXPECT_EQ(Dispatch(Post("Test.Basic", 0, "ok")), 0);
    EXPECT_EQ(response->GetBody(), Error(101));
    ASSERT_EQ(probe::LogIdentities().size(), 1u);
    EXPECT_NE(probe::LogIdentities()[0].text.find("_Test.Basic[0].ok"), std::string::npos);
}

TEST_F(Process, NamesTheProcessAgainBehindTheCall) {
    EXPECT_EQ(Dispatch(Post("Test.Basic", 1, "ok")), 1);
    ASSERT_EQ(probe::LogIdentities().size(), 2u);
    EXPECT_EQ(probe::LogIdentities()[0].text, probe::LogIdentities()[1].text);
}

TEST_F(Process, StopsAtTheChecks) {
    EXPECT_EQ(Dispatch(Post("Test.Basic", 4, "ok")), 0);
    EXPECT_EQ(response->GetBody(), Error(104));
    EXPECT_TRUE(Runner().trace.empty());
    EXPECT_TRUE(request->GetAPIInfo("", Json::Value()).empty());
}

TEST_F(Process, GivesTheRequestItsDescription) {
    EXPECT_EQ(Dispatch(Post("Test.Basic", 1, "ok")), 1);
    EXPECT_EQ(request->GetAPIInfo("lib", ""), Json::Value(runner::ModulePath("TestBasic")));
    EXPECT_EQ(request->GetAPIInfo("requestFormat", ""), Json::Value("JSON"));
}

TEST_F(Process, RefusesARelayParameterBehindTheChecksWith109) {
    Json::Value params(Json::objectValue);
    params["relay_nd"] = false;
    EXPECT_EQ(Dispatch(Post("Test.Basic", 1, "ok", params)), 0);
    EXPECT_EQ(response->GetBody(), Error(109));
    EXPECT_TRUE(Runner().trace.empty());
    EXPECT_EQ(Dispatch(Post("Test.Basic", 4, "ok", params)), 0);
    EXPECT_EQ(response->GetBody(), Error(104)) << "the checks come first";
}

TEST_F(Process, AnswersTheResultOfTheCallNotOfTheMethod) {
    EXPECT_EQ(Dispatch(Post("Test.Basic", 1, "fail")), 1);
    EXPECT_EQ(response->GetError(), 400);
    EXPECT_EQ(Dispatch(Post("Test.Basic", 1, "notInTable")), 0);
    EXPECT_EQ(response->GetError(), 121);
}

TEST_F(Process, AsksTheHooksInOrder) {
    Runner().need = [](TALO::APIRequest*) { return true; };
    Runner().check = [](TALO::APIRequest*, TALO::APIResponse*) { return false; };
    EXPECT_EQ(Dispatch(Upload("Test.Basic", 1, "uploadEcho")), 1);
    EXPECT_EQ(Runner().trace, std::vector<std::string>({"need", "check", "skip", "upload"}));
}

TEST_F(Process, OpensNoLibraryForTheFrameworksOwnAPI) {
    Json::Value content(Json::objectValue);
    content["TALO.Entry.Request"] = runner::Description(R"({"1": ["request", "other"]})");
    Describe("TALO.Entry.Request.lib", content);
    EXPECT_EQ(Dispatch(Post("TALO.Entry.Request", 1, "request")), 0);
    EXPECT_EQ(response->GetBody(), Error(110));
    EXPECT_EQ(Dispatch(Post("TALO.Entry.Request", 1, "other")), 0);
    EXPECT_EQ(response->GetBody(), Json::Value(Json::objectValue)) << "no code of its own";
    EXPECT_EQ(Dispatch(Post("TALO.Entry.Request", 1, "unlisted")), 0);
    EXPECT_EQ(response->GetBody(), Error(103));
    EXPECT_TRUE(Runner().trace.empty());
    EXPECT_TRUE(Runner().libHandles.empty());
}

TEST_F(Process, IsOfTheFrameworkOnlyUnderTheExactName) {
    Json::Value content(Json::objectValue);
    content["TALO.Entry.Requests"] = runner::Description(R"({"1": ["request"]})");
    Describe("TALO.Entry.Requests.lib", content);
    EXPECT_EQ(Dispatch(Post("TALO.Entry.Requests", 1, "request")), 0);
    EXPECT_EQ(response->GetBody(), Error(111));
}

}  // namespace
