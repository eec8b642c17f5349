#include <sys/prctl.h>
#include <sys/syscall.h>
#include <syslog.h>

#include <cerrno>
#include <cstring>

#include "src/runner/APIRunnerPrivate.h"
#include "tests/runner/RunnerFixture.h"
#include "tests/runner/SystemProbe.h"

namespace {

using runner::Error;

// An argument vector of a program, so that its storage can be looked at.
class ProgramName {
  public:
    explicit ProgramName(const std::string& name) : storage(name.begin(), name.end()) {
        storage.push_back('\0');
        storage.push_back('|');  // what lies behind belongs to the next argument
        arguments[0] = storage.data();
    }
    char** Vector() {
        return arguments;
    }
    std::string Shown() const {
        EXPECT_EQ(storage.back(), '|');
        const std::string shown = storage.data();
        EXPECT_EQ(storage.find_first_not_of('\0', shown.size()), storage.size() - 1)
            << "something of another name is left";
        return shown;
    }
    bool IsBlank() const {
        return storage.find_first_not_of('\0') == storage.size() - 1;
    }

  private:
    std::string storage;
    char* arguments[2] = {};
};

class ProcessName : public runner::Fixture {
  protected:
    int Name(const std::string& api, int version, const std::string& method) {
        request = std::make_unique<TALO::APIRequest>(Post(api, version, method));
        response = std::make_unique<TALO::APIResponse>(request.get());
        probe::LogIdentities().clear();
        return Runner().SetProcessName(request.get(), response.get());
    }

    std::string LogIdentity() {
        return probe::LogIdentities().empty() ? "" : probe::LogIdentities().back().text;
    }

