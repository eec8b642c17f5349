#include <dlfcn.h>

#include <cstdio>
#include <ctime>
#include <string>
#include <vector>

#include "Groups.h"
#include "Harness.h"
#include "hosts/linux/cipher/Base64Url.h"
#include "hosts/linux/cipher/SealedLine.h"
#include "hosts/linux/cipher/TokenText.h"
#include "hosts/linux/sdk/Cipher.h"
#include "platform/Cgi.h"
#include "platform/CredRequest.h"
#include "platform/Paths.h"

namespace bench {

namespace {

constexpr size_t kLineBytes = 2048;
constexpr int kRounds = 31;
constexpr int kRunsPerRound = 10;
constexpr size_t kKeyBytes = 33;

// The one that the platform opens, too.
const TaloCipherModule* Module() {
    const std::string path = std::string(TALO_MODULE_DIR) + kCipherModuleFile;
    void* library = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
    return library == nullptr
               ? nullptr
               : static_cast<const TaloCipherModule*>(dlsym(library, kCipherModuleSymbol));
}

// What a browser makes of a line, with the key that the appliance tells. "" without one.
std::string Seal(const TaloCipherModule& module, const std::string& line) {
    talo::CipherKey told;
    std::string bytes;
    std::string text;
    host::Key half;
    host::Key own;
    host::LineContent content;
    content.time = std::time(nullptr);
    content.line = line;
    const bool sealed = talo::PublicCipherKey(&told) &&
                        host::FromBase64Url(told.key.data(), told.key.size(), &bytes) &&
                        half.Set(bytes) && own.Randomize() && content.nonce.Randomize() &&
                        host::SealLine(module, half, own, content, &text);
    return sealed ? text : "";
}

bool Encipher(const TaloCipherModule& module, const std::string& token, const std::string& line,
              std::string* text) {
    char key[kKeyBytes] = {};
    host::GcmNonce nonce;
    return TALONdtokenGenerateToken(token.c_str(), key, sizeof key) >= 0 && nonce.Randomize() &&
           host::EncipherText(module, key, nonce, line, text);
}

bool Detected(const std::string& line) {
    std::vector<char> copy(line.c_str(), line.c_str() + line.size() + 1);
    return TaloCgiDetectAndDecryptParamLine(copy.data()) != 0;
}

bool Deciphered(const std::string& token, const std::string& text) {
    char key[kKeyBytes] = {};
    std::string line;
    return TALONdtokenGenerateToken(token.c_str(), key, sizeof key) >= 0 &&
           TALO::CredRequestUtil::GetDecryptAESString(key, text, line);
}

}  // namespace

void Ciphers() {
    const TaloCipherModule* module = Module();
    if (module == nullptr) {
        std::fprintf(stderr, "%s\n", dlerror());
        return;
    }
    const std::string line = "a=" + std::string(kLineBytes - 2, 'x');
    const std::string token = talo::NewCipherToken();
    // Each is opened once only, the first of them before the time counts.
    std::vector<std::string> sealed;
    for (int count = 0; count <= kRounds * kRunsPerRound; ++count) {
        sealed.push_back(Seal(*module, line));
    }
    std::string text;
    if (sealed.back().empty() || !Encipher(*module, token, line, &text)) {
        std::fprintf(stderr, "nothing could be enciphered\n");
        return;
    }
    size_t next = 0;
    size_t failed = 0;
    Compare("A parameter line of 2 KB, with the cipher's module loaded",
            {{"plain", [&] { failed += Detected(line) ? 0 : 1; }},
             {"sealed", [&] { failed += Detected(sealed[next++]) ? 0 : 1; }},
             {"under a token", [&] { failed += Deciphered(token, text) ? 0 : 1; }}},
            kRounds, kRunsPerRound);
    if (failed > 0) {
        std::fprintf(stderr, "%zu lines could not be deciphered\n", failed);
    }
}

}  // namespace bench
