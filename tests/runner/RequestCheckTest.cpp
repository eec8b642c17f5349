#include "tests/fake/FakePlatform.h"
#include "tests/runner/RunnerFixture.h"

namespace {

using runner::Description;
using runner::Error;
using runner::Parse;

// The checks of a request against the descriptions.
class RequestCheck : public runner::Fixture {
  protected:
    void List(const std::string& methods, int least = 1, int most = 3) {
        Json::Value content(Json::objectValue);
        content["A.B"] = Description(methods);
        content["A.B"]["minVersion"] = least;
        content["A.B"]["maxVersion"] = most;
        Describe("A.B.lib", content);
    }

    // The code that the checks alone leave, 0 when they pass.
    int Check(const Json::Value& document) {
        runner::OpenRunner runner;
        TALO::APIRequest request(document);
        TALO::APIResponse response(&request);
        const int passed = runner.CheckRequestParam(&request, &response);
        EXPECT_EQ(passed != 0, response.GetError() == 0);
        if (!passed) {
            EXPECT_EQ(response.GetBody(), Error(response.GetError())) << "no data goes with it";
        }
        return response.GetError();
    }

    int Check(const std::string& api, int version, const std::string& method) {
        return Check(Post(api, version, method));
    }
};

TEST_F(RequestCheck, WantsNameVersionAndMethodBeforeItLooksForAFile) {
    List(R"({"1": ["list"]})");
    EXPECT_EQ(Check("", 1, "list"), 101);
    EXPECT_EQ(Check("A.B", 0, "list"), 101);
    EXPECT_EQ(Check("A.B", -1, "list"), 101);
    EXPECT_EQ(Check("A.B", -2147483648, "list"), 101);
    EXPECT_EQ(Check("A.B", 1, ""), 101);
    EXPECT_EQ(Check(Parse("{}")), 101);
    EXPECT_EQ(fake::Now().calls["TLIBCFileExist"], 0);
}

TEST_F(RequestCheck, RefusesAnAPIWithoutAFileWith102) {
    EXPECT_EQ(Check("A.B", 1, "list"), 102);
}

TEST_F(RequestCheck, RefusesAnUnreadableFileWith102) {
    Describe("A.B.lib", std::string("{"));
    EXPECT_EQ(Check("A.B", 1, "list"), 102);
}

TEST_F(RequestCheck, RefusesAnAPIThatItsFileDoesNotHaveWith102) {
    List(R"({"1": ["list"]})");
    EXPECT_EQ(Check("A.B.C", 1, "list"), 102);
    Describe("A.B.lib", Parse(R"({"A.B": {"lib": 1}})"));
    EXPECT_EQ(Check("A.B", 1, "list"), 102);
}

TEST_F(RequestCheck, AcceptsBothEndsOfTheRangeAndRefusesBeyondWith104) {
    List(R"({"1": ["list"], "2": ["list"], "3": ["list"], "4": ["list"], "5": ["list"]})", 2, 4);
    EXPECT_EQ(Check("A.B", 1, "list"), 104);
    EXPECT_EQ(Check("A.B", 2, "list"), 0);
    EXPECT_EQ(Check("A.B", 3, "list"), 0);
    EXPECT_EQ(Check("A.B", 4, "list"), 0);
    EXPECT_EQ(Check("A.B", 5, "list"), 104);
    EXPECT_EQ(Check("A.B", 2147483647, "list"), 104);
}

TEST_F(RequestCheck, RefusesEveryVersionOfAnEmptyRange) {
    List(R"({"1": ["list"], "2": ["list"]})", 2, 1);
    EXPECT_EQ(Check("A.B", 1, "list"), 104);
    EXPECT_EQ(Check("A.B", 2, "list"), 104);
}

TEST_F(RequestCheck, AsksForTheVersionBeforeTheMethod) {
    List(R"({})");
    EXPECT_EQ(Check("A.B", 9, "none"), 104);
}

TEST_F(RequestCheck, RefusesAMethodOfAnotherVersionWith103) {
    List(R"({"1": ["list"], "2": ["other"]})");
    EXPECT_EQ(Check("A.B", 1, "list"), 0);
    EXPECT_EQ(Check("A.B", 2, "list"), 103);
    EXPECT_EQ(Check("A.B", 3, "list"), 103) << "in range, without a list";
}

TEST_F(RequestCheck, TakesAMethodAsATextOrAsAnyMemberOfAnObject) {
    List(R"({"1": [7, "text", {"first": {}, "second": {}}]})");
    EXPECT_EQ(Check("A.B", 1, "text"), 0);
    EXPECT_EQ(Check("A.B", 1, "first"), 0);
    EXPECT_EQ(Check("A.B", 1, "second"), 0);
    EXPECT_EQ(Check("A.B", 1, "7"), 103);
    EXPECT_EQ(Check("A.B", 1, "Text"), 103);
    EXPECT_EQ(Check("A.B", 1, std::string("text\0", 5)), 103);
}

TEST_F(RequestCheck, RefusesAnUploadToAMethodThatTakesNoneWith115) {
    List(R"({"1": ["plain", {"open": {"allowUpload": true}}, {"shut": {"allowUpload": false}},
                   {"mute": {}}]})");
    EXPECT_EQ(Check(Upload("A.B", 1, "plain")), 115);
    EXPECT_EQ(Check(Upload("A.B", 1, "shut")), 115);
    EXPECT_EQ(Check(Upload("A.B", 1, "mute")), 115);
    EXPECT_EQ(Check(Upload("A.B", 1, "open")), 0);
    EXPECT_EQ(Check("A.B", 1, "open"), 0);
}

