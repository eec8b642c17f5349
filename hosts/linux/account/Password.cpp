#include "hosts/linux/account/Password.h"

#include <dlfcn.h>

#include "hosts/linux/util/HostLog.h"
#include "platform/Paths.h"

namespace host {

namespace {

constexpr char kSource[] = "Password.cpp";
constexpr char kYescryptPrefix[] = "$y$";
constexpr size_t kMaxHashBytes = 384;  // libcrypt's own limit

bool Refuse(std::string* problem, const char* text) {
    if (problem != nullptr) {
        *problem = text;
    }
    return false;
}

// A module that was missing may be there at the next call.
const TaloPasswordModule* Module() {
    static thread_local const TaloPasswordModule* module = nullptr;
    if (module == nullptr) {
        module = OpenPasswordModule(std::string(TALO_MODULE_DIR) + kPasswordModuleFile);
    }
    return module;
}

}  // namespace

const char kDummyHash[] =
    "$y$j9T$nyKjOIx7.FwvXW8JK6yyb.$FIoFlM2iMPuDnT.RGcmMeTJIEutMiky9qoNLbAK2013";

bool IsYescrypt(const std::string& hash) {
    // setting, salt and hash follow the prefix, each behind a "$".
    const std::string prefix = kYescryptPrefix;
    if (hash.compare(0, prefix.size(), prefix) != 0 || hash.size() >= kMaxHashBytes) {
        return false;
    }
    size_t dollars = 0;
    for (const char byte : hash) {
        if (byte <= ' ' || byte > '~') {
            return false;
        }
        dollars += byte == '$' ? 1 : 0;
    }
    return dollars == 4 && hash.back() != '$';
}

bool IsPassword(const std::string& password, std::string* problem) {
    if (password.empty()) {
        return Refuse(problem, "the password is empty");
    }
    if (password.size() > kMaxPasswordBytes) {
        return Refuse(problem, "the password has more than 511 bytes");
    }
    if (password.find('\0') != std::string::npos) {
        return Refuse(problem, "the password has a NUL");
    }
    return true;
}

const TaloPasswordModule* OpenPasswordModule(const std::string& path) {
    void* library = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (library == nullptr) {
        HOST_LOG("no password can be checked: %s", dlerror());
        return nullptr;
    }
    const void* module = dlsym(library, kPasswordModuleSymbol);
    if (module == nullptr) {
        HOST_LOG("no password can be checked: %s", dlerror());
        (void)dlclose(library);
    }
    return static_cast<const TaloPasswordModule*>(module);
}

bool HashPassword(const std::string& password, std::string* hash) {
    const TaloPasswordModule* module = Module();
    char setting[kMaxHashBytes];
    char made[kMaxHashBytes];
    if (module == nullptr) {
        return false;
    }
    if (module->newSetting(setting, sizeof setting) == 0 ||
        module->hash(password.c_str(), setting, made, sizeof made) == 0) {
        HOST_LOG("a password cannot be hashed: %m");
        return false;
    }
    *hash = made;
    return true;
}

Verdict VerifyPassword(const std::string& password, const std::string& hash) {
    const TaloPasswordModule* module = Module();
    char made[kMaxHashBytes];
    if (module == nullptr) {
        return Verdict::kUnknown;
    }
    return module->hash(password.c_str(), hash.c_str(), made, sizeof made) != 0 &&
                   EqualInConstantTime(made, hash)
               ? Verdict::kMatches
               : Verdict::kDiffers;
}

bool EqualInConstantTime(const std::string& left, const std::string& right) {
    if (left.size() != right.size()) {
        return false;
    }
    volatile unsigned char difference = 0;
    for (size_t index = 0; index < left.size(); ++index) {
        difference =
            static_cast<unsigned char>(difference | (static_cast<unsigned char>(left[index]) ^
                                                     static_cast<unsigned char>(right[index])));
    }
    return difference == 0;
}

}  // namespace host
