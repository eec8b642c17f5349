#ifndef TALO_PLATFORM_SYSTEM_H
#define TALO_PLATFORM_SYSTEM_H

// The appliance's system facility: processes, files, configuration, users and
// groups, volumes, services, names and addresses. Plain C, nothing throws,
// outputs stay untouched on failure.

#include <sys/types.h>

#include <cstddef>

#include "platform/Platform.h"

extern "C" {

// --- Processes ---

// fork() with the platform's bookkeeping: 0 in the child, the child's id in the
// parent, negative on failure with errno set. The child's descriptors 0, 1 and
// 2 lead to /dev/null, so that nobody who waits for the end of the parent's
// output waits for the child.
TALO_PLATFORM int TLIBCProcFork(void);

// --- Files ---

// 1 when `path` names an existing regular file (through links), else 0.
TALO_PLATFORM int TLIBCFileExist(const char* path);

// Deletes a file. 0 on success, -1 otherwise with errno set.
TALO_PLATFORM int TLIBCSysUnlink(const char* path);

// Sets a file's times: `now` 1 means the present, 0 the time `when` in seconds.
// Negative on failure.
TALO_PLATFORM int TLIBCFileUTime(const char* path, int now, long when);

// Non-zero when the configuration file (key="value" a line) has `key` with
// exactly `value`; the last line of a key counts. 0 also for a file that cannot
// be read. `flags` is reserved and 0.
TALO_PLATFORM int TLIBCFileCheckKeyValue(const char* file, const char* key, const char* value,
                                         int flags);

// Creates a folder with its parents and the given mode. `uid` and `gid` -1 keep
// the process's own. Negative on failure, 0 also when it is there already.
TALO_PLATFORM int TALOFSMkdirP(const char* path, int flags, int parents, int uid, int gid,
                               mode_t mode);

// --- Volumes ---

struct TALOVOLUME {
    char mountPath[256];
    unsigned long long freeBytes;
};

// The data volume with the most space, if it has `size` bytes free for an
// ordinary process. 1 when it has (`volume` is filled, the path without a final
// slash), 0 when no volume has that much, negative when there is no volume at
// all. `status` (may be null) gets 0, TALO_VOLUME_FULL or TALO_VOLUME_NONE.
// `flags` is 1: only volumes that can be written to.
enum { TALO_VOLUME_FULL = 1, TALO_VOLUME_NONE = 2 };
TALO_PLATFORM int VolumeAvailGet(unsigned long long size, TALOVOLUME* volume, int* status,
                                 int flags);

// --- Text ---

// Lowers the ASCII letters of a text in place; `size` bounds it, 0 reads up to
// its end.
TALO_PLATFORM void TLIBCStrCaseLower(char* text, size_t size);

// A hash of texts, growing from `capacity` entries. Null when memory runs out.
// Only the port puts entries into one: the operations that fill a hash replace
// the value of a name that it has already. A port bounds the number of entries.
struct TALOSZHASH;
TALO_PLATFORM TALOSZHASH* TLIBCSzHashAlloc(int capacity);
// Null is ignored by these two.
TALO_PLATFORM void TLIBCSzHashFree(TALOSZHASH* hash);
TALO_PLATFORM void TLIBCHashRemoveAll(TALOSZHASH* hash);

// Walks a hash in the order in which its names first came: the pair at or after
// `*position` (0 to begin), which advances; 0 at the end. The texts live until the hash changes.
TALO_PLATFORM int TLIBCSzHashNext(const TALOSZHASH* hash, size_t* position, const char** key,
                                  const char** value);

// --- Errors ---

// Records the platform's error for the caller, per thread: 10496 no space, 3072 a
// folder that cannot be made.
TALO_PLATFORM void TLIBCErrSet(int code);

// The error recorded last by this thread, 0 for none.
TALO_PLATFORM int TLIBCErrGet(void);

// --- Users and groups ---

// 1 when the user belongs to the administrators' group, 0 when not, negative
// when that cannot be told. `flags` is reserved and 0.
TALO_PLATFORM int TLIBGroupIsAdminGroupMem(const char* user, int flags);

// Non-zero when the user holds the application privilege from that address.
TALO_PLATFORM int TLIBAppPrivUserHas(const char* user, const char* privilege, const char* remoteIP);

// The session time-out of the appliance, in minutes.
TALO_PLATFORM int TLIBCConfGetORBTimeout(void);

// Writes the path of the preference folder of a user or a group. 0 on success,
// negative when there is none or the path does not fit.
TALO_PLATFORM int TALOUserPreferenceDirGet(const char* user, char* buffer, size_t size);
TALO_PLATFORM int TALOGroupPreferenceDirGet(const char* group, char* buffer, size_t size);

// --- Services ---

enum { TALO_SERVICE_HTTPD = static_cast<int>(0x80000000u) };
enum { TALO_SERVICE_RESTART = 3 };

// Asks the service control to act on a service. 0 on success, -1 otherwise.
TALO_PLATFORM int TLIBNetService(int service, int action, int flags);

// --- Names and addresses ---

// The family of a textual address: 2 for IPv4, 10 for IPv6, 0 for neither. Full
// forms only; an address with a zone id ("fe80::1%eth0") is neither.
TALO_PLATFORM int TALONetGetAddrType(const char* text);

// Non-zero for a valid domain name, or host name: ASCII letters, digits and "-",
// labels of 1 to 63 without "-" at an end, at most 253 in all, the last label not
// all digits. A name that is not ASCII is UTF-8 and tested as the DNS has it. A
// domain name may end with one dot, which does not count for the length; a host
// name may not, since it also goes where a dot is not understood (certificates,
// the machine's own name).
TALO_PLATFORM int BlTLIBIsDomain(const char* text);
TALO_PLATFORM int BlTLIBIsHostname(const char* text);

}  // extern "C"

#endif
