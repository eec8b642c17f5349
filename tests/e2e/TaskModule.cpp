// Test.Task: "start" starts a background task with the prefix, the group and the
// auto_remove that it is given. Its work takes [seconds], ends earlier when the
// file [finish] is there, and logs [lines] lines before it begins. [report] is
// "first" (at once, and again at the end), "never", or "throw" (it throws instead).
// With [graceful] it answers SIGTERM with a result of its own. The starting request
// may ask for a [restart] of the web server, or start when there may be no more
// processes ([full]).
#include <linux/capability.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <chrono>
#include <memory>
#include <stdexcept>
#include <string>

#include "webapi/APIExport.h"
#include "webapi/APIPolling.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"
#include "webapi/APITaskProgress.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

typedef std::chrono::steady_clock Clock;

constexpr useconds_t kPause = 10 * 1000;
constexpr int kNotStarted = 400;

volatile sig_atomic_t told;

Json::Value State(const char* state) {
    Json::Value data(Json::objectValue);
    data["state"] = state;
    data["pid"] = getpid();
    return data;
}

bool IsThere(const std::string& path) {
    struct stat facts = {};
    return !path.empty() && stat(path.c_str(), &facts) == 0;
}

void Work(APIRequest* request, APIResponse* response, void*) {
    const std::string report = request->GetParam("report", "first").asString();
    const std::string finish = request->GetParam("finish", "").asString();
    const auto end = Clock::now() + std::chrono::milliseconds(static_cast<long>(
                                        request->GetParam("seconds", 30).asDouble() * 1000));
    if (request->GetParam("graceful", false).asBool()) {
        (void)signal(SIGTERM, [](int) { told = 1; });
    }
    TALO::APITaskProgress progress(request);
    const int lines = request->GetParam("lines", 0).asInt();
    for (int line = 0; line < lines; ++line) {
        progress.AddLog("line " + std::to_string(line));
        progress.SetPercent(100.0 * (line + 1) / lines);
        progress.SetText("logging");
    }
    if (report == "throw") {
        throw std::runtime_error("thrown by the work");
    }
    if (report == "first") {
        response->SetSuccess(State("running"));
    }
    while (Clock::now() < end && told == 0 && !IsThere(finish)) {
        (void)usleep(kPause);
    }
    if (report == "first") {
        response->SetSuccess(State(told != 0 ? "stopped" : "done"));
    }
}

// As long as it lives, the process may make no other. The limit counts neither
// for the root user nor for who may exceed limits: a root process is another
// user's meanwhile, and gives that right up.
class NoRoomForProcesses {
  public:
    NoRoomForProcesses() {
        if (isRoot_) {
            (void)setreuid(65534, 0);
            (void)syscall(SYS_capget, &header_, rights_);
            struct __user_cap_data_struct fewer[2] = {rights_[0], rights_[1]};
            fewer[0].effective &= ~(1U << CAP_SYS_RESOURCE | 1U << CAP_SYS_ADMIN);
            (void)syscall(SYS_capset, &header_, fewer);
        }
        (void)getrlimit(RLIMIT_NPROC, &before_);
        const struct rlimit none = {0, before_.rlim_max};
        (void)setrlimit(RLIMIT_NPROC, &none);
    }
    ~NoRoomForProcesses() {
        (void)setrlimit(RLIMIT_NPROC, &before_);
        if (isRoot_) {
            (void)syscall(SYS_capset, &header_, rights_);
            (void)setreuid(0, 0);
            (void)prctl(PR_SET_DUMPABLE, 1);
        }
    }
    NoRoomForProcesses(const NoRoomForProcesses&) = delete;
    NoRoomForProcesses& operator=(const NoRoomForProcesses&) = delete;

  private:
    const bool isRoot_ = geteuid() == 0;
    struct __user_cap_header_struct header_ = {_LINUX_CAPABILITY_VERSION_3, 0};
    struct __user_cap_data_struct rights_[2] = {};
    struct rlimit before_ = {};
};

void Start(APIRequest* request, APIResponse* response) {
    TALO::APIPolling polling(request);
    const bool set = polling.SetPrefixAttr(request->GetParam("prefix", "").asString()) &&
                     polling.SetRemoveAttr(request->GetParam("auto_remove", true).asBool()) &&
                     polling.SetGroupAttr(request->GetParam("group", "").asString());
    if (!set) {
        response->SetError(kNotStarted, polling.GetError());
        return;
    }
    std::unique_ptr<NoRoomForProcesses> noRoom;
    if (request->HasParam("full")) {
        noRoom = std::make_unique<NoRoomForProcesses>();
    }
    (void)polling.Start(response, Work, nullptr);
    if (request->HasParam("restart")) {
        response->SetHttpdRestart(true);
    }
}

TALO::_tag_API_TABLE table[] = {
    {"Test.Task", 1, "start", Start},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
