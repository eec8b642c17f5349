#include "hosts/linux/task/TaskStore.h"

#include <dlfcn.h>

#include <charconv>
#include <exception>

#include "hosts/linux/conf/KeyValueFile.h"
#include "hosts/linux/util/HostLog.h"
#include "platform/Paths.h"

namespace host {

namespace {

constexpr char kSource[] = "TaskStore.cpp";

// Long enough for whatever somebody may want, and far from what overflows.
constexpr long long kMostSeconds = 100ll * 366 * 24 * 3600;

long long SecondsSetting(const char* key, long long fallback) {
    try {
        const std::string text = HostSetting(key, "");
        const char* end = text.data() + text.size();
        long long seconds = 0;
        const auto result = std::from_chars(text.data(), end, seconds);
        const bool sensible = result.ec == std::errc() && result.ptr == end && seconds >= 0 &&
                              seconds <= kMostSeconds;
        return sensible ? seconds : fallback;
    } catch (const std::exception&) {
        return fallback;
    }
}

constexpr TaloTaskHost kHost = {TALO_TASK_DIR, SecondsSetting};

}  // namespace

const TaloTaskModule* OpenTaskModule(const std::string& path) {
    void* library = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (library == nullptr) {
        HOST_LOG("no task can be used: %s", dlerror());
        return nullptr;
    }
    const void* module = dlsym(library, kTaskModuleSymbol);
    if (module == nullptr) {
        HOST_LOG("no task can be used: %s", dlerror());
        (void)dlclose(library);
    }
    return static_cast<const TaloTaskModule*>(module);
}

// A module that was missing may be there at the next call.
const TaloTaskModule* TaskStore() {
    static thread_local const TaloTaskModule* module = nullptr;
    if (module == nullptr) {
        module = OpenTaskModule(std::string(TALO_MODULE_DIR) + kTaskModuleFile);
        if (module != nullptr) {
            module->use(&kHost);
        }
    }
    return module;
}

}  // namespace host