TEST_F(RequestCheck, TakesTheDefaultsForAMethodWithoutAttributes) {
    Defaults(R"({"methods": {"allowUpload": true}})");
    List(R"({"1": ["plain", {"mute": {}}, {"a": {}, "second": {}}]})");
    EXPECT_EQ(Check(Upload("A.B", 1, "plain")), 0);
    EXPECT_EQ(Check(Upload("A.B", 1, "second")), 0);
    EXPECT_EQ(Check(Upload("A.B", 1, "mute")), 115);
}

TEST_F(RequestCheck, NeverInsertsIntoTheDescriptions) {
    List(R"({"1": ["list"]})");
    TALO::APIRequest request(Post("A.B", 2, "none"));
    TALO::APIResponse response(&request);
    ASSERT_EQ(Runner().InitLibDesc(Runner().libDesc, "A.B"), 1);
    const Json::Value before = Runner().libDesc;
    EXPECT_EQ(Runner().CheckRequestParam(&request, &response), 0);
    TALO::APIRequest other(Post("A.B.C", 1, "list"));
    EXPECT_EQ(Runner().CheckRequestParam(&other, &response), 0);
    EXPECT_EQ(Runner().AddAPIInfo(&other), 0);
    EXPECT_EQ(Runner().libDesc, before);
}

TEST_F(RequestCheck, CopiesTheDescriptionIntoTheRequest) {
    List(R"({"1": ["list"]})");
    TALO::APIRequest request(Post("A.B", 1, "list"));
    request.InitAPIInfo(Parse(R"({"stale": 1})"));
    EXPECT_EQ(Runner().AddAPIInfo(&request), 0) << "not loaded yet";
    EXPECT_EQ(request.GetAPIInfo("stale", 0), Json::Value(1));
    ASSERT_EQ(Runner().InitLibDesc(Runner().libDesc, "A.B"), 1);
    EXPECT_EQ(Runner().AddAPIInfo(&request), 1);
    EXPECT_EQ(request.GetAPIInfo("", Json::Value()), Runner().libDesc["A.B"]);
    EXPECT_EQ(Runner().AddAPIInfo(nullptr), 0);
}

}  // namespace
