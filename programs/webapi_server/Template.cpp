#include "programs/webapi_server/Template.h"

#include <dlfcn.h>
#include <errno.h>
#include <fcntl.h>
#include <link.h>
#include <poll.h>
#include <stdlib.h>
#include <sys/signalfd.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

#include <algorithm>
#include <string>
#include <vector>

#include "platform/Paths.h"
#include "programs/webapi_server/Changes.h"
#include "programs/webapi_server/Clock.h"
#include "programs/webapi_server/Message.h"
#include "programs/webapi_server/Orphans.h"
#include "programs/webapi_server/Worker.h"
#include "webapi/APIRunner.h"

namespace {

constexpr int kLookMilliseconds = 1000;
// A file that was written just before cannot be kept in memory at first.
constexpr int kSettleMilliseconds = 2500;

// A library that is named without a folder is where the loader found it.
std::string PlaceOf(void* handle, const std::string& path) {
    if (handle == nullptr || path.find('/') != std::string::npos) {
        return path;
    }
    const struct link_map* map = nullptr;
    return dlinfo(handle, RTLD_DI_LINKMAP, &map) == 0 ? map->l_name : path;
}

void LoadLibrary(const std::string& path, Changes* changes) {
    if (path.find('/') != std::string::npos) {
        changes->AddLibrary(path);
    }
    // Bound at once, so that no worker has to do it. It stays open for ever.
    void* const handle = dlopen(path.c_str(), RTLD_NOW);
    if (handle == nullptr) {
        syslog(LOG_ERR, "cannot load %s: %s", path.c_str(), dlerror());
    }
    changes->AddLibrary(PlaceOf(handle, path));
}

Json::Value ReadDescriptions() {
    TALO::APIRunner runner;
    Json::Value descriptions(Json::objectValue);
    (void)runner.InitLibDesc(descriptions);
    return descriptions;
}

void Load(bool loadsLibraries, Changes* changes) {
    const Json::Value descriptions = ReadDescriptions();
    for (const Json::Value& description : descriptions) {
        const Json::Value& library = description["lib"];
        if (!library.isString() || library.asString().empty()) {
            continue;
        }
        if (loadsLibraries) {
            LoadLibrary(library.asString(), changes);
        } else {
            changes->AddLibrary(library.asString());
        }
    }
}

bool Tell(const TemplateReport& report, int descriptor = -1) {
    return SendMessage(kControlSocket, &report, sizeof report, descriptor, 0);
}

// Where the master went without reading everything, the system tells of that before
// it hands out the last order.
ssize_t ReceiveOrder(StartOrder* order, int* workerControl) {
    ssize_t got = -1;
    do {
        got = ReceiveMessage(kControlSocket, order, sizeof *order, workerControl, 0);
    } while (got < 0 && errno == ECONNRESET);
    return got;
}

struct StartedWorker {
    pid_t pid = 0;
    int slot = -1;
    unsigned serial = 0;
};

class Nursery {
  public:
    explicit Nursery(const TemplateTask& task)
        : task_(task), started_(static_cast<size_t>(task.slots->Count())) {}

    // In the worker this does not return.
    bool Start(const StartOrder& order, int workerControl);

    void ReportEnded();

  private:
    [[noreturn]] void BecomeWorker(const StartOrder& order, int control);

