#include <string.h>

#include <string>

#include "hosts/linux/file/Guard.h"
#include "hosts/linux/net/Address.h"
#include "hosts/linux/net/IdnModule.h"
#include "hosts/linux/net/NameRules.h"
#include "hosts/linux/util/Module.h"
#include "hosts/linux/util/Utf8.h"
#include "platform/System.h"

namespace {

// Four bytes, the most that UTF-8 takes, for each character of the longest form in
// ASCII: no name needs more, and the library need not work through more.
constexpr size_t kMaxUtf8Bytes = 4 * (host::kMaxNameBytes + 1);

// A module that was missing may be there at the next call.
const TaloIdnModule* Module() {
    static thread_local const TaloIdnModule* module = nullptr;
    if (module == nullptr) {
        module = static_cast<const TaloIdnModule*>(host::OpenModule(
            kIdnModuleFile, kIdnModuleSymbol, "no internationalised name can be checked"));
    }
    return module;
}

bool IsAscii(const char* text) {
    while (*text != '\0' && static_cast<unsigned char>(*text) < 0x80) {
        ++text;
    }
    return *text == '\0';
}

bool IsUtf8(const std::string& text) {
    for (size_t at = 0; at < text.size();) {
        const size_t length = host::Utf8Character(text, at);
        if (length == 0) {
            return false;
        }
        at += length;
    }
    return true;
}

bool ToAscii(const char* name, char* ascii, size_t size) {
    return strnlen(name, kMaxUtf8Bytes + 1) <= kMaxUtf8Bytes && IsUtf8(name) &&
           Module() != nullptr && Module()->toAscii(name, ascii, size) != 0;
}

int Test(bool (*rules)(const char*), const char* name) {
    return host::Guarded(0, [&] {
        char ascii[host::kMaxNameBytes + 2];  // with a final dot
        if (name != nullptr && !IsAscii(name)) {
            return ToAscii(name, ascii, sizeof ascii) && rules(ascii) ? 1 : 0;
        }
        return rules(name) ? 1 : 0;
    });
}

}  // namespace

extern "C" {

int TALONetGetAddrType(const char* text) {
    return host::AddressFamily(text);
}

int BlTLIBIsDomain(const char* text) {
    return Test(host::IsDomainName, text);
}

int BlTLIBIsHostname(const char* text) {
    return Test(host::IsHostName, text);
}

}  // extern "C"
