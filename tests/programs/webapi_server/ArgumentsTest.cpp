#include "programs/webapi_server/Arguments.h"

#include <gtest/gtest.h>
#include <stdlib.h>
#include <unistd.h>

#include <vector>

namespace {

struct Outcome {
    bool understood;
    Arguments arguments;
    std::string problem;
};

Outcome Parse(std::vector<std::string> words) {
    words.insert(words.begin(), "webapi-server");
    std::vector<char*> argv;
    for (std::string& word : words) {
        argv.push_back(word.data());
    }
    argv.push_back(nullptr);
    Outcome outcome = {};
    outcome.understood = ParseArguments(static_cast<int>(words.size()), argv.data(),
                                        &outcome.arguments, &outcome.problem);
    return outcome;
}

TEST(ServerArguments, HasADefaultForEverySetting) {
    const Outcome outcome = Parse({});
    ASSERT_TRUE(outcome.understood);
    EXPECT_EQ(outcome.arguments.settings.socket, "");
    EXPECT_EQ(outcome.arguments.settings.minWorkers, 2);
    EXPECT_EQ(outcome.arguments.settings.maxWorkers, 32);
    EXPECT_EQ(outcome.arguments.settings.queue, 512);
    EXPECT_EQ(outcome.arguments.settings.deadlineSeconds, 90);
    EXPECT_EQ(outcome.arguments.settings.workerRequests, 10000);
    EXPECT_EQ(outcome.arguments.settings.workerGrowthKiB, 16384);
    EXPECT_EQ(outcome.arguments.settings.workerSeconds, 3600);
}

TEST(ServerArguments, HasAnOptionForEverySetting) {
    const Outcome outcome =
        Parse({"--socket", "/s", "--min-workers=3", "--max-workers=4", "--queue=5", "--deadline=0",
               "--worker-requests=6", "--worker-growth=7", "--worker-seconds=8"});
    ASSERT_TRUE(outcome.understood) << outcome.problem;
    EXPECT_EQ(outcome.arguments.settings.socket, "/s");
    EXPECT_EQ(outcome.arguments.settings.minWorkers, 3);
    EXPECT_EQ(outcome.arguments.settings.maxWorkers, 4);
    EXPECT_EQ(outcome.arguments.settings.queue, 5);
    EXPECT_EQ(outcome.arguments.settings.deadlineSeconds, 0);
    EXPECT_EQ(outcome.arguments.settings.workerRequests, 6);
    EXPECT_EQ(outcome.arguments.settings.workerGrowthKiB, 7);
    EXPECT_EQ(outcome.arguments.settings.workerSeconds, 8);
}

TEST(ServerArguments, UnderstandsHelp) {
    const Outcome outcome = Parse({"--help"});
    EXPECT_TRUE(outcome.understood);
    EXPECT_TRUE(outcome.arguments.help);
}

struct WrongUsage {
    const char* name;
    std::vector<std::string> words;
};

class ServerArgumentsRefused : public testing::TestWithParam<WrongUsage> {};

TEST_P(ServerArgumentsRefused, SaysWhatIsWrong) {
    const Outcome outcome = Parse(GetParam().words);
    EXPECT_FALSE(outcome.understood);
    EXPECT_NE(outcome.problem, "");
}

INSTANTIATE_TEST_SUITE_P(
    All, ServerArgumentsRefused,
    testing::Values(WrongUsage{"UnknownOption", {"--nonsense"}},
                    WrongUsage{"MissingValue", {"--queue"}},
                    WrongUsage{"EmptySocket", {"--socket="}}, WrongUsage{"Argument", {"more"}},
                    WrongUsage{"NoNumber", {"--queue=many"}}, WrongUsage{"NoDigits", {"--queue="}},
                    WrongUsage{"NumberAndMore", {"--queue=5x"}},
                    WrongUsage{"BlankNumber", {"--queue= 5"}},
                    WrongUsage{"Negative", {"--deadline=-1"}}, WrongUsage{"Zero", {"--queue=0"}},
                    WrongUsage{"TooMany", {"--max-workers=1025"}},
                    WrongUsage{"Huge", {"--queue=99999999999999999999"}},
                    WrongUsage{"MinimumAboveMaximum", {"--min-workers=5", "--max-workers=4"}},
                    WrongUsage{"MinimumAboveDefault", {"--min-workers=33"}}),
    [](const auto& info) { return info.param.name; });

class HandedOverSocket : public testing::Test {
  protected:
    ~HandedOverSocket() override {
        for (const char* name : {"LISTEN_PID", "LISTEN_FDS", "LISTEN_FDNAMES"}) {
            unsetenv(name);
        }
    }
    void Set(const std::string& process, const std::string& count) {
        setenv("LISTEN_PID", process.c_str(), 1);
        setenv("LISTEN_FDS", count.c_str(), 1);
        setenv("LISTEN_FDNAMES", "webapi", 1);
    }
    std::string own = std::to_string(getpid());
    std::string problem;
};

TEST_F(HandedOverSocket, IsNoneWithoutVariables) {
    EXPECT_EQ(ReadHandedOver(&problem), HandedOver::kNothing);
}

TEST_F(HandedOverSocket, IsForTheNamedProcessAlone) {
    for (const char* process : {"1", "", "x", "-1"}) {
        Set(process, "1");
        EXPECT_EQ(ReadHandedOver(&problem), HandedOver::kNothing) << process;
    }
}

TEST_F(HandedOverSocket, IsTakenAndTheVariablesAreGone) {
    Set(own, "1");
    EXPECT_EQ(ReadHandedOver(&problem), HandedOver::kSocket);
    EXPECT_EQ(getenv("LISTEN_PID"), nullptr);
    EXPECT_EQ(getenv("LISTEN_FDS"), nullptr);
    EXPECT_EQ(getenv("LISTEN_FDNAMES"), nullptr);
}

TEST_F(HandedOverSocket, IsUnusableUnlessThereIsOne) {
    for (const char* count : {"0", "2", "", "x"}) {
        Set(own, count);
        EXPECT_EQ(ReadHandedOver(&problem), HandedOver::kUnusable) << count;
        EXPECT_NE(problem, "");
    }
}

}  // namespace
