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
    TALOSZHASH* paramHash;   // form fields read so far; null until one is needed;
                             // whoever made it, TaloCgiFree frees it
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
    void* state;                  // the port's own; may stay null
};

// How far TaloCgiLoadUploadNumParams has read.
struct TALOCGIUPLOADCOUNTERS {
    unsigned long long total;     // bytes of the whole body
    unsigned long long consumed;  // bytes read so far
};

// Called now and then while a body is read, a few times a second at most, and
// once more where a call succeeds: bytes of the body done, bytes in total.
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
// page, -6 the account is gone or locked, or whoever holds the session for it may
// no longer act for it. -5 is never answered: the framework uses it for "not
// asked". `flags` is reserved and 0. Does not renew the session.
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

// Deciphers an enciphered parameter line in place; the plain line is never longer,
// and taken as it is: that it looks enciphered itself means nothing. 0 on failure,
// the text is then untouched: it was not made for this appliance, was altered or
// cut, is older or newer than the clocks may differ, came before (also in another
// session or process), or the cipher cannot be had.
TALO_PLATFORM int TaloCgiDecryptParam(char* text);

// Recognises by its first characters whether a raw parameter line is enciphered. A
// plain line is left as it is, at no cost; an enciphered one is deciphered in place
// as by TaloCgiDecryptParam. 0 on failure.
TALO_PLATFORM int TaloCgiDetectAndDecryptParamLine(char* line);

// Derives the key text that belongs to a token into `key` (`size` bytes,
// zero-terminated: 32 characters fit the framework's 33). The same token always
// gives the same key, here and at the client; nothing is stored. Negative on
// failure: an empty token or one of more than 4096 bytes, a buffer that is too
// small, or no cipher to be had.
TALO_PLATFORM int TALONdtokenGenerateToken(const char* token, char* key, size_t size);

// Multipart bodies (multipart/form-data) on standard input.
//
// The boundary comes from the environment variable CONTENT_TYPE, the length of
// the body from CONTENT_LENGTH, both as they are at the first call; nothing
// behind that length is read. The body is read once and in order, and how far it
// was read is kept by the process, not by a context: each operation goes on where
// the last one ended, whichever context it is given. Standard input itself may
// have been read further than that, since it is read in blocks; whoever wants
// the body after the first of these calls has to ask them.
//
// Results: 1 is success. Once a call has failed, the later ones answer the same.
// -2, -6, -8 and -9 are the framework's own and never answered.
enum {
    TALO_UPLOAD_OK = 1,
    TALO_UPLOAD_GONE = -1,       // the client went away, or standard input fails
    TALO_UPLOAD_MALFORMED = -3,  // no multipart form, or a name that is refused
    TALO_UPLOAD_LIMIT = -4,      // more than a limit of the port, or of a buffer, allows
    TALO_UPLOAD_STORE = -5,      // a file cannot be written: disk full, no folder
    TALO_UPLOAD_MEMORY = -7,     // memory runs out
    TALO_UPLOAD_NO_PART = -10    // no file part is pending
};

// Fields: a part without a file name. The text is kept as it came; a form knows
// no types. Of two fields with one name the later counts. A text with NUL is
// refused.
//
// Files: a part with a file name. It goes to a file in the folder asked for, with
// a name that only the port chooses, mode 0600; a file whose reading fails is
// removed again. Under the name N of its form field it gives N, the path;
// "N_filename", the client's own name for it; and "N_size", its size in bytes as
// decimal text. A field that the client sent under one of these names is dropped
// and logged. Where one call stores several files, a further one of the name N
// counts as "N_2", then "N_3" and so on, and so does one whose three names meet
// those of another file.
//
// A process that is killed leaves its file behind. A port tells such files by
// their names and removes them when the folder is next used for an upload, a day
// later.
//
// The client's file name is data: its last component behind any "/" or "\", valid
// UTF-8 without control characters, 1 to 255 bytes, neither "." nor "..". Other
// names end the reading as malformed. A part with an empty file name and no
// content (a form in which nothing was chosen) is left out.

// Reads the (rest of the) body: fields into `params`, for each file part its
// temporary path in `dir` into `files`; the client's name and the size go into
// `params`. 1 on success; else the hashes stay as they were and no file is left.
// `flags` is reserved and 0.
TALO_PLATFORM int TaloCgiLoadUploadAll(TALOSZHASH** params, TALOSZHASH** files, const char* dir,
                                       int flags);

// Reads the fields up to the next file part into the context's hash, which it
// makes if need be, and leaves that part pending: its file name in `fileName`, the
// field's name in `fieldName`, the client's file name in `fieldValue`; all three
// are empty when the body ends without one. Sets `upload->partSize` to the bytes
// that the body still holds, 0 for a part without content, and `upload->status`.
// Answers the number of fields read, or the same negative result as the status; a
// name that does not fit its buffer is TALO_UPLOAD_LIMIT, never cut. While a part
// is pending, a further call answers 0 and tells the same part again, except that
// a part without content, once told, is passed over.
TALO_PLATFORM int TaloCgiLoadUploadParams(TALOCGI* ctx, TALOCGIPROGRESS progress,
                                          TALOCGIUPLOAD* upload, char* fileName,
                                          size_t fileNameSize, char* fieldName,
                                          size_t fieldNameSize, char* fieldValue,
                                          size_t fieldValueSize);

// Writes the pending file part, as TaloCgiLoadUploadParams has told it (one that
// was not told is TALO_UPLOAD_NO_PART), into `dir`, then reads on up to the next
// file part or the end of the body, so that one file with fields around it needs no
// further call; for the next file ask TaloCgiLoadUploadParams again. Adds the
// file's three entries and the fields behind it to the context's hash. `fieldName`
// is the name of the file's first entry; the part's own when it is null or empty. 1
// on success, else negative, which `upload->status` also has; the file is then gone
// and the hash as it was. The file is the caller's to remove. A later file of the
// same name takes the place of an earlier one's entries.
TALO_PLATFORM int TaloCgiLoadUploadFileToDir(TALOCGI* ctx, const char* dir,
                                             TALOCGIPROGRESS progress, TALOCGIUPLOAD* upload,
                                             const char* fileName, const char* fieldName,
                                             const char* fieldValue);

// Reads the first `count` fields of the body into the hash, which it makes when
// `*params` is null, and says how far it came: `consumed` ends with the boundary
// line behind the last field read. A file part ends the reading early; it stays
// pending, uncounted, and `name` gets its file name (else ""). The number of
// fields read, which may be 0, or a negative result. `flags` is reserved and 0.
TALO_PLATFORM int TaloCgiLoadUploadNumParams(TALOSZHASH** params, int count, int flags,
                                             TALOCGIUPLOADCOUNTERS* counters, char* name,
                                             size_t nameSize);

}  // extern "C"

#endif
