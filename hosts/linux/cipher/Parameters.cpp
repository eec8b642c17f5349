#include <string.h>
#include <time.h>

#include "hosts/linux/cipher/Base64Url.h"
#include "hosts/linux/cipher/KeyRing.h"
#include "hosts/linux/cipher/SealedLine.h"
#include "hosts/linux/cipher/SeenLines.h"
#include "hosts/linux/cipher/TokenText.h"
#include "hosts/linux/file/Guard.h"
#include "hosts/linux/sdk/Cipher.h"
#include "hosts/linux/util/Module.h"
#include "platform/Cgi.h"
#include "platform/CredRequest.h"
#include "platform/Paths.h"

namespace host {

namespace {

constexpr char kSource[] = "Parameters.cpp";

// A module that was missing may be there at the next call.
const TaloCipherModule* Module() {
    static thread_local const TaloCipherModule* module = nullptr;
    if (module == nullptr) {
        module = static_cast<const TaloCipherModule*>(
            OpenModule(kCipherModuleFile, kCipherModuleSymbol, "nothing can be deciphered"));
    }
    return module;
}

bool OpenOnce(const std::string& text, std::string* line) {
    const TaloCipherModule* module = Module();
    const long long now = time(nullptr);
    KeyRing keys;
    LineContent content;
    if (module == nullptr || !OpenKeyRing(*module, TALO_CIPHER_DIR, now, &keys) ||
        !OpenLine(*module, keys, text, now, &content) || content.line.size() > text.size() ||
        NoteLine(TALO_CIPHER_SEEN_DIR, content, now, MachineStart(now)) != Seen::kFirst) {
        return false;
    }
    line->swap(content.line);
    return true;
}

}  // namespace

}  // namespace host

extern "C" {

int TaloCgiDecryptParam(char* text) {
    if (text == nullptr || !host::IsSealedLine(text)) {
        return 0;
    }
    return host::Guarded(0, [&] {
        std::string line;
        if (!host::OpenOnce(text, &line)) {
            return 0;
        }
        memcpy(text, line.c_str(), line.size() + 1);
        return 1;
    });
}

// Comes with every request: a plain line is told by its first characters.
int TaloCgiDetectAndDecryptParamLine(char* line) {
    if (line == nullptr) {
        return 0;
    }
    return host::IsSealedLine(line) ? TaloCgiDecryptParam(line) : 1;
}

int TALONdtokenGenerateToken(const char* token, char* key, size_t size) {
    if (token == nullptr || key == nullptr || size <= host::kKeyTextBytes) {
        return -1;
    }
    return host::Guarded(-1, [&] {
        const TaloCipherModule* module = host::Module();
        std::string text;
        if (module == nullptr ||
            !host::DeriveKeyText(
                *module, std::string(token, strnlen(token, host::kMaxTokenBytes + 1)), &text)) {
            return -1;
        }
        memcpy(key, text.c_str(), text.size() + 1);
        explicit_bzero(&text[0], text.size());
        return 0;
    });
}

}  // extern "C"

namespace TALO {

bool CredRequestUtil::GetDecryptAESString(const std::string& key, const std::string& text,
                                          std::string& out) {
    return host::Guarded(false, [&] {
        const TaloCipherModule* module = host::Module();
        return module != nullptr && host::DecipherText(*module, key, text, &out);
    });
}

}  // namespace TALO

namespace talo {

bool PublicCipherKey(CipherKey* key) {
    return host::Guarded(false, [&] {
        const TaloCipherModule* module = host::Module();
        host::KeyRing keys;
        host::Key half;
        if (module == nullptr ||
            !host::OpenKeyRing(*module, TALO_CIPHER_DIR, time(nullptr), &keys) ||
            module->publicHalf(keys.current.secret.bytes, half.bytes) == 0) {
            return false;
        }
        if (half.Text() != keys.current.half.Text()) {
            using host::kSource;
            HOST_LOG("the halves of the key in %s do not match", TALO_CIPHER_DIR);
            return false;
        }
        CipherKey made;
        made.key = host::ToBase64Url(half.Text());
        made.id = host::ToBase64Url(host::KeyIdOf(half));
        *key = made;
        return true;
    });
}

std::string NewCipherToken() {
    return host::Guarded(std::string(), [] {
        // The letter keeps it from ever being JSON, which a parameter would lose.
        constexpr char kTokenLetter = 't';
        host::Secret<24> random;
        return random.Randomize() ? kTokenLetter + host::ToBase64Url(random.Text()) : std::string();
    });
}

bool RotateCipherKey(std::string* problem) {
    return host::Guarded(false, [&] {
        const TaloCipherModule* module = host::Module();
        if (module != nullptr && host::RotateKeyRing(*module, TALO_CIPHER_DIR, time(nullptr))) {
            return true;
        }
        *problem = "the key cannot be changed; the system log says why";
        return false;
    });
}

}  // namespace talo
