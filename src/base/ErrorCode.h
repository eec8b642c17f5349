#ifndef TALO_SRC_BASE_ERRORCODE_H
#define TALO_SRC_BASE_ERRORCODE_H

#include <cstddef>

namespace TALO {

// The framework's response codes. API libraries number their own from 400 up.
enum ErrorCode {
    kErrorNone = 0,
    kErrorBadRequest = 101,
    kErrorNoSuchAPI = 102,
    kErrorNoSuchMethod = 103,
    kErrorVersion = 104,
    kErrorPermission = 105,
    kErrorSessionTimeout = 106,
    kErrorSessionRefused = 107,
    kErrorUpload = 108,
    kErrorRelay = 109,
    kErrorCompoundOrFork = 110,
    kErrorLibrary = 111,
    kErrorCompoundSkipped = 112,
    kErrorCompoundTransfer = 113,
    kErrorShareGroup = 114,
    kErrorUploadNotAllowed = 115,
    kErrorDemoMode = 116,
    kErrorNoResult = 117,
    kErrorProcessName = 118,
    kErrorNoSession = 119,
    kErrorNotInTable = 121,
};

struct ErrorCodeRow {
    int code;
    const char* meaning;
};

// Every code with its meaning in one line, ascending, without kErrorNone.
// docs/error-codes.md shows the same rows.
extern const ErrorCodeRow kErrorCodes[];
extern const size_t kErrorCodeCount;

}  // namespace TALO

#endif
