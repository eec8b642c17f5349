#ifndef TALO_HOSTS_LINUX_CIPHER_TOKENTEXT_H
#define TALO_HOSTS_LINUX_CIPHER_TOKENTEXT_H

#include <string>

#include "hosts/linux/cipher/Secret.h"

// Texts under a key that both sides derive from a token.
// docs/enciphered-parameters.md has the format to the byte.
namespace host {

constexpr size_t kMaxTokenBytes = 4096;
constexpr size_t kKeyTextBytes = 32;

// A whole body's size in URL-safe base64, and some more.
constexpr size_t kMaxCipherTextBytes = size_t{32} << 20;

using GcmNonce = Secret<12>;

// The key text of a token: 32 characters of URL-safe base64. False for a token
// that is empty or too long.
bool DeriveKeyText(const TaloCipherModule& module, const std::string& token, std::string* key);

// The same nonce must never serve twice under one key: it is random, and a
// parameter only for those who check the format.
bool EncipherText(const TaloCipherModule& module, const std::string& key, const GcmNonce& nonce,
                  const std::string& plain, std::string* text);

// False for what EncipherText did not make with the key. `plain` is then untouched.
bool DecipherText(const TaloCipherModule& module, const std::string& key, const std::string& text,
                  std::string* plain);

}  // namespace host

#endif