    std::unique_ptr<TALO::APIRequest> request;
    std::unique_ptr<TALO::APIResponse> response;
};

TEST_F(ProcessName, NeedsAnAPI) {
    EXPECT_EQ(Name("", 1, "list"), 0);
    EXPECT_EQ(response->GetBody(), Error(101));
    EXPECT_TRUE(probe::LogIdentities().empty());
}

TEST_F(ProcessName, NamesLogArgumentAndTask) {
    runner::InChild([this] {
        ProgramName program("/usr/lib/cgi-bin/entry.cgi-with-much-room");
        Runner().d->GetProcName() = "entry.cgi";
        Runner().SetArgs(1, program.Vector());
        EXPECT_EQ(Name("A.B", 1, "list"), 1);
        EXPECT_EQ(LogIdentity(), "entry.cgi_A.B[1].list");
        EXPECT_EQ(program.Shown(), "entry.cgi_A.B[1].list");
        EXPECT_EQ(probe::TaskName(), "A.B[1].list");
        EXPECT_EQ(response->GetBody(), Json::Value(Json::objectValue));
    });
}

TEST_F(ProcessName, ReopensTheLogUnderTheIdentity) {
    EXPECT_EQ(Name("A.B", 1, "list"), 1);
    ASSERT_EQ(probe::LogIdentities().size(), 1u);
    const probe::Identity& identity = probe::LogIdentities()[0];
    EXPECT_EQ(identity.options, LOG_PID | LOG_CONS);
    EXPECT_EQ(identity.facility, 0);
    EXPECT_TRUE(identity.closedBefore);
}

TEST_F(ProcessName, KeepsTheLogIdentityAliveBeyondTheRunner) {
    const char* pointer = nullptr;
    {
        runner::OpenRunner runner;
        runner.d->GetOrigProcName() = "the-start";
        TALO::APIRequest named(Post("A.B", 1, "list"));
        TALO::APIResponse answer(&named);
        ASSERT_EQ(runner.SetProcessName(&named, &answer), 1);
        pointer = probe::LogIdentities().back().pointer;
    }
    EXPECT_EQ(probe::LogIdentities().back().pointer, pointer);
    EXPECT_STREQ(pointer, "the-start");
}

TEST_F(ProcessName, OfATaskIsCutToItsBuffer) {
    runner::InChild([this] {
        EXPECT_EQ(Name("TALO.Entry", 12, "request"), 1);
        // The kernel keeps one character less than the 16 that it is given.
        EXPECT_EQ(probe::TaskName(), std::string("TALO.Entry[12].request").substr(0, 15));
        EXPECT_EQ(Name("A", 1, "b"), 1);
        EXPECT_EQ(probe::TaskName(), "A[1].b");
    });
}

TEST_F(ProcessName, OfTheLogIsCutToItsBuffer) {
    Runner().d->GetProcName() = "p";
    EXPECT_EQ(Name(std::string(70000, 'A'), 1, "list"), 1);
    EXPECT_EQ(LogIdentity(), "p_" + std::string(1021, 'A'));
    EXPECT_EQ(Name(std::string(1010, 'A'), 1, "list"), 1);
    EXPECT_EQ(LogIdentity(), "p_" + std::string(1010, 'A') + "[1].list");
}

TEST_F(ProcessName, InTheArgumentsIsOneShorterThanTheStartName) {
    ProgramName program("12345678");
    Runner().d->GetProcName() = "p";
    Runner().SetArgs(1, program.Vector());
    EXPECT_EQ(Name("A.B", 1, "list"), 1);
    EXPECT_EQ(program.Shown(), "p_A.B[1");
    EXPECT_EQ(Name("C", 1, ""), 1);
    EXPECT_EQ(program.Shown(), "p_C[1].");
    Runner().d->SetArgv0("x");
    EXPECT_EQ(program.Shown(), "x");
}

TEST_F(ProcessName, InTheArgumentsFitsNameOfAnyLength) {
    for (const char* name : {"", "a", "ab"}) {
        ProgramName program(name);
        runner::OpenRunner runner;
        runner.SetArgs(1, program.Vector());
        runner.d->SetArgv0("long name");
        EXPECT_EQ(program.Shown(), std::string("l").substr(0, strlen(name) == 2 ? 1 : 0));
    }
}

TEST_F(ProcessName, LeavesTheArgumentsAloneUntilTheyAreLent) {
    ProgramName program("program");
    Runner().SetArgs(0, program.Vector());
    Runner().SetArgs(-1, program.Vector());
    EXPECT_EQ(Name("A.B", 1, "list"), 1);
    EXPECT_EQ(program.Shown(), "program");
    EXPECT_EQ(Runner().d->argv0, nullptr);
}

TEST_F(ProcessName, BlanksTheArgumentWhenItIsLent) {
    ProgramName program("program");
    Runner().SetArgs(1, program.Vector());
    EXPECT_TRUE(program.IsBlank());
    EXPECT_EQ(Runner().d->argv0Len, 7u);
    EXPECT_EQ(Runner().d->argv0, program.Vector()[0]);
}

TEST_F(ProcessName, OfAnEntryProgramIsShortened) {
    const std::pair<const char*, const char*> names[] = {{"web_entry.cgi", "entry.cgi"},
                                                         {"a_entry.cgi.b", "entry.cgi"},
                                                         {"entry.cgi", "entry.cgi"},
                                                         {"other.cgi", "other.cgi"},
                                                         {"_entry.cg", "_entry.cg"}};
    for (const auto& [start, shown] : names) {
        ProgramName program("program");
        TALO::APIRunnerPrivate d(nullptr);
        d.GetOrigProcName() = d.GetProcName() = start;
        d.SetArgs(0, program.Vector());
        EXPECT_EQ(d.GetProcName(), start) << "no arguments, no change";
        d.SetArgs(1, program.Vector());
        EXPECT_EQ(d.GetProcName(), shown);
        EXPECT_EQ(d.GetOrigProcName(), start);
    }
}

TEST_F(ProcessName, HoldsNoControlCharacters) {
    runner::InChild([this] {
        ProgramName program("a program with much room in its name");
        Runner().d->GetProcName() = "p";
        Runner().SetArgs(1, program.Vector());
        EXPECT_EQ(Name("A\nB\x1b[31m", 1, "l\ris\x7ft"), 1);
        EXPECT_EQ(LogIdentity(), "p_A?B?[31m[1].l?is?t");
        EXPECT_EQ(program.Shown(), "p_A?B?[31m[1].l?is?t");
        EXPECT_EQ(probe::TaskName(), "A?B?[31m[1].l?i");
        EXPECT_EQ(Name(std::string("A\0B", 3), 1, "list"), 1);
        EXPECT_EQ(LogIdentity(), "p_A[1].list");
        EXPECT_EQ(Name("%s%n", 1, "%d"), 1);
        EXPECT_EQ(LogIdentity(), "p_%s%n[1].%d");
    });
}

TEST_F(ProcessName, ThatTheKernelRefusesIs118) {
    runner::InChild([this] {
        (void)Runner();
        probe::RefuseSystemCall(SYS_prctl, PR_SET_NAME, EPERM);
        EXPECT_EQ(Name("A.B", 1, "list"), 0);
        EXPECT_EQ(response->GetBody(), Error(118));
        EXPECT_TRUE(Logged("Set process name fail[Operation not permitted]"));
        EXPECT_EQ(log.Lines().back().priority, LOG_ERR);
    });
}

TEST_F(ProcessName, ThatTheKernelRefusesStopsTheRequest) {
    Install("Test.Basic");
    runner::InChild([this] {
        probe::RefuseSystemCall(SYS_prctl, PR_SET_NAME, EPERM);
        EXPECT_EQ(Call("Test.Basic", 1, "ok"), Error(118));
    });
}

TEST_F(ProcessName, GoesBackToTheStartNameInTheEnd) {
    runner::InChild([this] {
        ProgramName program("a program with much room in its name");
        {
            runner::OpenRunner runner;
            runner.d->GetOrigProcName() = "the-name-at-the-start";
            runner.d->GetProcName() = "p";
            runner.SetArgs(1, program.Vector());
            TALO::APIRequest named(Post("A.B", 1, "list"));
            TALO::APIResponse answer(&named);
            ASSERT_EQ(runner.SetProcessName(&named, &answer), 1);
            probe::LogIdentities().clear();
        }
        EXPECT_EQ(program.Shown(), "the-name-at-the-start");
        EXPECT_EQ(probe::TaskName(), "the-name-at-the");
        ASSERT_EQ(probe::LogIdentities().size(), 1u);
        EXPECT_EQ(LogIdentity(), "the-name-at-the-start");
        EXPECT_EQ(probe::LogIdentities()[0].options, LOG_PID | LOG_CONS);
        EXPECT_EQ(probe::LogIdentities()[0].facility, 0);
        EXPECT_TRUE(probe::LogIdentities()[0].closedBefore);
    });
}

// A process with many requests: cut names must not be cut again.
TEST_F(ProcessName, IsTheSameForEveryRequestOfAProcess) {
    runner::InChild([] {
        ProgramName program("/lib/prog");
        for (int round = 0; round < 12; ++round) {
            runner::OpenRunner runner;
            if (round == 0) {
                runner.d->GetOrigProcName() = "a-longer-name";
            }
            runner.SetArgs(1, program.Vector());
            EXPECT_TRUE(program.IsBlank());
            EXPECT_EQ(runner.d->argv0Len, 9u);
            TALO::APIRequest named(Post("A.B", 1, "list"));
            TALO::APIResponse answer(&named);
            ASSERT_EQ(runner.SetProcessName(&named, &answer), 1);
            EXPECT_EQ(program.Shown().size(), 8u);
            runner.d->GetOrigProcName() = "a-longer-name";
        }
        EXPECT_EQ(program.Shown(), "a-longer");
    });
}

TEST_F(ProcessName, AtTheStartIsRememberedByTheNextRunner) {
    runner::InChild([] {
        std::string first;
        for (int round = 0; round < 4; ++round) {
            runner::OpenRunner runner;
            first = round == 0 ? runner.d->GetOrigProcName() : first;
            EXPECT_EQ(runner.d->GetOrigProcName(), first);
            EXPECT_EQ(runner.d->GetProcName(), first);
            runner.SetArgs(probe::ArgumentCount(), probe::Arguments());
            runner.d->SetArgv0("unrelated");
        }
    });
}

TEST_F(ProcessName, IsSeenByTheMethod) {
    Install("Test.Basic");
    runner::InChild([this] {
        Runner().d->GetProcName() = "p";
        Runner().SetArgs(probe::ArgumentCount(), probe::Arguments());
        (void)Runner().Run(Post("Test.Basic", 1, "process"));
        const Json::Value data = Runner().response->GetBody()["data"];
        EXPECT_EQ(data["task"], Json::Value("Test.Basic[1].p"));
        // As much of it as the program's own name was long.
        const std::string full = "p_Test.Basic[1].process";
        EXPECT_EQ(data["argument"], Json::Value(full.substr(0, Runner().d->argv0Len - 1)));
    });
}

}  // namespace
