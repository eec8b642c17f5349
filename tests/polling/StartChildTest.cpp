#include <fcntl.h>
#include <signal.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <stdexcept>

#include "platform/Task.h"
#include "src/base/Log.h"
#include "tests/polling/PollingFixture.h"
#include "tests/support/Child.h"
#include "tests/support/TempFolder.h"

using polling::Parse;
using TALO::APIRequest;
using TALO::APIResponse;

namespace {

class TaskChild : public polling::Fixture {
  protected:
    // Runs the work to its end and answers what it reported.
    Json::Value ReportOf(const Work& work) {
        EXPECT_TRUE(Start(work));
        statuses = AwaitChildren();
        return Reported(StartedId());
    }

    Json::Value Properties() const {
        return Record(StartedId())["properties"];
    }

    void EndedProperly() {
        EXPECT_EQ(statuses, std::vector<int>{0});
        EXPECT_EQ(Record(StartedId())["finished"], true);
    }

    std::vector<int> statuses;
};

TEST_F(TaskChild, IsAProcessOfItsOwnWithASessionOfItsOwn) {
    const Json::Value facts = ReportOf([](APIRequest*, APIResponse* taskResponse) {
        Json::Value told(Json::objectValue);
        told["pid"] = getpid();
        told["parent"] = getppid();
        told["session"] = getsid(0);
        told["group"] = getpgrp();
        taskResponse->SetSuccess(told);
    });
    EXPECT_NE(facts["pid"], getpid());
    EXPECT_EQ(facts["parent"], getpid());
    EXPECT_EQ(facts["session"], facts["pid"]);
    EXPECT_EQ(facts["group"], facts["pid"]);
    EXPECT_EQ(Record(StartedId())["pid"], facts["pid"]);
    EndedProperly();
}

TEST_F(TaskChild, FindsItsTaskInTheEnvironmentOfItsRequest) {
    request.InitEnv(Parse(R"({"REQUEST_METHOD": "POST", "REMOTE_ADDR": "192.0.2.1"})"));
    polling.SetGroupAttr("everyone");
    const Json::Value facts = ReportOf([](APIRequest* taskRequest, APIResponse* taskResponse) {
        Json::Value told(Json::objectValue);
        for (const char* name : {"task_id", "task_user", "full_task_id", "REMOTE_ADDR"}) {
            told[name] = taskRequest->GetEnv(name, "absent");
        }
        told["is_task"] = taskRequest->IsPollingTask();
        told["polling_id"] = taskRequest->GetPollingTaskId();
        taskResponse->SetSuccess(told);
    });
    const std::string full = StartedId();
    EXPECT_EQ(facts["task_user"], "@users");
    EXPECT_EQ(facts["task_id"], full.substr(7));
    EXPECT_EQ(facts["full_task_id"], full);
    EXPECT_EQ(facts["polling_id"], full);
    EXPECT_EQ(facts["is_task"], true);
    EXPECT_EQ(facts["REMOTE_ADDR"], "192.0.2.1");
    EXPECT_FALSE(request.IsPollingTask());
    EndedProperly();
}

TEST_F(TaskChild, CallsTheWorkWithTheArguments) {
    struct Seen {
        APIRequest* request;
        APIResponse* response;
        int number;
    } argument = {&request, &response, 7};
    ASSERT_TRUE(polling.Start(
        &response,
        [](APIRequest* taskRequest, APIResponse* taskResponse, void* given) {
            const Seen* seen = static_cast<Seen*>(given);
            taskResponse->SetSuccess(seen->request == taskRequest &&
                                     seen->response == taskResponse && seen->number == 7);
        },
        &argument));
    (void)AwaitChildren();
    EXPECT_EQ(Reported(StartedId()), true);
}

TEST_F(TaskChild, TakesANullArgumentForWhatItIs) {
    ASSERT_TRUE(polling.Start(
        &response,
        [](APIRequest*, APIResponse* taskResponse, void* given) {
            taskResponse->SetSuccess(given == nullptr);
        },
        nullptr));
    (void)AwaitChildren();
    EXPECT_EQ(Reported(StartedId()), true);
}

TEST_F(TaskChild, IsKnownToTheRecordWhenTheWorkBegins) {
    const Json::Value pid = ReportOf([](APIRequest* taskRequest, APIResponse* taskResponse) {
        const ORB::Task task(taskRequest->GetEnv("task_user", "").asCString(),
                             taskRequest->GetEnv("task_id", "").asCString());
        taskResponse->SetSuccess(task.getCreatePid() == getpid() && !task.isFinished());
    });
    EXPECT_EQ(pid, true);
    EndedProperly();
}

TEST_F(TaskChild, TakesItsStepsInOrder) {
    ASSERT_TRUE(Start(
        [](APIRequest*, APIResponse* taskResponse) { taskResponse->SetSuccess(Json::Value()); }));
    (void)AwaitChildren();
    std::vector<std::string> steps;
    for (const fake::TaskCall& call : fake::TaskCalls()) {
        if (call.pid != getpid()) {
            steps.push_back(call.operation + " " + call.detail);
        }
    }
    const std::string pid = Record(StartedId())["pid"].asString();
    EXPECT_EQ(steps, (std::vector<std::string>{
                         "Task.setCreatePid " + pid, "Task.Task ann " + StartedId().substr(4),
                         "Task.beginUpdate ", "Task.setProperty body", "Task.setProperty task_run",
                         "Task.endUpdate ", "Task.reload ", "Task.getBoolProperty auto_remove",
                         "Task.finish true"}));
}

TEST_F(TaskChild, FinishesAsTheRecordSaysAtTheEnd) {
    for (const bool remove : {true, false}) {
        polling.SetRemoveAttr(!remove);
        (void)ReportOf([remove](APIRequest* taskRequest, APIResponse* taskResponse) {
            ORB::Task task(taskRequest->GetEnv("task_user", "").asCString(),
                           taskRequest->GetEnv("task_id", "").asCString());
            task.beginUpdate();
            (void)task.setProperty("auto_remove", remove);
            (void)task.endUpdate();
            taskResponse->SetSuccess(Json::Value());
        });
        EXPECT_EQ(LastDetail("Task.finish"), remove ? "true" : "false");
        EndedProperly();
    }
}

TEST_F(TaskChild, KeepsARecordWhoseAutoRemoveCannotBeRead) {
    (void)ReportOf([](APIRequest* taskRequest, APIResponse* taskResponse) {
        ORB::Task task(taskRequest->GetEnv("task_user", "").asCString(),
                       taskRequest->GetEnv("task_id", "").asCString());
        task.beginUpdate();
        (void)task.setProperty("auto_remove", Json::Value());
        (void)task.endUpdate();
        taskResponse->SetSuccess(Json::Value());
    });
    EXPECT_EQ(LastDetail("Task.finish"), "false");
    EndedProperly();
}

TEST_F(TaskChild, ReportsFailuresAsAMethodDoes) {
    (void)ReportOf([](APIRequest*, APIResponse* taskResponse) {
        taskResponse->SetSuccess(1);
        taskResponse->SetError(400, "folder");
    });
    EXPECT_EQ(Properties()["body"],
              Parse(R"({"success": false, "error": {"code": 400, "errors": "folder"}})"));
    EXPECT_EQ(response.GetBody()["success"], true);
    EXPECT_EQ(response.GetError(), 0);
    EndedProperly();
}

TEST_F(TaskChild, EndsWithoutAResultWhenTheWorkReportsNone) {
    fake::Tasks().waitsPassAtOnce = true;
    (void)ReportOf([](APIRequest*, APIResponse*) {});
    EXPECT_FALSE(Properties().isMember("body"));
    EXPECT_FALSE(Properties().isMember("task_run"));
    EndedProperly();
}

TEST_F(TaskChild, Records117ForWorkThatThrowsBeforeItsFirstReport) {
    const Work works[] = {
        [](APIRequest*, APIResponse*) { throw std::runtime_error("no disk"); },
        [](APIRequest*, APIResponse*) { throw 42; },
    };
    for (const Work& work : works) {
        EXPECT_TRUE(Start(work));
        statuses = AwaitChildren();
        EXPECT_EQ(Properties()["body"], Parse(R"({"success": false, "error": {"code": 117}})"));
        EXPECT_EQ(Properties()["task_run"], true);
        EXPECT_EQ(StartedId().substr(0, 4), "ann/");
        EndedProperly();
    }
}

TEST_F(TaskChild, KeepsTheLastReportOfWorkThatThrowsAfterwards) {
    (void)ReportOf([](APIRequest*, APIResponse* taskResponse) {
        taskResponse->SetSuccess("half");
        throw std::runtime_error("no disk");
    });
    EXPECT_EQ(Properties()["body"], Parse(R"({"success": true, "data": "half"})"));
    EndedProperly();
}

TEST_F(TaskChild, LogsWhatTheWorkThrew) {
    const support::TempFolder folder;
    static std::string place;
    place = folder.Path("log");
    (void)ReportOf([](APIRequest*, APIResponse*) {
        (void)TALO::SetLogSink([](int, const char* line) { std::ofstream(place) << line; });
        throw std::runtime_error("no disk");
    });
    std::string line;
    std::getline(std::ifstream(place), line);
    EXPECT_EQ(line.find("APIPolling.cpp:"), 0u) << line;
    EXPECT_NE(line.find("no disk"), std::string::npos) << line;
    EndedProperly();
}

TEST_F(TaskChild, CallsEveryWorkJustOnceAndOnlyThere) {
    struct Counts {
        int before;
        int work;
        int after;
    };
    void* room =
        mmap(nullptr, sizeof(Counts), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    ASSERT_NE(room, MAP_FAILED);
    Counts* counts = static_cast<Counts*>(room);
    *counts = {};
    ++counts->before;
    EXPECT_TRUE(Start([counts](APIRequest*, APIResponse* taskResponse) {
        ++counts->work;
        taskResponse->SetSuccess(Json::Value());
        throw std::runtime_error("unwinds");
    }));
    ++counts->after;
    (void)AwaitChildren();
    EXPECT_EQ(counts->before, 1);
    EXPECT_EQ(counts->work, 1);
    EXPECT_EQ(counts->after, 1);
    (void)munmap(room, sizeof(Counts));
}

// What the parent holds is not the child's to clean up.
struct Tenant {
    std::string path;
    ~Tenant() {
        (void)unlink(path.c_str());
    }
};

TEST_F(TaskChild, RunsNoCleanUpOfTheParents) {
    const support::TempFolder folder;
    const std::string upload = folder.Write("upload", "content");
    static std::string atExit;
    atExit = folder.Path("at-exit");
    const support::ChildResult result = support::InChild([&] {
        (void)atexit([] { (void)close(open(atExit.c_str(), O_CREAT | O_WRONLY, 0600)); });
        Tenant* tenant = new Tenant{upload};
        struct Scoped {
            Tenant* tenant;
            ~Scoped() {
                delete tenant;
            }
        } scoped = {tenant};
        (void)printf("written by the parent, ");
        bool started = Start([](APIRequest*, APIResponse* taskResponse) {
            (void)printf("by the child, ");
            taskResponse->SetSuccess(1);
        });
        (void)AwaitChildren();
        struct stat facts = {};
        const bool kept = stat(upload.c_str(), &facts) == 0 && stat(atExit.c_str(), &facts) != 0;
        (void)printf("once");
        return started && kept ? 7 : 8;
    });
    EXPECT_EQ(result.status, 7);
    EXPECT_EQ(result.output, "written by the parent, once");
}

// InChild reads until nobody holds its output any more.
TEST_F(TaskChild, HoldsNothingOfTheParentsOutput) {
    const support::ChildResult result = support::InChild([&] {
        const bool started = Start([](APIRequest*, APIResponse* taskResponse) {
            taskResponse->SetSuccess(getpid());
            for (;;) {
                (void)pause();
            }
        });
        (void)printf("%s", Reported(StartedId()).asString().c_str());
        return started ? 0 : 1;
    });
    EXPECT_EQ(result.status, 0);
    const int child = std::atoi(result.output.c_str());
    ASSERT_GT(child, 0);
    EXPECT_EQ(kill(child, SIGKILL), 0);
}

TEST_F(TaskChild, GoesOnWhenItsParentHasGone) {
    int gate[2];
    ASSERT_EQ(pipe(gate), 0);
    const support::ChildResult result = support::InChild([&] {
        const bool started = Start([&gate](APIRequest*, APIResponse* taskResponse) {
            (void)close(gate[1]);
            taskResponse->SetSuccess("first");
            char byte = 0;
            (void)!read(gate[0], &byte, 1);
            taskResponse->SetSuccess("last");
        });
        (void)printf("%s", StartedId().c_str());
        return started ? 0 : 1;
    });
    const std::string id = result.output;
    EXPECT_EQ(Reported(id), "first");
    (void)close(gate[0]);
    (void)close(gate[1]);
    for (int tries = 0; tries < 2000 && !Record(id)["finished"].asBool(); ++tries) {
        (void)usleep(5000);
    }
    EXPECT_EQ(Reported(id), "last");
    EXPECT_EQ(Record(id)["finished"], true);
}

}  // namespace
