#include "hosts/linux/cipher/SealedLine.h"

#include <string.h>

#include "hosts/linux/cipher/Base64Url.h"
#include "hosts/linux/cipher/TokenText.h"

namespace host {

namespace {

constexpr char kInfo[] = "talo-line-1";
constexpr char kVersion = 1;

constexpr size_t kPrefixBytes = sizeof kLinePrefix - 1;
constexpr size_t kHalfAt = 1 + kKeyIdBytes;
constexpr size_t kHalfBytes = 32;
constexpr size_t kHeadBytes = kHalfAt + kHalfBytes;
constexpr size_t kTagBytes = 16;
constexpr size_t kTimeBytes = 8;
constexpr size_t kLineAt = kTimeBytes + sizeof(LineNonce);

// What one line is enciphered with: a key, and the nonce behind it.
constexpr size_t kKeyBytes = 32;
using LineCipher = Secret<kKeyBytes + 12>;

unsigned char* Writable(std::string* text) {
    return reinterpret_cast<unsigned char*>(&(*text)[0]);
}

// The salt binds the cipher to both halves.
bool DeriveCipher(const TaloCipherModule& module, const Key& shared, const std::string& senders,
                  const Key& receivers, LineCipher* cipher) {
    const std::string salt = senders + receivers.Text();
    return module.derive(shared.View(), View(salt), View(kInfo), cipher->bytes,
                         sizeof cipher->bytes) != 0;
}

std::string TimeBytes(long long time) {
    std::string bytes;
    for (int shift = 56; shift >= 0; shift -= 8) {
        bytes += static_cast<char>(static_cast<unsigned long long>(time) >> shift & 0xFF);
    }
    return bytes;
}

bool ReadTime(const std::string& bytes, long long* time) {
    constexpr unsigned long long kLatest = 253402300799;  // the year 9999
    unsigned long long read = 0;
    for (size_t index = 0; index < kTimeBytes; ++index) {
        read = read << 8 | static_cast<unsigned char>(bytes[index]);
    }
    if (read > kLatest) {
        return false;
    }
    *time = static_cast<long long>(read);
    return true;
}

// A line ends with its NUL: what was behind one would be lost silently.
bool Unpack(const std::string& opened, LineContent* content) {
    LineContent read;
    if (opened.size() < kLineAt || opened.find('\0', kLineAt) != std::string::npos ||
        !ReadTime(opened, &read.time) ||
        !read.nonce.Set(opened.substr(kTimeBytes, sizeof(LineNonce)))) {
        return false;
    }
    read.line = opened.substr(kLineAt);
    *content = read;
    return true;
}

}  // namespace

bool IsSealedLine(const char* text) {
    return strncmp(text, kLinePrefix, kPrefixBytes) == 0;
}

bool OpenLine(const TaloCipherModule& module, const KeyRing& keys, const std::string& text,
              long long now, LineContent* content) {
    std::string bytes;
    if (!IsSealedLine(text.c_str()) || text.size() > kMaxCipherTextBytes ||
        !FromBase64Url(text.data() + kPrefixBytes, text.size() - kPrefixBytes, &bytes) ||
        bytes.size() < kHeadBytes + kLineAt + kTagBytes || bytes[0] != kVersion) {
        return false;
    }
    const LineKey* key = FindKey(keys, bytes.substr(1, kKeyIdBytes), now);
    const std::string senders = bytes.substr(kHalfAt, kHalfBytes);
    Key half;
    Key shared;
    LineCipher cipher;
    if (key == nullptr || !half.Set(senders) ||
        module.agree(key->secret.bytes, half.bytes, shared.bytes) == 0 ||
        !DeriveCipher(module, shared, senders, key->half, &cipher)) {
        return false;
    }
    const size_t sealed = bytes.size() - kHeadBytes;
    std::string opened(sealed - kTagBytes, '\0');
    return module.open(cipher.bytes, cipher.bytes + kKeyBytes, {bytes.data(), kHeadBytes},
                       {bytes.data() + kHeadBytes, sealed}, Writable(&opened)) != 0 &&
           Unpack(opened, content);
}

bool SealLine(const TaloCipherModule& module, const Key& half, const Key& own,
              const LineContent& content, std::string* text) {
    Key senders;
    Key shared;
    LineCipher cipher;
    if (content.line.size() > kMaxCipherTextBytes ||
        module.publicHalf(own.bytes, senders.bytes) == 0 ||
        module.agree(own.bytes, half.bytes, shared.bytes) == 0 ||
        !DeriveCipher(module, shared, senders.Text(), half, &cipher)) {
        return false;
    }
    const std::string head = std::string(1, kVersion) + KeyIdOf(half) + senders.Text();
    const std::string plain = TimeBytes(content.time) + content.nonce.Text() + content.line;
    std::string made = head;
    made.resize(head.size() + plain.size() + kTagBytes);
    if (module.seal(cipher.bytes, cipher.bytes + kKeyBytes, View(head), View(plain),
                    Writable(&made) + head.size()) == 0) {
        return false;
    }
    *text = kLinePrefix + ToBase64Url(made);
    return true;
}

}  // namespace host
