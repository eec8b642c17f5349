#include <string.h>
#include <sys/stat.h>

#include <cstdio>

#include "platform/Paths.h"
#include "platform/System.h"

namespace {

// A name is one component of a path: it must not lead anywhere else.
bool IsComponent(const char* name) {
    return name != nullptr && *name != '\0' && strchr(name, '/') == nullptr &&
           strcmp(name, ".") != 0 && strcmp(name, "..") != 0;
}

int FolderBelow(const char* parent, const char* name, char* buffer, size_t size) {
    char path[4096];
    if (!IsComponent(name) || buffer == nullptr) {
        return -1;
    }
    const int length = snprintf(path, sizeof path, "%s%s", parent, name);
    struct stat facts = {};
    if (length < 0 || static_cast<size_t>(length) >= sizeof path ||
        static_cast<size_t>(length) >= size || stat(path, &facts) != 0 || !S_ISDIR(facts.st_mode)) {
        return -1;
    }
    memcpy(buffer, path, static_cast<size_t>(length) + 1);
    return 0;
}

}  // namespace

extern "C" {

int TALOUserPreferenceDirGet(const char* user, char* buffer, size_t size) {
    return FolderBelow(TALO_USER_PREFERENCE_DIR, user, buffer, size);
}

int TALOGroupPreferenceDirGet(const char* group, char* buffer, size_t size) {
    return FolderBelow(TALO_GROUP_PREFERENCE_DIR, group, buffer, size);
}

}  // extern "C"
