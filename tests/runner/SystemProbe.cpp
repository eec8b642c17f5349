#include "tests/runner/SystemProbe.h"

#include <dlfcn.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <stddef.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <syslog.h>

#include <cstdlib>
#include <fstream>
#include <iterator>
#include <new>

namespace probe {

namespace {

bool closed = false;
int nothrowCountdown = 0;
int argumentCount = 0;
char** arguments = nullptr;

__attribute__((constructor)) void KeepArguments(int argc, char** argv) {
    argumentCount = argc;
    arguments = argv;
}

std::string Content(const char* path) {
    std::ifstream file(path);
    return std::string(std::istreambuf_iterator<char>(file), {});
}

template <typename Function>
Function* Real(const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

void Install(sock_filter* filter, size_t length) {
    const sock_fprog program = {static_cast<unsigned short>(length), filter};
    if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0 ||
        prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) != 0) {
        abort();
    }
}

}  // namespace

std::vector<Identity>& LogIdentities() {
    static std::vector<Identity> identities;
    return identities;
}

std::vector<int>& Priorities() {
    static std::vector<int> priorities;
    return priorities;
}

std::string TaskName() {
    const std::string name = Content("/proc/self/comm");
    return name.substr(0, name.find('\n'));
}

std::string CommandLine() {
    return Content("/proc/self/cmdline");
}

int ArgumentCount() {
    return argumentCount;
}

char** Arguments() {
    return arguments;
}

void RefuseSystemCall(int number, int error) {
    sock_filter filter[] = {
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<unsigned>(number), 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | static_cast<unsigned>(error)),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    };
    Install(filter, sizeof filter / sizeof filter[0]);
}

void RefuseSystemCall(int number, int firstArgument, int error) {
    sock_filter filter[] = {
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<unsigned>(number), 0, 3),
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, args)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<unsigned>(firstArgument), 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | static_cast<unsigned>(error)),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    };
    Install(filter, sizeof filter / sizeof filter[0]);
}

void FailNothrowAllocation(int nth) {
    nothrowCountdown = nth;
}

}  // namespace probe

// Stand in front of the C library's own, which then do the work.
extern "C" {

void openlog(const char* identity, int options, int facility) {
    probe::LogIdentities().push_back(
        {identity, identity != nullptr ? identity : "", options, facility, probe::closed});
    probe::closed = false;
    probe::Real<decltype(openlog)>("openlog")(identity, options, facility);
}

void closelog() {
    probe::closed = true;
    probe::Real<decltype(closelog)>("closelog")();
}

int setpriority(__priority_which_t which, id_t who, int value) noexcept {
    if (which == PRIO_PROCESS && who == 0) {
        probe::Priorities().push_back(value);
    }
    return probe::Real<int(__priority_which_t, id_t, int)>("setpriority")(which, who, value);
}

}  // extern "C"

// As the standard library's, so that what it allocates is freed as usual.
void* operator new(size_t size, const std::nothrow_t&) noexcept {
    if (probe::nothrowCountdown > 0 && --probe::nothrowCountdown == 0) {
        return nullptr;
    }
    try {
        return ::operator new(size);
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}
