#include "tests/fake/FakePlatform.h"
#include "tests/runner/CompoundFixture.h"
#include "tests/runner/SystemProbe.h"

namespace {

using runner::CodeList;
using runner::Error;
using runner::Parse;

class Compound : public runner::CompoundFixture {};

TEST_F(Compound, OfNothingSucceeds) {
    EXPECT_EQ(Data(Document(Json::Value(Json::arrayValue))),
              Parse(R"({"result": [], "has_fail": false})"));
}

TEST_F(Compound, AnswersEveryElementInOrderUnderItsIdentity) {
    const Json::Value data =
        Data(Document(List({Element("ok"), Element("fail"), Element("echo", R"({"a": 1})")})));
    EXPECT_EQ(data, Parse(R"({"has_fail": true, "result": [
        {"success": true, "api": "Test.Basic", "version": 1, "method": "ok"},
        {"success": false, "error": {"code": 400},
         "api": "Test.Basic", "version": 1, "method": "fail"},
        {"success": true, "api": "Test.Basic", "version": 1, "method": "echo",
         "data": {"a": 1, "api": "Test.Basic", "version": 1, "method": "echo"}}]})"));
}

TEST_F(Compound, HasNoFailWhenAllSucceed) {
    const Json::Value data = Data(Document(List({Element("ok"), Element("ok")})));
    EXPECT_EQ(data["has_fail"], Json::Value(false));
}

TEST_F(Compound, WithoutAListIs110) {
    EXPECT_EQ(Call("TALO.Entry.Request", 1, "request"), Error(110));
}

TEST_F(Compound, WithoutAUsableListIs110) {
    for (const char* list : {"null", "{}", R"({"0": {}})", "\"[]\"", "5", "true", "\"\""}) {
        EXPECT_EQ(Run(Document(Parse(list))), Error(110)) << list;
    }
}

TEST_F(Compound, IsTheMethodRequestOnly) {
    Json::Value document = Document(Json::Value(Json::arrayValue));
    document["postParam"]["method"] = "other";
    (void)Runner().Run(document);
    EXPECT_EQ(Runner().response->GetBody(), Json::Value(Json::objectValue)) << "no code is set";
    document["postParam"]["method"] = "unlisted";
    EXPECT_EQ(Run(document), Error(103));
}

TEST_F(Compound, NeedsItsDescription) {
    fake::Now().files.erase("TALO.Entry.Request.lib");
    EXPECT_EQ(Run(Document(Json::Value(Json::arrayValue))), Error(102));
}

TEST_F(Compound, CountsItsDepthAndComesBackToNothing) {
    std::vector<int> depths;
    Runner().need = [&](TALO::APIRequest*) {
        depths.push_back(Runner().compoundDepth);
        return false;
    };
    const Json::Value inner = Nested(List({Element("ok"), Nested(List({Element("ok")}))}));
    (void)Data(Document(List({Element("ok"), inner, Element("ok")})));
    EXPECT_EQ(depths, CodeList({1, 2, 3, 1}));
    EXPECT_EQ(Runner().compoundDepth, 0);
    (void)Runner().Run(Document(Json::Value()));
    EXPECT_EQ(Runner().compoundDepth, 0);
}

TEST_F(Compound, MayHoldCompounds) {
    const Json::Value third = Nested(List({Element("fail")}));
    const Json::Value second = Nested(List({third, Element("ok")}));
    const Json::Value data = Data(Document(List({second, Element("ok")})));
    EXPECT_EQ(Codes(data), CodeList({0, 0}));
    EXPECT_EQ(data["has_fail"], Json::Value(false)) << "the inner compound itself succeeds";
    const Json::Value& inner = data["result"][0]["data"];
    EXPECT_EQ(Codes(inner), CodeList({0, 0}));
    EXPECT_EQ(data["result"][0]["api"], Json::Value("TALO.Entry.Request"));
    const Json::Value& innermost = inner["result"][0]["data"];
    EXPECT_EQ(Codes(innermost), CodeList({400}));
    EXPECT_EQ(innermost["has_fail"], Json::Value(true));
}

TEST_F(Compound, TellsTheInnerListsOfBadInnerCompounds) {
    EXPECT_EQ(Codes(Data(Document(List({Nested(Json::Value()), Nested(Parse("{}")),
                                        Nested(Json::Value(Json::arrayValue))})))),
              CodeList({110, 110, 0}));
}

TEST_F(Compound, OfAThousandElementsOpensTheirLibraryOnce) {
    Json::Value list(Json::arrayValue);
    for (int number = 0; number < 1000; ++number) {
        Json::Value element = Element("echo");
        element["number"] = number;
        list.append(element);
    }
    const Json::Value data = Data(Document(list));
    ASSERT_EQ(data["result"].size(), 1000u);
    EXPECT_EQ(data["has_fail"], Json::Value(false));
    for (int number = 0; number < 1000; ++number) {
        EXPECT_EQ(data["result"][number]["data"]["number"], Json::Value(number));
    }
    EXPECT_EQ(Runner().libHandles.size(), 1u);
}

