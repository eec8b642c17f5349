#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "hosts/linux/cipher/Base64Url.h"
#include "hosts/linux/cipher/KeyRing.h"
#include "hosts/linux/cipher/SealedLine.h"
#include "hosts/linux/cipher/TokenText.h"

// A text as it comes from a client: taken as a sealed line, as a text under a
// token, as base64 and as a file of keys. The key and the token are those of the
// documented example.

extern "C" const TaloCipherModule taloCipherModule;

namespace {

constexpr char kToken[] = "talo-example-token";
constexpr long long kNow = 1800000000;

void Require(bool condition) {
    if (!condition) {
        abort();
    }
}

std::string CountUp(unsigned char first, size_t size) {
    std::string bytes;
    for (size_t index = 0; index < size; ++index) {
        bytes += static_cast<char>(first + index);
    }
    return bytes;
}

host::KeyRing ExampleKeys() {
    host::KeyRing keys;
    Require(keys.current.secret.Set(CountUp(0, 32)));
    Require(taloCipherModule.publicHalf(keys.current.secret.bytes, keys.current.half.bytes) != 0);
    return keys;
}

// Only what was sealed opens, and the corpus has no more than the example.
void CheckLine(const std::string& text) {
    static const host::KeyRing keys = ExampleKeys();
    host::LineContent content;
    content.line = "untouched";
    if (host::OpenLine(taloCipherModule, keys, text, kNow, &content)) {
        Require(content.nonce.Text() == CountUp(0x40, 16) && content.time == kNow);
    } else {
        Require(content.line == "untouched" && content.time == 0);
    }
}

// What opens is what the same nonce makes again, to the letter.
void CheckTokenText(const std::string& text) {
    std::string key;
    std::string bytes;
    std::string again;
    std::string plain = "untouched";
    host::GcmNonce nonce;
    Require(host::DeriveKeyText(taloCipherModule, kToken, &key));
    if (!host::DecipherText(taloCipherModule, key, text, &plain)) {
        Require(plain == "untouched");
        return;
    }
    Require(host::FromBase64Url(text.data(), text.size(), &bytes));
    Require(nonce.Set(bytes.substr(1, 12)));
    Require(host::EncipherText(taloCipherModule, key, nonce, plain, &again) && again == text);
}

void CheckBase64(const std::string& text) {
    std::string bytes;
    if (host::FromBase64Url(text.data(), text.size(), &bytes)) {
        Require(host::ToBase64Url(bytes) == text);
    }
    const std::string encoded = host::ToBase64Url(text);
    Require(host::FromBase64Url(encoded.data(), encoded.size(), &bytes) && bytes == text);
}

void CheckKeyFile(const std::string& content) {
    host::KeyRing keys;
    host::KeyRing again;
    if (host::ParseKeyRing(content, &keys)) {
        const std::string written = host::FormatKeyRing(keys);
        Require(host::ParseKeyRing(written, &again) && host::FormatKeyRing(again) == written);
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string text(reinterpret_cast<const char*>(data), size);
    CheckLine(text);
    CheckLine(host::kLinePrefix + host::ToBase64Url(text));
    CheckTokenText(text);
    CheckTokenText(host::ToBase64Url(text));
    CheckBase64(text);
    CheckKeyFile(text);
    return 0;
}
