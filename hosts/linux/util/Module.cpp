#include "hosts/linux/util/Module.h"

#include <dlfcn.h>

#include <string>

#include "hosts/linux/util/HostLog.h"
#include "platform/Paths.h"

namespace host {

namespace {

constexpr char kSource[] = "Module.cpp";

}  // namespace

const void* OpenModule(const char* file, const char* symbol, const char* lost) {
    void* library = dlopen((std::string(TALO_MODULE_DIR) + file).c_str(), RTLD_NOW | RTLD_LOCAL);
    if (library == nullptr) {
        HOST_LOG("%s: %s", lost, dlerror());
        return nullptr;
    }
    const void* module = dlsym(library, symbol);
    if (module == nullptr) {
        HOST_LOG("%s: %s", lost, dlerror());
        (void)dlclose(library);
    }
    return module;
}

}  // namespace host
