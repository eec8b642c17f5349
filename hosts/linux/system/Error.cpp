#include "platform/System.h"

namespace {
thread_local int lastError = 0;
}

extern "C" {

void TLIBCErrSet(int code) {
    lastError = code;
}

int TLIBCErrGet(void) {
    return lastError;
}

}  // extern "C"
