#include "hosts/linux/file/DigestModule.h"

#include <openssl/evp.h>

#include "platform/Platform.h"

namespace {

EVP_MD_CTX* StateOf(void* state) {
    return static_cast<EVP_MD_CTX*>(state);
}

void* Begin() {
    EVP_MD_CTX* state = EVP_MD_CTX_new();
    if (state != nullptr && EVP_DigestInit_ex(state, EVP_sha256(), nullptr) != 1) {
        EVP_MD_CTX_free(state);
        return nullptr;
    }
    return state;
}

int Update(void* state, const void* bytes, size_t size) {
    return EVP_DigestUpdate(StateOf(state), bytes, size) == 1 ? 1 : 0;
}

int Final(void* state, unsigned char* digest) {
    unsigned size = 0;
    return EVP_DigestFinal_ex(StateOf(state), digest, &size) == 1 ? 1 : 0;
}

void Drop(void* state) {
    EVP_MD_CTX_free(StateOf(state));
}

}  // namespace

extern "C" {
extern TALO_PLATFORM const TaloDigestModule taloDigestModule;
const TaloDigestModule taloDigestModule = {Begin, Update, Final, Drop};
}
