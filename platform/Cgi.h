#ifndef TALO_PLATFORM_CGI_H
#define TALO_PLATFORM_CGI_H

// The appliance's CGI facility: cookies and login sessions, multipart bodies,
// enciphered parameter lines, the caller's address. Plain C at the boundary;
// no operation throws, and outputs stay untouched on failure unless said so.

#include <cstddef>

#include "platform/Platform.h"

struct TALOSZHASH;  // platform/System.h

extern "C" {

// What a port keeps behind a context. Only the port looks inside.
struct TALOCGIState;

// One request's view of the CGI world. The caller owns the storage, zeroes it
// before TaloCgiInit and ends its life with TaloCgiFree. The named members are
// what the framework reads; all are valid after TaloCgiInit.
struct TALOCGI {
    char sessionDir[512];    // folder of the session files, no final slash
    char sessionFile[1024];  // the session found by TaloCgiIsAuthorizedEx, else ""
    int defaultTimeout;      // minutes without use after which a session ends
    int skipIPCheck;         // 1: sessions are not bound to the client's address
    TALOSZHASH* paramHash;   // form fields read so far; null until one is needed
    TALOCGIState* state;     // the port's own
};

// What TaloCgiIsAuthorizedEx is to check.
struct TALOCGIAUTHREQUEST {
    int checkMask;     // bit 0 the session exists, 1 the address matches, 2 it has not
                       // timed out, 3 the request comes from the appliance's own pages
    int allowTimeout;  // 1: a timed-out session still counts
};

// State of one multipart reading, zeroed by the caller before the first call.
struct TALOCGIUPLOAD {
    unsigned long long partSize;  // bytes of the pending file part; the rest of the
                                  // body where the part does not say
    int status;                   // 1 success; negative: see the upload result codes
    void* state;                  // the port's own
};

// How far TaloCgiLoadUploadNumParams has read.
struct TALOCGIUPLOADCOUNTERS {
    unsigned long long total;     // bytes of the whole body
    unsigned long long consumed;  // bytes read so far
};

// Called now and then while a body is read: bytes done, bytes in total.
typedef void (*TALOCGIPROGRESS)(unsigned long long done, unsigned long long total);

// Prepares a context; `prefix` is kept for naming and may be empty. 0 on
// success, -1 when memory runs out. Must be paired with TaloCgiFree either way.
TALO_PLATFORM int TaloCgiInit(const char* prefix, TALOCGI* ctx);

// The same for code that has no entry: the session time-out in minutes, whether
// timed-out sessions count, the class of users to look among and a prefix.
TALO_PLATFORM int TaloCgiInitEx(TALOCGI* ctx, int timeout, int allowTimeout, const char* userClass,
                                const char* prefix);

// Parses the environment variable HTTP_COOKIE as it is now into the context,
// replacing what an earlier call read. 0 on success, also without cookies.
TALO_PLATFORM int TaloCgiLoadInCookies(TALOCGI* ctx);

// Releases everything that hangs on the context and zeroes it. Null is ignored.
TALO_PLATFORM void TaloCgiFree(TALOCGI* ctx);

// Looks up the session `sessionId` and checks what the request asks for. On an
// accepted id (result 0 or more) writes the login name, zero-terminated, into
// `name` (`size` bytes) and fills the context's session members.
// 1 a user, 2 an administrator, 0 no access; -1 timed out, -2 no such session,
// -3 the client's address changed, -4 the request comes from another site's
// page, -6 the account is gone or locked. -5 is never answered: the framework
// uses it for "not asked". `flags` is reserved and 0. Does not renew the session.
TALO_PLATFORM int TaloCgiIsAuthorizedEx(TALOCGI* ctx, const char* sessionId, char* name,
                                        size_t size, const TALOCGIAUTHREQUEST* request, int flags);

// A text option of the session found last: 1 exempt from the address check
// ("1"), 6 web-API privilege, 7 application, 10 time-out in minutes. The result
// lives as long as the context; `fallback` (may be null) when unset.
TALO_PLATFORM const char* TaloCgiGetOption(TALOCGI* ctx, int option, const char* fallback);

// The user-interface language of the session found last, such as "enu".
TALO_PLATFORM const char* TaloCgiGetLang(TALOCGI* ctx);

// Writes the client's address as text into `buffer`. 0 on success.
TALO_PLATFORM int TaloCgiGetRemoteIP(char* buffer, size_t size);

// The numeric id of the user `userName` logged in under `sessionId`, negative
// when the session does not resolve to that user.
TALO_PLATFORM int TaloCgiUIDGet(const char* sessionId, const char* userName);

// Deciphers an enciphered parameter line in place; the plain line is never
// longer. 0 on failure, the text is then undefined.
TALO_PLATFORM int TaloCgiDecryptParam(char* text);

// Recognises whether a raw parameter line is enciphered. A plain line is left
// as it is; an enciphered one is deciphered in place. 0 on failure.
TALO_PLATFORM int TaloCgiDetectAndDecryptParamLine(char* line);

// Derives the key text that belongs to a token into `key` (`size` bytes,
// zero-terminated: 32 characters fit the framework's 33). Negative on failure.
TALO_PLATFORM int TALONdtokenGenerateToken(const char* token, char* key, size_t size);

// Multipart bodies on standard input. File parts go to files that only the
// port names, mode 0600; a file whose reading fails is removed again.

// Reads the whole body: fields into `params`, for each file part its temporary
// path in `dir` into `files`. 1 on success, else a negative result.
TALO_PLATFORM int TaloCgiLoadUploadAll(TALOSZHASH** params, TALOSZHASH** files, const char* dir,
                                       int flags);

// Reads the fields before the first file part into the context's hash and
// leaves that part pending: its file name, field name and the field's value in
// the buffers. Positive when fields were read; `upload->status` has the result.
TALO_PLATFORM int TaloCgiLoadUploadParams(TALOCGI* ctx, TALOCGIPROGRESS progress,
                                          TALOCGIUPLOAD* upload, char* fileName,
                                          size_t fileNameSize, char* fieldName,
                                          size_t fieldNameSize, char* fieldValue,
                                          size_t fieldValueSize);

// Writes the pending file part into `dir`. Positive on success.
TALO_PLATFORM int TaloCgiLoadUploadFileToDir(TALOCGI* ctx, const char* dir,
                                             TALOCGIPROGRESS progress, TALOCGIUPLOAD* upload,
                                             const char* fileName, const char* fieldName,
                                             const char* fieldValue);

// Reads the first `count` fields of the body into the hash and says how far it
// came; the rest stays unread on standard input. Negative on failure.
TALO_PLATFORM int TaloCgiLoadUploadNumParams(TALOSZHASH** params, int count, int flags,
                                             TALOCGIUPLOADCOUNTERS* counters, char* name,
                                             size_t nameSize);

}  // extern "C"

#endif
