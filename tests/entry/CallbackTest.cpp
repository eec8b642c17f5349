#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <sstream>
#include <string>
#include <vector>

#include "src/entry/RestartHttpd.h"
#include "tests/entry/EntryTest.h"

namespace {

struct Line {
    std::string what;
    int leader = -1;
    long long at = 0;
};

std::vector<Line> Lines(const std::string& text) {
    std::vector<Line> lines;
    std::istringstream stream(text);
    Line line;
    while (stream >> line.what >> line.leader >> line.at) {
        lines.push_back(line);
    }
    return lines;
}

long long NowInMilliseconds() {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_MONOTONIC, &now);
    return now.tv_sec * 1000LL + now.tv_nsec / 1000000;
}

// Runs at the end of the process that ran the callbacks: what it asked of the
// service control, and how many callbacks were done by then.
void TraceServices() {
    FILE* file = fopen(getenv("ENTRY_TRACE"), "ae");
    if (file == nullptr) {
        return;
    }
    for (const fake::ServiceCall& call : fake::Now().services) {
        (void)fprintf(file, "service-%x-%d-%d 0 0\n", static_cast<unsigned>(call.service),
                      call.action, call.flags);
    }
    (void)fprintf(file, "end 0 0\n");
    (void)fclose(file);
}

class Callbacks : public EntryTest {
  protected:
    // Serves a call in a process whose callbacks' process traces its services
    // when it ends; answers the lines and what the reply was.
    std::string ServeWithTrace(const std::string& method) {
        return Inside(Traced(GetMethod(method)), [](ProbeEntry& entry) {
            (void)atexit(TraceServices);
            EXPECT_GT(entry.Run(Json::Value()), 0);
        });
    }
};

TEST_F(Callbacks, RunInOrderInADetachedProcessAfterASecond) {
    const long long before = NowInMilliseconds();
    const std::string output = ServeWithTrace("later");
    const std::vector<Line> lines = Lines(WaitForTrace(4));
    ASSERT_EQ(lines.size(), 4u);
    EXPECT_EQ(lines[0].what, "first");
    // One in between throws; the others run all the same.
    EXPECT_EQ(lines[1].what, "second");
    EXPECT_EQ(lines[2].what, "third");
    EXPECT_EQ(lines[3].what, "end");
    for (size_t index = 0; index < 3; ++index) {
        EXPECT_EQ(lines[index].leader, 1);
        EXPECT_GE(lines[index].at - before, 990);
    }
    EXPECT_NE(output.find(R"({"success":true})"), std::string::npos) << output;
}

TEST_F(Callbacks, StillRunWhenTheMethodMadeItsOwnOutput) {
    EXPECT_EQ(ServeWithTrace("ownOutput"), "own");
    const std::vector<Line> lines = Lines(WaitForTrace(4));
    ASSERT_EQ(lines.size(), 4u);
    EXPECT_EQ(lines[0].what, "first");
}

TEST_F(Callbacks, EndWithTheRestartOfTheWebServer) {
    (void)ServeWithTrace("restart");
    const std::vector<Line> lines = Lines(WaitForTrace(3));
    ASSERT_EQ(lines.size(), 3u);
    EXPECT_EQ(lines[0].what, "first");
    EXPECT_EQ(lines[1].what, "service-80000000-3-0");
}

TEST_F(Callbacks, MayBeTheRestartAlone) {
    (void)ServeWithTrace("restartOnly");
    const std::vector<Line> lines = Lines(WaitForTrace(2));
    ASSERT_EQ(lines.size(), 2u);
    EXPECT_EQ(lines[0].what, "service-80000000-3-0");
}

TEST_F(Callbacks, GetTheRestartAppendedToTheResponsesOwnList) {
    fake::Now().FailCall("TLIBCProcFork", 1);
    Inside(Traced(GetMethod("restart")), [](ProbeEntry& entry) {
        (void)entry.Run(Json::Value());
        const auto& list = *entry.response->GetCallbackFuncs();
        ASSERT_EQ(list.size(), 2u);
        EXPECT_EQ(list.back().first, TALO::RestartHttpd);
        EXPECT_EQ(list.back().second, nullptr);
    });
}

TEST_F(Callbacks, AreNotRetriedWhenTheForkFails) {
    fake::Now().FailCall("TLIBCProcFork", 1);
    const std::string output = Inside(Traced(GetMethod("later")), [](ProbeEntry& entry) {
        EXPECT_LT(entry.Run(Json::Value()), 0);
        EXPECT_EQ(fake::Now().calls["TLIBCProcFork"], 1);
    });
    EXPECT_NE(output.find(R"({"success":true})"), std::string::npos) << output;
}

TEST_F(Callbacks, AskForNoProcessWhenThereAreNone) {
    Inside(GetMethod("echo"), [](ProbeEntry& entry) {
        EXPECT_EQ(entry.Run(Json::Value()), 0);
        EXPECT_EQ(entry.HandleCallback(nullptr), 0);
        EXPECT_EQ(fake::Now().calls["TLIBCProcFork"], 0);
    });
}

TEST_F(Callbacks, SkipEntriesWithoutAFunction) {
    Inside(Traced(Call()), [](ProbeEntry& entry) {
        (void)atexit(TraceServices);
        auto* list = entry.response->GetCallbackFuncs();
        list->emplace_back(nullptr, nullptr);
        list->emplace_back(TALO::RestartHttpd, nullptr);
        list->emplace_back(nullptr, nullptr);
        EXPECT_GT(entry.HandleCallback(entry.response), 0);
    });
    const std::vector<Line> lines = Lines(WaitForTrace(2));
    ASSERT_EQ(lines.size(), 2u);
    EXPECT_EQ(lines[0].what, "service-80000000-3-0");
}

TEST_F(Callbacks, RunInAProcessThatEndsWithStatusZero) {
    const support::ChildResult result = support::InChild([]() -> int {
        ProbeEntry entry;
        entry.response->GetCallbackFuncs()->emplace_back(nullptr, nullptr);
        const pid_t child = entry.HandleCallback(entry.response);
        int status = -1;
        EXPECT_EQ(waitpid(child, &status, 0), child);
        EXPECT_EQ(status, 0);
        return 0;
    });
    EXPECT_EQ(result.status, 0) << result.output;
}

TEST_F(Callbacks, RestartHttpdAsksForNothingElse) {
    TALO::RestartHttpd(&fake::Now());
    ASSERT_EQ(fake::Now().services.size(), 1u);
    EXPECT_EQ(static_cast<unsigned>(fake::Now().services[0].service), 0x80000000u);
    EXPECT_EQ(fake::Now().services[0].action, 3);
    EXPECT_EQ(fake::Now().services[0].flags, 0);
    EXPECT_EQ(fake::Now().journal, std::vector<std::string>{"TLIBNetService"});
}

}  // namespace
