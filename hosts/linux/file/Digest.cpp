#include "hosts/linux/sdk/Digest.h"

#include "hosts/linux/file/DigestModule.h"
#include "hosts/linux/file/Guard.h"
#include "hosts/linux/util/Module.h"

namespace talo {

namespace {

constexpr size_t kDigestBytes = 32;

// A module that was missing may be there at the next call.
const TaloDigestModule* Module() {
    static thread_local const TaloDigestModule* module = nullptr;
    if (module == nullptr) {
        module = static_cast<const TaloDigestModule*>(host::OpenModule(
            kDigestModuleFile, kDigestModuleSymbol, "no checksum can be computed"));
    }
    return module;
}

}  // namespace

Sha256::Sha256()
    : state_(host::Guarded<void*>(
          nullptr, []() -> void* { return Module() != nullptr ? Module()->begin() : nullptr; })) {}

Sha256::~Sha256() {
    if (state_ != nullptr) {
        Module()->drop(state_);
    }
}

bool Sha256::Update(const void* bytes, size_t size) {
    return state_ != nullptr && Module()->update(state_, bytes, size) != 0;
}

bool Sha256::Final(std::string* hex) {
    return host::Guarded(false, [&] {
        constexpr char kDigits[] = "0123456789abcdef";
        unsigned char digest[kDigestBytes];
        const bool done = state_ != nullptr && Module()->final(state_, digest) != 0;
        if (state_ != nullptr) {
            Module()->drop(state_);
            state_ = nullptr;
        }
        if (!done) {
            return false;
        }
        std::string text;
        for (const unsigned char byte : digest) {
            text += kDigits[byte >> 4];
            text += kDigits[byte & 15];
        }
        hex->swap(text);
        return true;
    });
}

}  // namespace talo
