#include <dlfcn.h>
#include <glob.h>
#include <sys/mman.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstring>
#include <limits>
#include <new>

#include "platform/Paths.h"
#include "programs/webapi_server/Message.h"
#include "programs/webapi_server/Worker.h"

// one-worker SOCKET: one worker without limits behind a UNIX socket, which serves
// the installed API libraries as long as they leave nothing behind. Prints the
// worker's process id, and ends when the worker does, with its exit status.

namespace {

int Listen(const char* path) {
    const int listener = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    struct sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    (void)std::snprintf(address.sun_path, sizeof address.sun_path, "%s", path);
    const auto* any = reinterpret_cast<const struct sockaddr*>(&address);
    return bind(listener, any, sizeof address) == 0 && listen(listener, 64) == 0 ? listener : -1;
}

void OpenLibraries() {
    glob_t files = {};
    (void)glob(TALO_WEBAPI_DIR "lib/*.so", 0, nullptr, &files);
    for (size_t index = 0; index < files.gl_pathc; ++index) {
        (void)dlopen(files.gl_pathv[index], RTLD_NOW);
    }
    globfree(&files);
}

Settings Unlimited() {
    Settings settings;
    settings.workerRequests = std::numeric_limits<int>::max();
    settings.workerGrowthKiB = std::numeric_limits<int>::max();
    settings.workerSeconds = std::numeric_limits<int>::max();
    return settings;
}

}  // namespace

int main(int argc, char** argv) {
    const int listener = argc == 2 ? Listen(argv[1]) : -1;
    int control[2];
    if (listener < 0 || chdir(TALO_WEBAPI_DIR) != 0 ||
        socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, control) != 0) {
        std::perror("one-worker");
        return 2;
    }
    OpenLibraries();
    const Settings settings = Unlimited();
    void* memory =
        mmap(nullptr, sizeof(Slot), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    Slot* slot = new (memory) Slot();
    const pid_t worker = fork();
    if (worker == 0) {
        (void)close(listener);
        (void)close(control[0]);
        _exit(RunWorker({control[1], -1, slot}, settings));
    }
    (void)close(control[1]);
    (void)std::printf("%d\n", static_cast<int>(worker));
    (void)std::fflush(stdout);
    char idle = 0;
    while (recv(control[0], &idle, 1, 0) == 1) {
        const int connection = accept4(listener, nullptr, nullptr, SOCK_CLOEXEC);
        const char order = kServe;
        if (!SendMessage(control[0], &order, 1, connection, 0)) {
            break;
        }
        (void)close(connection);
    }
    int status = 0;
    (void)waitpid(worker, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}
