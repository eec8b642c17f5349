#ifndef TESTS_REQUEST_PRIVATE_H
#define TESTS_REQUEST_PRIVATE_H

#include <cstring>

#include "src/request/APIRequestPrivate.h"
#include "webapi/APIRequest.h"

// The private half of a request: the pointer behind the one to its table.
inline TALO::APIRequestPrivate* PrivateOf(const TALO::APIRequest& request) {
    TALO::APIRequestPrivate* d = nullptr;
    std::memcpy(&d, reinterpret_cast<const char*>(&request) + sizeof(void*), sizeof d);
    return d;
}

#endif
