#include <dlfcn.h>
#include <gtest/gtest.h>

#include <ctime>
#include <filesystem>

#include "hosts/linux/cipher/Base64Url.h"
#include "hosts/linux/cipher/SealedLine.h"
#include "hosts/linux/cipher/TokenText.h"
#include "hosts/linux/sdk/Cipher.h"
#include "platform/Cgi.h"
#include "platform/Paths.h"
#include "tests/contract/CipherWorld.h"

namespace fs = std::filesystem;

namespace {

// The keys of the private root, with the module in its place as an installation
// would put it.
class HostCipherWorld : public CipherWorld {
  public:
    HostCipherWorld() {
        Forget();
        const fs::path path = fs::path(TALO_MODULE_DIR) / kCipherModuleFile;
        fs::create_directories(path.parent_path());
        if (!fs::exists(path)) {
            fs::copy_file(CIPHER_MODULE, path);
        }
        void* library = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
        module_ = library == nullptr
                      ? nullptr
                      : static_cast<const TaloCipherModule*>(dlsym(library, kCipherModuleSymbol));
        if (module_ == nullptr) {
            throw std::runtime_error(dlerror());
        }
    }
    ~HostCipherWorld() override {
        Forget();
    }

    std::string Seal(const std::string& line) override {
        talo::CipherKey told;
        std::string bytes;
        std::string text;
        host::Key half;
        host::Key own;
        host::LineContent content;
        content.time = time(nullptr);
        content.line = line;
        EXPECT_TRUE(talo::PublicCipherKey(&told) &&
                    host::FromBase64Url(told.key.data(), told.key.size(), &bytes) &&
                    half.Set(bytes) && own.Randomize() && content.nonce.Randomize() &&
                    host::SealLine(*module_, half, own, content, &text));
        return text;
    }
    std::string Encipher(const std::string& token, const std::string& line) override {
        char key[host::kKeyTextBytes + 1] = {};
        host::GcmNonce nonce;
        std::string text;
        EXPECT_TRUE(TALONdtokenGenerateToken(token.c_str(), key, sizeof key) >= 0 &&
                    nonce.Randomize() && host::EncipherText(*module_, key, nonce, line, &text));
        return text;
    }

  private:
    static void Forget() {
        fs::remove_all(TALO_CIPHER_DIR);
        fs::remove_all(TALO_CIPHER_SEEN_DIR);
    }
    const TaloCipherModule* module_ = nullptr;
};

}  // namespace

std::unique_ptr<CipherWorld> MakeCipherWorld() {
    return std::make_unique<HostCipherWorld>();
}
