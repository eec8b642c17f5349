#ifndef TALO_HOSTS_LINUX_SDK_CIPHER_H
#define TALO_HOSTS_LINUX_SDK_CIPHER_H

#include <string>

#include "platform/Platform.h"

// What a client needs to encipher its parameters, by a library that is loaded
// with the first call. docs/enciphered-parameters.md has the formats. Nothing
// throws.
namespace talo {

struct CipherKey {
    std::string key;  // X25519, 32 bytes in URL-safe base64: "x" of a JSON web key
    std::string id;   // 12 characters
};

// The public half of the key that parameter lines are sealed to. Makes the key if
// there is none. False, logged, when there is none to be had; `key` is untouched.
TALO_PLATFORM bool PublicCipherKey(CipherKey* key);

// A fresh token: a letter and 32 random characters. The appliance does not remember it: whoever has
// a token can derive its key. "" when the kernel has no random bytes.
TALO_PLATFORM std::string NewCipherToken();

// Makes another key. The one before counts for another day, those before that no
// more: rotating twice is what a key needs that got into wrong hands. False with
// `problem` in words.
TALO_PLATFORM bool RotateCipherKey(std::string* problem);

}  // namespace talo

#endif
