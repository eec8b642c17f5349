#ifndef TALO_SRC_BASE_GUARDED_H
#define TALO_SRC_BASE_GUARDED_H

#include <cxxabi.h>

#include "src/base/Log.h"

namespace TALO {

// Logs what the exception being handled says.
void LogCurrentException(const char* source, int line);

// Runs `body` and answers whether it ended without throwing; what it threw is
// logged. Exceptions end here, at the library's boundary. The unwinding of a
// cancelled thread is none of them and goes on. It comes without an object, so
// the reference is bound to null, at which the sanitizer must not look.
template <typename Body>
__attribute__((no_sanitize("null"))) bool Guarded(const char* source, int line, Body body) {
    try {
        body();
        return true;
    } catch (abi::__forced_unwind&) {
        throw;
    } catch (...) {
        LogCurrentException(source, line);
        return false;
    }
}

}  // namespace TALO

#endif