    const TemplateTask& task_;
    std::vector<StartedWorker> started_;
};

bool Nursery::Start(const StartOrder& order, int workerControl) {
    const pid_t pid = fork();
    if (pid == 0) {
        BecomeWorker(order, workerControl);
    }
    (void)close(workerControl);
    if (pid < 0) {
        return Tell({Report::kFailed, order.slot, order.serial, 0, errno});
    }
    for (StartedWorker& free : started_) {
        if (free.pid == 0) {
            free = {pid, order.slot, order.serial};
            break;
        }
    }
    const int process = static_cast<int>(syscall(SYS_pidfd_open, pid, 0));
    const bool told = Tell({Report::kStarted, order.slot, order.serial, pid, 0}, process);
    if (process >= 0) {
        (void)close(process);
    }
    return told;
}

void Nursery::BecomeWorker(const StartOrder& order, int control) {
    // What it starts and does not detach can be ended with it.
    (void)setpgid(0, 0);
    KeepOnly({control, kListenerSocket});
    const TemplateTask task = task_;
    task.slots->KeepOnly(order.slot);
    (void)setrlimit(RLIMIT_NOFILE, &task.original->files);
    (void)sigprocmask(SIG_SETMASK, &task.original->mask, nullptr);
    Slot* const slot = task.slots->At(order.slot);
    slot->pid = getpid();
    // Not _exit: the end of a process is part of what a library may rely on.
    exit(RunWorker({kControlSocket, kListenerSocket, slot}, *task.settings));
}

void Nursery::ReportEnded() {
    int status = 0;
    for (pid_t pid = 0; (pid = waitpid(-1, &status, WNOHANG)) > 0;) {
        for (StartedWorker& ended : started_) {
            if (ended.pid == pid) {
                (void)Tell({Report::kEnded, ended.slot, ended.serial, pid, status});
                ended = StartedWorker();
                break;
            }
        }
    }
}

int OpenChildSignals() {
    sigset_t signals;
    (void)sigemptyset(&signals);
    (void)sigaddset(&signals, SIGCHLD);
    (void)sigprocmask(SIG_BLOCK, &signals, nullptr);
    return signalfd(-1, &signals, SFD_CLOEXEC | SFD_NONBLOCK);
}

// Nobody accepts any more: who waits, or comes while a worker that has a request
// keeps the socket open, must learn that.
void CloseListener(bool ends) {
    if (ends) {
        (void)shutdown(kListenerSocket, SHUT_RDWR);
        for (int late = -1; (late = accept(kListenerSocket, nullptr, nullptr)) >= 0;) {
            (void)close(late);
        }
    }
    (void)close(kListenerSocket);
}

void Forget(int signals) {
    struct signalfd_siginfo read_ = {};
    while (read(signals, &read_, sizeof read_) > 0) {
    }
}

}  // namespace

void RunTemplate(const TemplateTask& task) {
    // A terminal's signals are for the master.
    (void)setsid();
    KeepOnly(task.sockets);
    if (chdir(TALO_WEBAPI_DIR) != 0) {
        syslog(LOG_ERR, "%s: %m", TALO_WEBAPI_DIR);
    }
    Changes changes(TALO_WEBAPI_DIR);
    Load(task.loadsLibraries, &changes);
    const int signals = OpenChildSignals();
    Nursery nursery(task);
    if (!Tell({Report::kReady, -1, 0, getpid(), 0})) {
        _exit(EXIT_FAILURE);
    }
    long long settled = MillisecondsNow() + kSettleMilliseconds;
    for (long long nextLook = MillisecondsNow() + kLookMilliseconds;;) {
        struct pollfd waits[] = {{kControlSocket, POLLIN, 0}, {signals, POLLIN, 0}};
        const long long left = nextLook - MillisecondsNow();
        (void)poll(waits, 2, static_cast<int>(std::max(left, 0LL)));
        if (MillisecondsNow() >= nextLook) {
            nextLook = MillisecondsNow() + kLookMilliseconds;
            if (changes.Look()) {
                (void)Tell({Report::kChanged, -1, 0, getpid(), 0});
            }
            if (settled != 0 && MillisecondsNow() >= settled) {
                settled = 0;
                (void)ReadDescriptions();
            }
        }
        if (waits[1].revents != 0) {
            Forget(signals);
            nursery.ReportEnded();
        }
        if (waits[0].revents == 0) {
            continue;
        }
        StartOrder order = {};
        int workerControl = -1;
        const ssize_t got = ReceiveOrder(&order, &workerControl);
        if (got == sizeof order && workerControl < 0) {
            _exit(EXIT_SUCCESS);
        }
        if (got != sizeof order || !nursery.Start(order, workerControl)) {
            // The master is gone: whom it replaces it tells to end.
            CloseListener(task.endsListener);
            WatchOrphans(*task.slots);
            _exit(EXIT_SUCCESS);
        }
    }
}
