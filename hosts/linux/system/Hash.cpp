#include "hosts/linux/util/SzHash.h"
#include "platform/System.h"

extern "C" {

TALOSZHASH* TLIBCSzHashAlloc(int capacity) {
    return host::NewHash(capacity);
}

void TLIBCSzHashFree(TALOSZHASH* hash) {
    delete hash;
}

void TLIBCHashRemoveAll(TALOSZHASH* hash) {
    host::HashClear(hash);
}

int TLIBCSzHashNext(const TALOSZHASH* hash, size_t* position, const char** key,
                    const char** value) {
    return host::HashNext(hash, position, key, value);
}

}  // extern "C"
