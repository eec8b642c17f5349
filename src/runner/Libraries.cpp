#include <dlfcn.h>

#include "src/base/JsonConvert.h"
#include "src/base/Log.h"
#include "src/runner/APIRunnerPrivate.h"
#include "webapi/APIRequest.h"
#include "webapi/APIRunner.h"

namespace TALO {

int APIRunner::OpenLib(APIRequest* request, _tag_API_TABLE** table,
                       _tag_API_CHECK_TABLE** checkTable) {
    if (request == nullptr || table == nullptr) {
        LOG_ERROR("Bad parameters");
        return 0;
    }
    const std::string path = ToText(request->GetAPIInfo("lib", ""));
    auto opened = libHandles.find(path);
    if (opened == libHandles.end()) {
        void* handle = dlopen(path.c_str(), RTLD_LAZY);
        if (handle == nullptr) {
            LOG_ERROR("cannot open library: %s. error = %s", path.c_str(), dlerror());
            return 0;
        }
        opened = libHandles.emplace(path, handle).first;
    }
    if (checkTable != nullptr) {
        (void)GetCheckTableFunc(opened->second, checkTable);
    }
    if (!GetTableFunc(opened->second, table)) {
        LOG_ERROR("Get API Table Fail");
        return 0;
    }
    return 1;
}

int APIRunner::GetTableFunc(void* handle, _tag_API_TABLE** table) {
    if (handle == nullptr || table == nullptr) {
        return 0;
    }
    (void)dlerror();
    const auto get = reinterpret_cast<APITableFunc>(dlsym(handle, "GetAPITable"));
    if (const char* error = dlerror()) {
        LOG_DETAIL("cannot load table: %s", error);
        return 0;
    }
    *table = get();
    if (*table == nullptr) {
        LOG_ERROR("cannot get api table");
        return 0;
    }
    return 1;
}

int APIRunner::GetCheckTableFunc(void* handle, _tag_API_CHECK_TABLE** checkTable) {
    if (handle == nullptr || checkTable == nullptr) {
        return 0;
    }
    (void)dlerror();
    const auto get = reinterpret_cast<APICheckTableFunc>(dlsym(handle, "GetAPICheckTable"));
    if (dlerror() != nullptr) {
        return 1;
    }
    *checkTable = get();
    if (*checkTable == nullptr) {
        LOG_ERROR("cannot get api check table");
        return 0;
    }
    return 1;
}

void APIRunner::CloseLib() {
    for (const auto& library : libHandles) {
        (void)dlclose(library.second);
    }
    libHandles.clear();
}

}  // namespace TALO
