#ifndef TALO_HOSTS_LINUX_CIPHER_SECRET_H
#define TALO_HOSTS_LINUX_CIPHER_SECRET_H

#include <string.h>
#include <sys/random.h>
#include <sys/types.h>

#include <cstddef>
#include <string>

#include "hosts/linux/cipher/CipherModule.h"

namespace host {

// So many bytes that are wiped when they are no longer needed.
template <size_t Size>
struct Secret {
    unsigned char bytes[Size] = {};

    Secret() = default;
    Secret(const Secret&) = default;
    Secret& operator=(const Secret&) = default;
    ~Secret() {
        explicit_bzero(bytes, Size);
    }
    TaloBytes View() const {
        return {bytes, Size};
    }
    std::string Text() const {
        return std::string(reinterpret_cast<const char*>(bytes), Size);
    }
    // False for another size.
    bool Set(const std::string& text) {
        if (text.size() != Size) {
            return false;
        }
        memcpy(bytes, text.data(), Size);
        return true;
    }
    // False when the kernel has none to give.
    bool Randomize() {
        static_assert(Size <= 256, "getrandom gives so much at once");
        return getrandom(bytes, Size, 0) == static_cast<ssize_t>(Size);
    }
};

using Key = Secret<32>;

inline TaloBytes View(const std::string& text) {
    return {text.data(), text.size()};
}

}  // namespace host

#endif
