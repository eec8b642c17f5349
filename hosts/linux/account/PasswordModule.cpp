#include "hosts/linux/account/PasswordModule.h"

#include <crypt.h>
#include <string.h>

#include <memory>
#include <new>

#include "platform/Platform.h"

namespace {

constexpr char kYescrypt[] = "$y$";
// 16 MiB and some 30 ms: what the distribution takes for its own users.
constexpr unsigned long kCost = 5;

bool CopyText(const char* text, char* out, size_t size) {
    const size_t length = strlen(text);
    if (length >= size) {
        return false;
    }
    memcpy(out, text, length + 1);
    return true;
}

int NewSetting(char* setting, size_t size) {
    char made[CRYPT_GENSALT_OUTPUT_SIZE];
    return crypt_gensalt_rn(kYescrypt, kCost, nullptr, 0, made, sizeof made) != nullptr &&
                   CopyText(made, setting, size)
               ? 1
               : 0;
}

int Hash(const char* password, const char* setting, char* hash, size_t size) {
    // 32 KiB: not for the stack.
    const std::unique_ptr<crypt_data> work(new (std::nothrow) crypt_data());
    if (work == nullptr) {
        return 0;
    }
    const char* made = crypt_rn(password, setting, work.get(), sizeof(crypt_data));
    const bool copied = made != nullptr && CopyText(made, hash, size);
    explicit_bzero(work.get(), sizeof(crypt_data));
    return copied ? 1 : 0;
}

}  // namespace

extern "C" {
extern TALO_PLATFORM const TaloPasswordModule taloPasswordModule;
const TaloPasswordModule taloPasswordModule = {NewSetting, Hash};
}
