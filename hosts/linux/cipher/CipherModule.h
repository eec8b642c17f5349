#ifndef TALO_HOSTS_LINUX_CIPHER_CIPHERMODULE_H
#define TALO_HOSTS_LINUX_CIPHER_CIPHERMODULE_H

#include <cstddef>

// What the module talo-cipher.so offers: the door to libcrypto's ciphers, opened
// only by a process that deciphers something. Each answers 1 on success and
// writes only then, except that `out` of a refused `open` is wiped. Nothing throws.
extern "C" {

struct TaloBytes {
    const void* data;
    size_t size;
};

struct TaloCipherModule {
    // HKDF with SHA-256: extract and expand.
    int (*derive)(TaloBytes secret, TaloBytes salt, TaloBytes info, unsigned char* out,
                  size_t size);
    // AES-256-GCM. `seal` writes the text's size and 16 bytes of tag, `open` takes
    // the tag from the end and writes 16 bytes less than it was given.
    int (*seal)(const unsigned char* key, const unsigned char* nonce, TaloBytes head,
                TaloBytes plain, unsigned char* out);
    int (*open)(const unsigned char* key, const unsigned char* nonce, TaloBytes head,
                TaloBytes sealed, unsigned char* out);
    // X25519: the public half of a secret, and what it agrees on with another's
    // public half. The latter refuses halves that would agree on zeros.
    int (*publicHalf)(const unsigned char* secret, unsigned char* half);
    int (*agree)(const unsigned char* secret, const unsigned char* half, unsigned char* shared);
};
}

constexpr char kCipherModuleFile[] = "talo-cipher.so";
constexpr char kCipherModuleSymbol[] = "taloCipherModule";

#endif
