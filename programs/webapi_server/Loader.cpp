#include "programs/webapi_server/Loader.h"

#include <limits.h>
#include <stdlib.h>
#include <unistd.h>

#include <cstring>

namespace {

// Whatever the value is, libraries are bound at once: it tells who set it.
constexpr char kBind[] = "LD_BIND_NOW";
constexpr char kByUs[] = "webapi-server";

// A request makes and frees some thousand small pieces. What is kept of them apart,
// unmerged, is merged piece by piece whenever something large comes.
constexpr char kTunables[] = "GLIBC_TUNABLES";
constexpr char kKeepFreed[] = "glibc.malloc.tcache_count=1000:glibc.malloc.mxfast=0";

bool Is(const char* name, const char* value) {
    const char* const found = getenv(name);
    return found != nullptr && strcmp(found, value) == 0;
}

void Forget() {
    (void)unsetenv(kBind);
    if (Is(kTunables, kKeepFreed)) {
        (void)unsetenv(kTunables);
    }
}

}  // namespace

void BeginWithLoaderSettings(char** argv) {
    char program[PATH_MAX] = {};
    if (!Is(kBind, kByUs) && readlink("/proc/self/exe", program, sizeof program - 1) > 0 &&
        setenv(kBind, kByUs, 1) == 0 && setenv(kTunables, kKeepFreed, 0) == 0) {
        (void)execv(program, argv);
    }
    Forget();
}
