#include "hosts/linux/cipher/TokenText.h"

#include "hosts/linux/cipher/Base64Url.h"

namespace host {

namespace {

constexpr char kSalt[] = "talo-parameter-token";
constexpr char kKeyTextInfo[] = "key-text-1";
constexpr char kAESKeyInfo[] = "aes-key-1";

// 24 bytes are 32 characters.
constexpr size_t kKeyTextSource = 24;

constexpr char kVersion = 1;
constexpr size_t kNonceBytes = 12;
constexpr size_t kTagBytes = 16;
constexpr size_t kHeadBytes = 1 + kNonceBytes;

unsigned char* Writable(std::string* text) {
    return reinterpret_cast<unsigned char*>(&(*text)[0]);
}

const unsigned char* Readable(const std::string& text, size_t from) {
    return reinterpret_cast<const unsigned char*>(text.data()) + from;
}

bool DeriveAESKey(const TaloCipherModule& module, const std::string& text, Key* key) {
    std::string source;
    return text.size() == kKeyTextBytes && FromBase64Url(text.data(), text.size(), &source) &&
           module.derive(View(text), View(kSalt), View(kAESKeyInfo), key->bytes,
                         sizeof key->bytes) != 0;
}

}  // namespace

bool DeriveKeyText(const TaloCipherModule& module, const std::string& token, std::string* key) {
    Secret<kKeyTextSource> source;
    if (token.empty() || token.size() > kMaxTokenBytes ||
        module.derive(View(token), View(kSalt), View(kKeyTextInfo), source.bytes,
                      sizeof source.bytes) == 0) {
        return false;
    }
    *key = ToBase64Url(source.Text());
    return true;
}

bool EncipherText(const TaloCipherModule& module, const std::string& key, const GcmNonce& nonce,
                  const std::string& plain, std::string* text) {
    Key cipherKey;
    if (plain.size() > kMaxCipherTextBytes || !DeriveAESKey(module, key, &cipherKey)) {
        return false;
    }
    const std::string version(1, kVersion);
    std::string made = version + nonce.Text();
    made.resize(kHeadBytes + plain.size() + kTagBytes);
    if (module.seal(cipherKey.bytes, nonce.bytes, View(version), View(plain),
                    Writable(&made) + kHeadBytes) == 0) {
        return false;
    }
    *text = ToBase64Url(made);
    return true;
}

bool DecipherText(const TaloCipherModule& module, const std::string& key, const std::string& text,
                  std::string* plain) {
    std::string bytes;
    Key cipherKey;
    if (text.size() > kMaxCipherTextBytes || !FromBase64Url(text.data(), text.size(), &bytes) ||
        bytes.size() < kHeadBytes + kTagBytes || bytes[0] != kVersion ||
        !DeriveAESKey(module, key, &cipherKey)) {
        return false;
    }
    const size_t sealed = bytes.size() - kHeadBytes;
    std::string opened(sealed - kTagBytes, '\0');
    if (module.open(cipherKey.bytes, Readable(bytes, 1), {bytes.data(), 1},
                    {bytes.data() + kHeadBytes, sealed}, Writable(&opened)) == 0) {
        return false;
    }
    plain->swap(opened);
    return true;
}

}  // namespace host
