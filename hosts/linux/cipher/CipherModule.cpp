#include "hosts/linux/cipher/CipherModule.h"

#include <limits.h>
#include <openssl/evp.h>
#include <openssl/kdf.h>
#include <string.h>

#include <memory>

#include "platform/Platform.h"

namespace {

constexpr int kTagBytes = 16;
constexpr size_t kKeyBytes = 32;
// libcrypto counts in int.
constexpr size_t kMostBytes = INT_MAX - 64;

template <typename Type, void (*Free)(Type*)>
struct Freed {
    void operator()(Type* object) const {
        Free(object);
    }
};
using Cipher = std::unique_ptr<EVP_CIPHER_CTX, Freed<EVP_CIPHER_CTX, EVP_CIPHER_CTX_free>>;
using KeyContext = std::unique_ptr<EVP_PKEY_CTX, Freed<EVP_PKEY_CTX, EVP_PKEY_CTX_free>>;
using KeyPair = std::unique_ptr<EVP_PKEY, Freed<EVP_PKEY, EVP_PKEY_free>>;

const unsigned char* Bytes(const TaloBytes& bytes) {
    // libcrypto takes a null pointer for "not given".
    return bytes.data != nullptr ? static_cast<const unsigned char*>(bytes.data)
                                 : reinterpret_cast<const unsigned char*>("");
}

int Size(const TaloBytes& bytes) {
    return static_cast<int>(bytes.size);
}

int Derive(TaloBytes secret, TaloBytes salt, TaloBytes info, unsigned char* out, size_t size) {
    if (secret.size > kMostBytes || salt.size > kMostBytes || info.size > kMostBytes) {
        return 0;
    }
    const KeyContext context(EVP_PKEY_CTX_new_id(EVP_PKEY_HKDF, nullptr));
    size_t made = size;
    return context != nullptr && EVP_PKEY_derive_init(context.get()) == 1 &&
                   EVP_PKEY_CTX_set_hkdf_md(context.get(), EVP_sha256()) == 1 &&
                   EVP_PKEY_CTX_set1_hkdf_salt(context.get(), Bytes(salt), Size(salt)) == 1 &&
                   EVP_PKEY_CTX_set1_hkdf_key(context.get(), Bytes(secret), Size(secret)) == 1 &&
                   EVP_PKEY_CTX_add1_hkdf_info(context.get(), Bytes(info), Size(info)) == 1 &&
                   EVP_PKEY_derive(context.get(), out, &made) == 1 && made == size
               ? 1
               : 0;
}

int Seal(const unsigned char* key, const unsigned char* nonce, TaloBytes head, TaloBytes plain,
         unsigned char* out) {
    if (head.size > kMostBytes || plain.size > kMostBytes) {
        return 0;
    }
    const Cipher cipher(EVP_CIPHER_CTX_new());
    int made = 0;
    return cipher != nullptr &&
                   EVP_EncryptInit_ex(cipher.get(), EVP_aes_256_gcm(), nullptr, key, nonce) == 1 &&
                   EVP_EncryptUpdate(cipher.get(), nullptr, &made, Bytes(head), Size(head)) == 1 &&
                   EVP_EncryptUpdate(cipher.get(), out, &made, Bytes(plain), Size(plain)) == 1 &&
                   EVP_EncryptFinal_ex(cipher.get(), out + plain.size, &made) == 1 &&
                   EVP_CIPHER_CTX_ctrl(cipher.get(), EVP_CTRL_GCM_GET_TAG, kTagBytes,
                                       out + plain.size) == 1
               ? 1
               : 0;
}

int Open(const unsigned char* key, const unsigned char* nonce, TaloBytes head, TaloBytes sealed,
         unsigned char* out) {
    if (sealed.size < kTagBytes || head.size > kMostBytes || sealed.size > kMostBytes) {
        return 0;
    }
    const TaloBytes text = {sealed.data, sealed.size - kTagBytes};
    unsigned char tag[kTagBytes];
    memcpy(tag, Bytes(sealed) + text.size, sizeof tag);
    const Cipher cipher(EVP_CIPHER_CTX_new());
    int made = 0;
    if (cipher != nullptr &&
        EVP_DecryptInit_ex(cipher.get(), EVP_aes_256_gcm(), nullptr, key, nonce) == 1 &&
        EVP_DecryptUpdate(cipher.get(), nullptr, &made, Bytes(head), Size(head)) == 1 &&
        EVP_DecryptUpdate(cipher.get(), out, &made, Bytes(text), Size(text)) == 1 &&
        EVP_CIPHER_CTX_ctrl(cipher.get(), EVP_CTRL_GCM_SET_TAG, kTagBytes, tag) == 1 &&
        EVP_DecryptFinal_ex(cipher.get(), tag, &made) == 1) {
        return 1;
    }
    // What was not authenticated is nobody's business.
    explicit_bzero(out, text.size);
    return 0;
}

KeyPair PairOf(const unsigned char* secret) {
    return KeyPair(EVP_PKEY_new_raw_private_key(EVP_PKEY_X25519, nullptr, secret, kKeyBytes));
}

int PublicHalf(const unsigned char* secret, unsigned char* half) {
    const KeyPair own = PairOf(secret);
    size_t size = kKeyBytes;
    return own != nullptr && EVP_PKEY_get_raw_public_key(own.get(), half, &size) == 1 &&
                   size == kKeyBytes
               ? 1
               : 0;
}

int Agree(const unsigned char* secret, const unsigned char* half, unsigned char* shared) {
    const KeyPair own = PairOf(secret);
    const KeyPair other(EVP_PKEY_new_raw_public_key(EVP_PKEY_X25519, nullptr, half, kKeyBytes));
    const KeyContext context(own != nullptr ? EVP_PKEY_CTX_new(own.get(), nullptr) : nullptr);
    size_t size = kKeyBytes;
    return other != nullptr && context != nullptr && EVP_PKEY_derive_init(context.get()) == 1 &&
                   EVP_PKEY_derive_set_peer(context.get(), other.get()) == 1 &&
                   EVP_PKEY_derive(context.get(), shared, &size) == 1 && size == kKeyBytes
               ? 1
               : 0;
}

}  // namespace

extern "C" {
extern TALO_PLATFORM const TaloCipherModule taloCipherModule;
const TaloCipherModule taloCipherModule = {Derive, Seal, Open, PublicHalf, Agree};
}