TEST_F(Compound, NamesTheProcessAfterEachElementAndThenItselfAgain) {
    probe::LogIdentities().clear();
    (void)Runner();
    (void)Data(Document(List({Element("ok"), Element("fail")})));
    std::vector<std::string> names;
    for (const probe::Identity& identity : probe::LogIdentities()) {
        const std::string name = identity.text.substr(identity.text.find('_') + 1);
        if (names.empty() || names.back() != name) {
            names.push_back(name);
        }
    }
    EXPECT_EQ(names,
              std::vector<std::string>({"TALO.Entry.Request[1].request", "Test.Basic[1].ok",
                                        "Test.Basic[1].fail", "TALO.Entry.Request[1].request"}));
}

TEST_F(Compound, WithoutMemoryForItsRequestIs117) {
    (void)Runner().Initialize(Document(List({Element("ok")})));
    probe::FailNothrowAllocation(1);
    EXPECT_EQ(Runner().HandleCompound(Runner().request, Runner().response), 0);
    probe::FailNothrowAllocation(0);
    EXPECT_EQ(Runner().response->GetBody(), Error(117));
    EXPECT_TRUE(Logged("new APIRequest Fail"));
    EXPECT_EQ(log.Lines().back().priority, LOG_ERR);
}

TEST_F(Compound, WithoutMemoryForItsResponseIs117) {
    (void)Runner().Initialize(Document(List({Element("ok")})));
    probe::FailNothrowAllocation(2);
    EXPECT_EQ(Runner().HandleCompound(Runner().request, Runner().response), 0);
    probe::FailNothrowAllocation(0);
    EXPECT_EQ(Runner().response->GetBody(), Error(117));
    EXPECT_TRUE(Logged("new APIResponse Fail"));
}

TEST_F(Compound, AllocatesForTheWholeListOnce) {
    (void)Runner().Initialize(Document(List({Element("ok"), Element("ok"), Element("ok")})));
    probe::FailNothrowAllocation(3);
    EXPECT_EQ(Runner().HandleCompound(Runner().request, Runner().response), 1);
    probe::FailNothrowAllocation(0);
    EXPECT_EQ(Codes(Runner().response->GetBody()["data"]), CodeList({0, 0, 0}));
}

struct StopCase {
    const char* value;
    bool stops;
};

const StopCase kStops[] = {
    {"true", true},  {"false", false},     {"1", true},        {"0", false},    {"-1", true},
    {"0.0", false},  {"0.5", true},        {"\"true\"", true}, {"\"1\"", true}, {"\"false\"", true},
    {"\"0\"", true}, {"\"\"", false},      {"null", false},    {"[]", false},   {"[false]", true},
    {"{}", false},   {"{\"a\": 0}", true},
};

TEST_F(Compound, StopsBehindAFailureInEverySpellingOfTrue) {
    const Json::Value list = List({Element("ok"), Element("fail"), Element("ok"), Element("echo")});
    EXPECT_EQ(Codes(Data(Document(list))), CodeList({0, 400, 0, 0})) << "absent";
    for (const StopCase& row : kStops) {
        const Json::Value data = Data(Stopping(list, Parse(row.value)));
        EXPECT_EQ(Codes(data), row.stops ? CodeList({0, 400, 112, 112}) : CodeList({0, 400, 0, 0}))
            << row.value;
        EXPECT_EQ(data["has_fail"], Json::Value(true));
    }
}

TEST_F(Compound, AnswersSkippedElementsUnderTheirIdentity) {
    const Json::Value data =
        Data(Stopping(List({Element("fail"), Element("echo", R"({"a": 1})")}), true));
    EXPECT_EQ(data["result"][1], Parse(R"({"success": false, "error": {"code": 112},
                                           "api": "Test.Basic", "version": 1,
                                           "method": "echo"})"));
}

TEST_F(Compound, StopsBehindARefusedTransferToo) {
    EXPECT_EQ(Codes(Data(Stopping(List({Element("upload"), Element("ok")}), true))),
              CodeList({113, 112}));
}

TEST_F(Compound, StopsOnlyItsOwnList) {
    Json::Value inner = Nested(List({Element("fail"), Element("ok")}));
    const Json::Value data = Data(Stopping(List({inner, Element("ok")}), true));
    EXPECT_EQ(Codes(data), CodeList({0, 0}));
    EXPECT_EQ(Codes(data["result"][0]["data"]), CodeList({400, 0}));
    inner["stop_when_error"] = true;
    EXPECT_EQ(Codes(Data(Document(List({inner})))["result"][0]["data"]), CodeList({400, 112}));
}

}  // namespace
