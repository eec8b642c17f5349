#include "programs/webapi_server/Orphans.h"

#include <signal.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "programs/webapi_server/Clock.h"
#include "programs/webapi_server/Deadline.h"

namespace {

constexpr useconds_t kPause = 200 * 1000;

std::string ProgramOf(const std::string& process) {
    char path[4096];
    const ssize_t size = readlink(("/proc/" + process + "/exe").c_str(), path, sizeof path);
    return size > 0 ? std::string(path, static_cast<size_t>(size)) : std::string();
}

// The id in a slot may be of a process that is gone, and be another's by now.
bool IsWorker(pid_t process, const std::string& program) {
    return process > 1 && process != getpid() && ProgramOf(std::to_string(process)) == program;
}

// With what it started.
void End(pid_t worker, const std::string& program) {
    const int descriptor = static_cast<int>(syscall(SYS_pidfd_open, worker, 0));
    if (descriptor < 0) {
        return;
    }
    if (IsWorker(worker, program)) {
        if (getpgid(worker) == worker) {
            (void)kill(-worker, SIGKILL);
        }
        (void)syscall(SYS_pidfd_send_signal, descriptor, SIGKILL, nullptr, 0);
    }
    (void)close(descriptor);
}

}  // namespace

void WatchOrphans(const SlotTable& slots) {
    const std::string program = ProgramOf("self");
    std::vector<Watch> watches(static_cast<size_t>(slots.Count()));
    for (bool areThere = !program.empty(); areThere;) {
        areThere = false;
        while (waitpid(-1, nullptr, WNOHANG) > 0) {
        }
        for (int index = 0; index < slots.Count(); ++index) {
            const Slot& slot = *slots.At(index);
            const pid_t worker = slot.pid;
            if (!IsWorker(worker, program)) {
                continue;
            }
            areThere = true;
            if (IsPastOrphansDeadline(slot, worker, &watches[static_cast<size_t>(index)],
                                      MillisecondsNow())) {
                syslog(LOG_ERR, "worker %d takes longer than it may, and is ended",
                       static_cast<int>(worker));
                End(worker, program);
            }
        }
        (void)usleep(areThere ? kPause : 0);
    }
}
