#include "FaultyFiles.h"

#include <signal.h>
#include <sqlite3.h>
#include <unistd.h>

#include <cstring>

namespace faulty {

namespace {

Fault plannedFault = Fault::kNone;
int plannedCall = 0;
int calls = 0;

// The code that the call answers, or SQLITE_OK for it to go on.
int Strike(int code) {
    if (plannedFault == Fault::kNone || ++calls != plannedCall) {
        return SQLITE_OK;
    }
    if (plannedFault == Fault::kKill) {
        (void)kill(getpid(), SIGKILL);
    }
    return plannedFault == Fault::kFull && code == SQLITE_IOERR_WRITE ? SQLITE_FULL : code;
}

// A file, with SQLite's own behind it.
struct File {
    sqlite3_file base;
    sqlite3_file* Real() {
        return reinterpret_cast<sqlite3_file*>(this + 1);
    }
};

File* Of(sqlite3_file* file) {
    return reinterpret_cast<File*>(file);
}

int Close(sqlite3_file* file) {
    sqlite3_file* real = Of(file)->Real();
    return real->pMethods != nullptr ? real->pMethods->xClose(real) : SQLITE_OK;
}

template <typename Call>
int Do(sqlite3_file* file, int code, Call call) {
    const int struck = Strike(code);
    return struck != SQLITE_OK ? struck : call(Of(file)->Real());
}

int Read(sqlite3_file* file, void* out, int size, sqlite3_int64 at) {
    return Do(file, SQLITE_IOERR_READ,
              [&](sqlite3_file* real) { return real->pMethods->xRead(real, out, size, at); });
}
int Write(sqlite3_file* file, const void* bytes, int size, sqlite3_int64 at) {
    return Do(file, SQLITE_IOERR_WRITE,
              [&](sqlite3_file* real) { return real->pMethods->xWrite(real, bytes, size, at); });
}
int Truncate(sqlite3_file* file, sqlite3_int64 size) {
    return Do(file, SQLITE_IOERR_TRUNCATE,
              [&](sqlite3_file* real) { return real->pMethods->xTruncate(real, size); });
}
int Sync(sqlite3_file* file, int flags) {
    return Do(file, SQLITE_IOERR_FSYNC,
              [&](sqlite3_file* real) { return real->pMethods->xSync(real, flags); });
}
int FileSize(sqlite3_file* file, sqlite3_int64* size) {
    return Do(file, SQLITE_IOERR_FSTAT,
              [&](sqlite3_file* real) { return real->pMethods->xFileSize(real, size); });
}
int Lock(sqlite3_file* file, int level) {
    return Do(file, SQLITE_IOERR_LOCK,
              [&](sqlite3_file* real) { return real->pMethods->xLock(real, level); });
}
// To give a lock up does not fail.
int Unlock(sqlite3_file* file, int level) {
    return Of(file)->Real()->pMethods->xUnlock(Of(file)->Real(), level);
}
int CheckReserved(sqlite3_file* file, int* reserved) {
    return Do(file, SQLITE_IOERR_CHECKRESERVEDLOCK, [&](sqlite3_file* real) {
        return real->pMethods->xCheckReservedLock(real, reserved);
    });
}
int Control(sqlite3_file* file, int operation, void* argument) {
    return Of(file)->Real()->pMethods->xFileControl(Of(file)->Real(), operation, argument);
}
int SectorSize(sqlite3_file* file) {
    return Of(file)->Real()->pMethods->xSectorSize(Of(file)->Real());
}
int Characteristics(sqlite3_file* file) {
    return Of(file)->Real()->pMethods->xDeviceCharacteristics(Of(file)->Real());
}
int Map(sqlite3_file* file, int page, int size, int extend, void volatile** memory) {
    return Do(file, SQLITE_IOERR_SHMMAP, [&](sqlite3_file* real) {
        return real->pMethods->xShmMap(real, page, size, extend, memory);
    });
}
int ShmLock(sqlite3_file* file, int offset, int count, int flags) {
    const auto lock = [&](sqlite3_file* real) {
        return real->pMethods->xShmLock(real, offset, count, flags);
    };
    return (flags & SQLITE_SHM_UNLOCK) != 0 ? lock(Of(file)->Real())
                                            : Do(file, SQLITE_IOERR_SHMLOCK, lock);
}
void Barrier(sqlite3_file* file) {
    Of(file)->Real()->pMethods->xShmBarrier(Of(file)->Real());
}
int Unmap(sqlite3_file* file, int remove) {
    return Of(file)->Real()->pMethods->xShmUnmap(Of(file)->Real(), remove);
}

const sqlite3_io_methods kMethods = {
    2,      Close,         Read,    Write,      Truncate,        Sync, FileSize, Lock,
    Unlock, CheckReserved, Control, SectorSize, Characteristics, Map,  ShmLock,  Barrier,
    Unmap,  nullptr,       nullptr};

sqlite3_vfs* real = nullptr;

int Open(sqlite3_vfs*, const char* name, sqlite3_file* file, int flags, int* made) {
    file->pMethods = nullptr;
    const int struck = Strike(SQLITE_CANTOPEN);
    if (struck != SQLITE_OK) {
        return struck;
    }
    Of(file)->Real()->pMethods = nullptr;
    const int result = real->xOpen(real, name, Of(file)->Real(), flags, made);
    if (Of(file)->Real()->pMethods != nullptr) {
        file->pMethods = &kMethods;
    }
    return result;
}
int Delete(sqlite3_vfs*, const char* name, int sync) {
    const int struck = Strike(SQLITE_IOERR_DELETE);
    return struck != SQLITE_OK ? struck : real->xDelete(real, name, sync);
}
int Access(sqlite3_vfs*, const char* name, int flags, int* answer) {
    const int struck = Strike(SQLITE_IOERR_ACCESS);
    return struck != SQLITE_OK ? struck : real->xAccess(real, name, flags, answer);
}

void Install() {
    static sqlite3_vfs own;
    if (real != nullptr) {
        return;
    }
    real = sqlite3_vfs_find(nullptr);
    std::memcpy(&own, real, sizeof own);
    own.szOsFile = static_cast<int>(sizeof(File)) + real->szOsFile;
    own.zName = "faulty";
    own.pNext = nullptr;
    own.xOpen = Open;
    own.xDelete = Delete;
    own.xAccess = Access;
    (void)sqlite3_vfs_register(&own, 1);
}

}  // namespace

void Plan(Fault fault, int call) {
    Install();
    plannedFault = fault;
    plannedCall = call;
    calls = 0;
}

bool HasStruck() {
    return calls >= plannedCall;
}

}  // namespace faulty
