#include <fcntl.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/prctl.h>
#include <syslog.h>
#include <unistd.h>

#include <algorithm>
#include <iostream>

#include "programs/webapi_server/Arguments.h"
#include "programs/webapi_server/Loader.h"
#include "programs/webapi_server/Master.h"

namespace {

enum ExitStatus { kSuccess = 0, kCannotWork = 1, kWrongUsage = 2 };

constexpr int kHandedOver = 3;  // where systemd puts the socket
constexpr int kBacklog = 4096;

int WrongUsage(const std::string& problem) {
    std::cerr << "webapi-server: " << problem << "\n\n" << kUsage;
    return kWrongUsage;
}

// Input and output of a worker are its request's.
void TidyStandardDescriptors() {
    const int nowhere = open("/dev/null", O_RDWR | O_CLOEXEC);
    if (nowhere < 0) {
        return;
    }
    (void)dup2(nowhere, STDIN_FILENO);
    (void)dup2(nowhere, STDOUT_FILENO);
    if (fcntl(STDERR_FILENO, F_GETFD) < 0) {
        (void)dup2(nowhere, STDERR_FILENO);
    }
    if (nowhere > STDERR_FILENO) {
        (void)close(nowhere);
    }
}

// Each worker costs two descriptors and a connection, and each place in the queue
// another connection.
void RaiseFileLimit(const Settings& settings, const struct rlimit& original) {
    const rlim_t wanted =
        static_cast<rlim_t>(settings.queue) + 6 * static_cast<rlim_t>(settings.maxWorkers) + 256;
    struct rlimit limit = original;
    limit.rlim_cur = std::max(limit.rlim_cur, std::min(wanted, limit.rlim_max));
    (void)setrlimit(RLIMIT_NOFILE, &limit);
}

int Serve(Listener& listener, const Settings& settings, const OriginalProcess& original) {
    RaiseFileLimit(settings, original.files);
    (void)signal(SIGPIPE, SIG_IGN);
    (void)signal(SIGCHLD, SIG_DFL);
    // Whose template went before them end as children of this process.
    (void)prctl(PR_SET_CHILD_SUBREAPER, 1);
    Master master(listener, settings, original);
    return master.Run() ? kSuccess : kCannotWork;
}

}  // namespace

int main(int argc, char** argv) {
    BeginWithLoaderSettings(argv);
    Arguments arguments;
    std::string problem;
    if (!ParseArguments(argc, argv, &arguments, &problem)) {
        return WrongUsage(problem);
    }
    if (arguments.help) {
        std::cout << kUsage;
        return kSuccess;
    }
    const HandedOver handedOver = ReadHandedOver(&problem);
    const std::string& path = arguments.settings.socket;
    if (path.empty() && handedOver == HandedOver::kNothing) {
        return WrongUsage("no socket: neither --socket nor one from systemd");
    }
    // Some who start programs leak theirs.
    const bool isAdopting = path.empty() && handedOver == HandedOver::kSocket;
    (void)close_range(isAdopting ? kHandedOver + 1 : kHandedOver, ~0U, 0);
    openlog("webapi-server", LOG_PID, LOG_DAEMON);
    OriginalProcess original = {};
    (void)getrlimit(RLIMIT_NOFILE, &original.files);
    // Whoever sees the socket may send a signal.
    HoldSignals(&original.mask);
    Listener listener;
    const bool listens = isAdopting ? listener.Adopt(kHandedOver, &problem)
                                    : !path.empty() && listener.Make(path, kBacklog, &problem);
    if (!listens) {
        std::cerr << "webapi-server: " << problem << "\n";
        syslog(LOG_ERR, "%s", problem.c_str());
        return kCannotWork;
    }
    TidyStandardDescriptors();
    return Serve(listener, arguments.settings, original);
}
