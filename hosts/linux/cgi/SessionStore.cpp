#include "hosts/linux/cgi/SessionStore.h"

#include <dirent.h>
#include <errno.h>
#include <fcntl.h>
#include <stdlib.h>
#include <string.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <memory>
#include <tuple>

#include "hosts/linux/cgi/SessionRecord.h"
#include "hosts/linux/util/Descriptor.h"
#include "hosts/linux/util/FileState.h"
#include "hosts/linux/util/HostLog.h"
#include "hosts/linux/util/SmallFile.h"
#include "platform/Paths.h"
#include "platform/System.h"

namespace host {

namespace {

constexpr char kSource[] = "SessionStore.cpp";

// An id is this letter, which keeps it from ever being JSON, and 32 random bytes.
constexpr char kIdLetter = 's';
constexpr size_t kIdBytes = 32;
constexpr size_t kIdSize = 1 + (kIdBytes * 4 + 2) / 3;
constexpr char kHandleLetter = 'h';
constexpr size_t kHandleBytes = 9;

constexpr char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_";

// A record is some hundred bytes; what is larger is none of ours.
constexpr size_t kMaxRecordBytes = size_t{16} * 1024;

// The letter and that many random bytes in URL-safe base64. "" when the kernel
// has none to give.
std::string RandomName(char letter, size_t bytes) {
    unsigned char random[64] = {};
    if (getrandom(random, bytes, 0) != static_cast<ssize_t>(bytes)) {
        return std::string();
    }
    std::string name(1, letter);
    unsigned bits = 0;
    int held = 0;
    for (size_t index = 0; index < bytes; ++index) {
        bits = bits << 8 | random[index];
        for (held += 8; held >= 6; held -= 6) {
            name += kAlphabet[bits >> (held - 6) & 63];
        }
    }
    if (held > 0) {
        name += kAlphabet[bits << (6 - held) & 63];
    }
    return name;
}

std::string PathOf(const std::string& id) {
    return SessionDir() + "/" + id;
}

// The session read last: a request looks at its own several times. A record is
// never written again, another one would be another file.
KeptFromFile<std::string, talo::Session>& LastSession() {
    static thread_local KeptFromFile<std::string, talo::Session> last;
    return last;
}

// O_NOFOLLOW, and the owner: a file that somebody else put there is no session.
bool ReadSessionFile(const std::string& path, talo::Session* session) {
    const Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK));
    struct stat facts = {};
    if (file.Get() < 0 || fstat(file.Get(), &facts) != 0 || facts.st_uid != geteuid()) {
        return false;
    }
    std::string content;
    std::string reason;
    talo::Session read;
    if (!ReadSmallFile(file.Get(), kMaxRecordBytes, &content, &reason) ||
        !ParseSessionRecord(content, &read)) {
        HOST_LOG("a session file is damaged");
        return false;
    }
    read.lastUse = facts.st_mtime;
    *session = read;
    return true;
}

bool ReadSession(const std::string& id, talo::Session* session) {
    if (!talo::IsSessionId(id)) {
        return false;
    }
    const std::string path = PathOf(id);
    const FileState now(path);
    if (const talo::Session* last = LastSession().Find(id, now)) {
        *session = *last;
        return true;
    }
    if (!ReadSessionFile(path, session)) {
        return false;
    }
    LastSession().Keep(id, now, *session);
    return true;
}

// To resolve the place costs a call per folder of its path, so the name found is
// kept. "" when there is none yet.
std::string& FoundDir() {
    static std::string found;
    return found;
}

// Whether a name that was found earlier still is the place, without links. Where
// it is the place itself, it has only to be a folder.
bool IsSameFolder(const char* place, const char* name) {
    struct stat wanted = {};
    struct stat known = {};
    if (lstat(name, &known) != 0 || !S_ISDIR(known.st_mode)) {
        return false;
    }
    return strcmp(place, name) == 0 ||
           (stat(place, &wanted) == 0 && wanted.st_dev == known.st_dev &&
            wanted.st_ino == known.st_ino);
}

// Calls `visit` with the name of every entry of the folder.
template <typename Visit>
void ForEachName(Visit visit) {
    const std::unique_ptr<DIR, int (*)(DIR*)> folder(opendir(SessionDir().c_str()), closedir);
    if (folder == nullptr) {
        return;
    }
    while (const dirent* entry = readdir(folder.get())) {
        visit(std::string(entry->d_name));
    }
}

