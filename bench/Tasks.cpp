#include <json/json.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <functional>
#include <memory>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "BenchLogin.h"
#include "BenchShare.h"
#include "Groups.h"
#include "Harness.h"
#include "Spawn.h"
#include "platform/Task.h"

namespace bench {

namespace {

constexpr int kStarts = 101;

// The store stays open in a process that has used it, and as long as anybody has
// it open, others are spared reading its log anew. A request seldom is: so all
// that is done to the records here is done by a process that ends.
bool Aside(const std::function<bool()>& work) {
    (void)std::fflush(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        _exit(work() ? 0 : 1);
    }
    int status = -1;
    return child > 0 && waitpid(child, &status, 0) == child && status == 0;
}

std::string Number(int number) {
    const std::string digits = std::to_string(number);
    return digits.size() < 4
               ? digits
               : digits.substr(0, digits.size() - 3) + "," + digits.substr(digits.size() - 3);
}

// All that the user has, also what a run has left that was broken off.
bool RemoveTasks(const std::string& user) {
    return Aside([&] {
        bool removed = true;
        for (const Json::Value& id : ORB::TaskMgr(user.c_str()).getAllTaskId(nullptr)) {
            removed = ORB::Task(user.c_str(), id.asCString()).remove() && removed;
        }
        return removed;
    });
}

// The records of a user at the beginning and at the end: none.
class NoTasks {
  public:
    explicit NoTasks(std::string user) : user_(std::move(user)) {
        Remove();
    }
    ~NoTasks() {
        Remove();
    }
    NoTasks(const NoTasks&) = delete;
    NoTasks& operator=(const NoTasks&) = delete;

  private:
    void Remove() const {
        if (!RemoveTasks(user_)) {
            std::fprintf(stderr, "not all tasks of %s could be removed\n", user_.c_str());
        }
    }

    const std::string user_;
};

std::string SizePrefix(int size) {
    return "of" + std::to_string(size) + "-";
}

bool MakeTasks(const std::string& user, int count) {
    return Aside([&] {
        for (int number = 0; number < count; ++number) {
            const std::string id = SizePrefix(count) + std::to_string(number);
            if (!ORB::Task(user.c_str(), id.c_str()).isValid()) {
                return false;
            }
        }
        return true;
    });
}

// The data of a reply, null unless it tells success.
Json::Value DataOf(const std::vector<std::string>& environment) {
    const std::string reply = ReplyOf(kEntry, environment);
    const size_t begin = std::min(reply.find('{'), reply.size());
    const std::unique_ptr<Json::CharReader> reader(Json::CharReaderBuilder().newCharReader());
    Json::Value body;
    std::string problem;
    if (!reader->parse(reply.data() + begin, reply.data() + reply.size(), &body, &problem) ||
        !body.isObject() || body["success"] != true) {
        std::fprintf(stderr, "not the reply that was expected: %s\n", reply.c_str());
        return Json::Value();
    }
    return body["data"];
}

class TaskBench {
  public:
    TaskBench(const Login& login, const Share& share) : login_(login), share_(share) {}

    void Run() const {
        const Json::Value started = DataOf(Start());
        if (!started["task_id"].isString()) {
            return;
        }
        const auto status =
            Of("TALO.Task&version=1&method=status&task_id=" + started["task_id"].asString());
        if (!AwaitFinish(status)) {
            std::fprintf(stderr, "the task does not finish\n");
            return;
        }
        CompareStatus(status);
        CompareStart();
        CompareList();
    }

  private:
    std::vector<std::string> Of(const std::string& call) const {
        return Get("api=" + call, login_.Id());
    }
    std::vector<std::string> Start() const {
        return Of("TALO.File.Checksum&version=1&method=start&path=" + share_.FilePath());
    }
    std::vector<std::string> List(const std::string& prefix) const {
        return Of("TALO.Task&version=1&method=list&prefix=" + prefix);
    }

    static bool AwaitFinish(const std::vector<std::string>& status) {
        for (int look = 0; look < 100; ++look) {
            const Json::Value document = DataOf(status);
            if (document["finish"] == true) {
                return document["success"] == true;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(50));
        }
        return false;
    }

    void CompareStatus(const std::vector<std::string>& status) const {
        const auto ping = Get("api=TALO.System&version=2&method=ping");
        const auto info = Of("TALO.System&version=2&method=info");
        Compare("The status of a task",
                {{"ping, no session", [&] { RunProcess(kEntry, ping); }},
                 {"info under a session", [&] { RunProcess(kEntry, info); }},
                 {"status of one task", [&] { RunProcess(kEntry, status); }}},
                101, 5);
    }

    // The task works on behind its reply: what that costs falls on the row after
    // it, which is there to keep it off the first.
    void CompareStart() const {
        const auto info = Of("TALO.System&version=2&method=info");
        const auto start = Start();
        Compare("The start of a task, from the request to the reply",
                {{"info under a session", [&] { RunProcess(kEntry, info); }},
                 {"start of a checksum", [&] { RunProcess(kEntry, start); }},
                 {"info while the task ends", [&] { RunProcess(kEntry, info); }}},
                kStarts, 1);
        // Beside the one whose status was asked for, and the one before the rounds.
        const Json::ArrayIndex tasks = DataOf(List("checksum-"))["user"].size();
        if (tasks != kStarts + 2) {
            std::fprintf(stderr, "%u tasks were started instead of %d\n", tasks, kStarts + 2);
        }
    }

    void CompareList() const {
        std::vector<Subject> subjects;
        for (const int size : {10, 100, 1000, 10000}) {
            const auto list = List(SizePrefix(size));
            if (!MakeTasks(login_.User(), size) ||
                DataOf(list)["user"].size() != static_cast<Json::ArrayIndex>(size)) {
                std::fprintf(stderr, "%d tasks could not be made\n", size);
                return;
            }
            subjects.push_back({Number(size) + " tasks", [list] { RunProcess(kEntry, list); }});
        }
        Compare("A list of tasks", subjects, 31, 3);
    }

    const Login& login_;
    const Share& share_;
};

}  // namespace

void Tasks() {
    const Login login;
    const Share share(login.User());
    if (!login.IsReady() || !share.IsReady()) {
        std::fprintf(stderr, "no session or no share could be made\n");
        return;
    }
    const NoTasks noTasks(login.User());
    TaskBench(login, share).Run();
}

}  // namespace bench
