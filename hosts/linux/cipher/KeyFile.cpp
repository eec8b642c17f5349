#include <errno.h>
#include <fcntl.h>
#include <string.h>

#include "hosts/linux/cipher/Folder.h"
#include "hosts/linux/cipher/KeyRing.h"
#include "hosts/linux/util/Descriptor.h"
#include "hosts/linux/util/HostLog.h"
#include "hosts/linux/util/SmallFile.h"

namespace host {

namespace {

constexpr char kSource[] = "KeyFile.cpp";
constexpr size_t kMaxFileBytes = 1024;

enum class Found { kKeys, kNothing, kTrouble };

std::string KeysIn(const std::string& dir) {
    return dir + "/keys";
}

Found ReadKeys(const std::string& dir, KeyRing* ring) {
    const std::string path = KeysIn(dir);
    const Descriptor file(OpenPrivateFile(path, O_RDONLY));
    if (file.Get() < 0 && errno == ENOENT) {
        return Found::kNothing;
    }
    if (file.Get() < 0) {
        HOST_LOG("cannot use %s: %m", path.c_str());
        return Found::kTrouble;
    }
    std::string content;
    std::string reason = "no keys";
    const bool read =
        ReadSmallFile(file.Get(), kMaxFileBytes, &content, &reason) && ParseKeyRing(content, ring);
    explicit_bzero(&content[0], content.size());
    if (!read) {
        HOST_LOG("cannot use %s: %s", path.c_str(), reason.c_str());
    }
    return read ? Found::kKeys : Found::kTrouble;
}

bool MakeKey(const TaloCipherModule& module, LineKey* key) {
    LineKey made;
    if (!made.secret.Randomize() || module.publicHalf(made.secret.bytes, made.half.bytes) == 0) {
        HOST_LOG("cannot make a key");
        return false;
    }
    *key = made;
    return true;
}

bool WriteKeys(const std::string& dir, const KeyRing& ring) {
    const std::string path = KeysIn(dir);
    std::string content = FormatKeyRing(ring);
    const bool written = ReplaceFile(path, content);
    if (!written) {
        HOST_LOG("cannot write %s: %m", path.c_str());
    }
    explicit_bzero(&content[0], content.size());
    return written;
}

// Calls `change` with the keys of the folder, and whether there are any, while
// nobody else changes them; then stores what it answers true for.
template <typename Change>
bool ChangeKeys(const std::string& dir, KeyRing* ring, Change change) {
    if (!MakePrivateFolder(dir)) {
        return false;
    }
    const std::string path = dir + "/lock";
    const Descriptor lock(OpenPrivateFile(path, O_RDWR | O_CREAT));
    if (lock.Get() < 0 || !LockFile(lock.Get())) {
        HOST_LOG("cannot lock %s: %m", path.c_str());
        return false;
    }
    KeyRing changed;
    const Found found = ReadKeys(dir, &changed);
    if (found == Found::kTrouble || !change(found == Found::kKeys, &changed)) {
        return false;
    }
    *ring = changed;
    return true;
}

}  // namespace

bool OpenKeyRing(const TaloCipherModule& module, const std::string& dir, long long now,
                 KeyRing* ring) {
    const Found found = MakePrivateFolder(dir) ? ReadKeys(dir, ring) : Found::kTrouble;
    if (found != Found::kNothing) {
        return found == Found::kKeys;
    }
    return ChangeKeys(dir, ring, [&](bool present, KeyRing* made) {
        if (present) {
            return true;
        }
        made->since = now;
        return MakeKey(module, &made->current) && WriteKeys(dir, *made);
    });
}

bool RotateKeyRing(const TaloCipherModule& module, const std::string& dir, long long now) {
    KeyRing ring;
    return ChangeKeys(dir, &ring, [&](bool present, KeyRing* made) {
        if (present) {
            made->previous = made->current;
        }
        made->since = now;
        return MakeKey(module, &made->current) && WriteKeys(dir, *made);
    });
}

}  // namespace host
