#include "hosts/linux/net/IdnModule.h"

#include <idn2.h>
#include <string.h>

#include "platform/Platform.h"

namespace {

// As browsers do: names are normalised and lowered, and "ß" stays a letter of its
// own.
constexpr int kFlags = IDN2_NFC_INPUT | IDN2_NONTRANSITIONAL;

int ToAscii(const char* name, char* ascii, size_t size) {
    char* made = nullptr;
    if (idn2_to_ascii_8z(name, &made, kFlags) != IDN2_OK) {
        return 0;
    }
    const size_t length = strlen(made);
    const bool fits = length < size;
    if (fits) {
        memcpy(ascii, made, length + 1);
    }
    idn2_free(made);
    return fits ? 1 : 0;
}

}  // namespace

extern "C" {
extern TALO_PLATFORM const TaloIdnModule taloIdnModule;
const TaloIdnModule taloIdnModule = {ToAscii};
}
