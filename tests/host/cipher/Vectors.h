#ifndef TESTS_HOST_CIPHER_VECTORS_H
#define TESTS_HOST_CIPHER_VECTORS_H

#include <gtest/gtest.h>

#include <string>

#include "hosts/linux/cipher/KeyRing.h"
#include "hosts/linux/cipher/SealedLine.h"

// The module itself, linked in: no file has to be in its place.
extern "C" const TaloCipherModule taloCipherModule;

// Bytes first, first + 1, and so on.
inline std::string CountUp(unsigned char first, size_t size) {
    std::string bytes;
    for (size_t index = 0; index < size; ++index) {
        bytes += static_cast<char>(first + index);
    }
    return bytes;
}

template <size_t Size>
host::Secret<Size> SecretOf(unsigned char first) {
    host::Secret<Size> secret;
    EXPECT_TRUE(secret.Set(CountUp(first, Size)));
    return secret;
}

inline host::LineKey KeyOf(unsigned char first) {
    host::LineKey key;
    key.secret = SecretOf<32>(first);
    EXPECT_EQ(taloCipherModule.publicHalf(key.secret.bytes, key.half.bytes), 1);
    return key;
}

inline std::string Hex(const std::string& bytes) {
    std::string text;
    for (const char byte : bytes) {
        text += "0123456789abcdef"[static_cast<unsigned char>(byte) >> 4];
        text += "0123456789abcdef"[byte & 15];
    }
    return text;
}

#endif
