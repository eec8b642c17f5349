#ifndef TALO_HOSTS_LINUX_SDK_DIGEST_H
#define TALO_HOSTS_LINUX_SDK_DIGEST_H

#include <cstddef>
#include <string>

#include "platform/Platform.h"

// Checksums, by a library that is loaded when the first one is begun. Nothing
// throws.
namespace talo {

// One SHA-256.
//
//     talo::Sha256 digest;
//     std::string hex;
//     if (digest.Update(bytes, size) && digest.Final(&hex)) ...
//
// When the library is missing, which is logged, every operation answers false.
class TALO_PLATFORM Sha256 {
  public:
    Sha256();
    ~Sha256();
    Sha256(const Sha256&) = delete;
    Sha256& operator=(const Sha256&) = delete;

    bool Update(const void* bytes, size_t size);

    // The digest as 64 hexadecimal digits, in lower case. Nothing can be added
    // afterwards. `hex` stays untouched on failure.
    bool Final(std::string* hex);

  private:
    void* state_;
};

}  // namespace talo

#endif