// What is left of a session that was being written when its process died.
void RemoveLeftover(const std::string& name, long long now) {
    constexpr long long kMaxAgeSeconds = 3600;
    struct stat facts = {};
    const std::string path = PathOf(name);
    if (name[0] == kIdLetter && name.size() > kIdSize && name[kIdSize] == '.' &&
        lstat(path.c_str(), &facts) == 0 && now - facts.st_mtime > kMaxAgeSeconds) {
        (void)unlink(path.c_str());
    }
}

}  // namespace

std::string FindSessionDir() {
    std::string& found = FoundDir();
    const std::string dir = TALO_SESSION_DIR;
    if (!found.empty() && IsSameFolder(dir.c_str(), found.c_str())) {
        return found;
    }
    std::unique_ptr<char, void (*)(void*)> resolved(realpath(dir.c_str(), nullptr), free);
    if (resolved == nullptr && TALOFSMkdirP(dir.c_str(), 0, 1, -1, -1, 0700) == 0) {
        resolved.reset(realpath(dir.c_str(), nullptr));
    }
    found = resolved != nullptr ? resolved.get() : "";
    return resolved != nullptr ? found : dir;
}

std::string SessionDir() {
    const std::string& found = FoundDir();
    return found.empty() ? FindSessionDir() : found;
}

bool HasTimedOut(const talo::Session& session, int defaultMinutes, long long now) {
    constexpr long long kSecondsPerMinute = 60;
    const int minutes = session.timeout > 0 ? session.timeout : defaultMinutes;
    return now - session.lastUse > minutes * kSecondsPerMinute;
}

// Where there are no sessions yet no folder is made: it has to be the web API's.
void EndSessionsOfNode(long long node) {
    if (access(TALO_SESSION_DIR, F_OK) != 0) {
        return;
    }
    ForEachName([&](const std::string& name) {
        talo::Session session;
        if (ReadSession(name, &session) && session.node == node) {
            (void)talo::EndSession(name);
        }
    });
}

}  // namespace host

namespace talo {

int DefaultTimeout() {
    return TLIBCConfGetORBTimeout();
}

bool IsSessionId(const std::string& id) {
    return id.size() == host::kIdSize && id[0] == host::kIdLetter &&
           id.find_first_not_of(host::kAlphabet) == std::string::npos;
}

bool CreateSession(const Session& session, std::string* id) {
    Session record = session;
    record.handle = host::RandomName(host::kHandleLetter, host::kHandleBytes);
    record.created = time(nullptr);
    const std::string fresh = host::RandomName(host::kIdLetter, host::kIdBytes);
    (void)host::FindSessionDir();
    if (fresh.empty() || record.handle.empty() ||
        !host::ReplaceFile(host::PathOf(fresh), host::FormatSessionRecord(record))) {
        using host::kSource;
        HOST_LOG("cannot begin a session: %m");
        return false;
    }
    *id = fresh;
    return true;
}

bool FindSession(const std::string& id, Session* session) {
    return host::ReadSession(id, session);
}

bool RenewSession(const std::string& id) {
    Session session;
    return host::ReadSession(id, &session) && RenewSession(id, &session);
}

// Touching follows links and takes folders. Only the time is another afterwards. It
// counts in seconds: with each touch all other processes would read the file again.
bool RenewSession(const std::string& id, Session* found) {
    if (!IsSessionId(id)) {
        return false;
    }
    if (found->lastUse == time(nullptr)) {
        return true;
    }
    const std::string path = host::PathOf(id);
    if (TLIBCFileUTime(path.c_str(), 1, 0) < 0) {
        return false;
    }
    const host::FileState now(path);
    found->lastUse = now.Facts().st_mtime;
    host::LastSession().Keep(id, now, *found);
    return true;
}

bool EndSession(const std::string& id) {
    return IsSessionId(id) && unlink(host::PathOf(id).c_str()) == 0;
}

bool EndSessionByHandle(const std::string& handle) {
    bool ended = false;
    host::ForEachName([&](const std::string& name) {
        Session session;
        if (!ended && host::ReadSession(name, &session) && session.handle == handle) {
            ended = EndSession(name);
        }
    });
    return ended;
}

std::vector<Session> ListSessions() {
    const long long now = time(nullptr);
    const int defaultMinutes = DefaultTimeout();
    std::vector<Session> sessions;
    host::ForEachName([&](const std::string& name) {
        Session session;
        if (!host::ReadSession(name, &session)) {
            host::RemoveLeftover(name, now);
        } else if (host::HasTimedOut(session, defaultMinutes, now)) {
            (void)EndSession(name);
        } else {
            sessions.push_back(session);
        }
    });
    std::sort(sessions.begin(), sessions.end(), [](const Session& left, const Session& right) {
        return std::tie(left.created, left.handle) < std::tie(right.created, right.handle);
    });
    return sessions;
}

}  // namespace talo
