#ifndef TALO_HOSTS_LINUX_FILE_DIGESTMODULE_H
#define TALO_HOSTS_LINUX_FILE_DIGESTMODULE_H

#include <cstddef>

// What the module talo-digest.so offers: the door to libcrypto's digests, opened
// only by a process that computes one. Nothing throws.
extern "C" {

struct TaloDigestModule {
    // A new SHA-256, null on failure.
    void* (*begin)();
    // 1 on success.
    int (*update)(void* state, const void* bytes, size_t size);
    // Writes 32 bytes. 1 on success.
    int (*final)(void* state, unsigned char* digest);
    void (*drop)(void* state);
};
}

constexpr char kDigestModuleFile[] = "talo-digest.so";
constexpr char kDigestModuleSymbol[] = "taloDigestModule";

#endif
