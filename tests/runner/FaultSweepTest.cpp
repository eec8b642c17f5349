#include <set>

#include "tests/fake/FakePlatform.h"
#include "tests/runner/CompoundFixture.h"

namespace {

using runner::ErrorCode;
using runner::Parse;

// Fails the first, the second, the third … call of a platform operation while a
// request runs, until a run meets no failure any more.
class RunnerFaultSweep : public runner::CompoundFixture {
  protected:
    void SetUp() override {
        CompoundFixture::SetUp();
        Install("Test.Check");
    }

    // The codes that the runs ended with, the last one undisturbed.
    std::vector<int> Sweep(const std::string& operation, const Json::Value& document) {
        std::vector<int> codes;
        for (int nth = 1; nth < 100; ++nth) {
            fake::Now().calls.clear();
            fake::Now().failAt.clear();
            fake::Now().FailCall(operation, nth);
            runner::OpenRunner runner;
            (void)runner.Run(document);
            const Json::Value answer = runner.GetResponse();
            codes.push_back(ErrorCode(answer));
            EXPECT_GE(codes.back(), 0) << operation << " " << nth << ": " << answer;
            lastData = answer["data"];
            if (fake::Now().calls[operation] < nth) {
                return codes;
            }
        }
        ADD_FAILURE() << operation << " fails without end";
        return codes;
    }

    Json::Value lastData;
};

using CodeList = runner::CodeList;

TEST_F(RunnerFaultSweep, OverASingleRequest) {
    const Json::Value document = Post("Test.Basic", 1, "ok");
    EXPECT_EQ(Sweep("ReadJsonFile", document), CodeList({0, 102, 0}))
        << "the defaults, the description, none";
    EXPECT_EQ(Sweep("TLIBCFileExist", document), CodeList({102, 0}));
}

TEST_F(RunnerFaultSweep, OverARequestWithSeveralCandidates) {
    Describe("A.B.lib", Parse(R"({"A.B.C.D": {"lib": "", "minVersion": 1, "maxVersion": 1,
                                              "methods": {"1": ["ok"]}}})"));
    const Json::Value document = Post("A.B.C.D", 1, "ok");
    EXPECT_EQ(Sweep("TLIBCFileExist", document), CodeList({102, 111, 111, 111}));
}

TEST_F(RunnerFaultSweep, OverACheckedRequest) {
    EXPECT_EQ(Sweep("ReadJsonFile", Post("Test.Check", 1, "stop")), CodeList({401, 102, 401}));
}

TEST_F(RunnerFaultSweep, OverACompound) {
    Json::Value other = Element("pass");
    other["api"] = "Test.Check";
    const Json::Value document = Document(List({Element("ok"), other, Element("fail")}));
    for (const char* operation : {"ReadJsonFile", "TLIBCFileExist"}) {
        const CodeList codes = Sweep(operation, document);
        EXPECT_GT(codes.size(), 3u);
        EXPECT_EQ(codes.back(), 0);
        EXPECT_EQ(std::set<int>(codes.begin(), codes.end()), std::set<int>({0, 102}));
        EXPECT_EQ(CompoundFixture::Codes(lastData), CodeList({0, 0, 400}));
    }
}

TEST_F(RunnerFaultSweep, OverAParameterLineThatTheRunnerNeverReads) {
    EXPECT_EQ(Sweep("strPairToJsonObj", Post("Test.Basic", 1, "ok")), CodeList({0}));
}

TEST_F(RunnerFaultSweep, OverExec) {
    runner::InChild([] {
        for (const char* operation :
             {"ReadJsonFile", "TLIBCFileExist", "TLIBGroupIsAdminGroupMem"}) {
            for (int nth = 1; nth < 4; ++nth) {
                fake::Now().calls.clear();
                fake::Now().failAt.clear();
                fake::Now().FailCall(operation, nth);
                Json::Value out;
                TALO::APIRunner::Exec(out, "Test.Basic", 1, "ok", Json::Value(), "ada");
                EXPECT_GE(ErrorCode(out), 0) << operation << " " << nth;
            }
        }
    });
}

}  // namespace
