#include "src/runner/DescriptionCache.h"

#include <exception>
#include <map>
#include <mutex>
#include <string>

#include "platform/WebAPIUtil.h"
#include "src/base/FileIdentity.h"

namespace TALO {

namespace {

struct KeptFile {
    FileIdentity identity;
    bool hasContent = false;  // else only noted as read once
    Json::Value content;
};

// Never destroyed: a process forked from one with much in it would spend its end
// on copying pages only to free them.
struct Cache {
    std::mutex mutex;
    std::map<std::string, KeptFile> files;
    long long bytes = 0;
};

Cache& TheCache() {
    static Cache* const cache = new Cache;
    return *cache;
}

void Forget(Cache* cache, std::map<std::string, KeptFile>::iterator file) {
    if (file->second.hasContent) {
        cache->bytes -= file->second.identity.size;
    }
    cache->files.erase(file);
}

// True with the content of a file that is what it was when it was read.
bool FindKept(Cache* cache, const char* path, const FileIdentity& identity, Json::Value* out,
              bool* wasRead) {
    const auto file = cache->files.find(path);
    if (file == cache->files.end()) {
        return false;
    }
    if (!(file->second.identity == identity)) {
        Forget(cache, file);
        return false;
    }
    *wasRead = true;
    if (!file->second.hasContent) {
        return false;
    }
    Json::Value copy(file->second.content);
    out->swap(copy);
    return true;
}

void Note(Cache* cache, const char* path, const FileIdentity& identity) {
    if (cache->files.size() < kMostFilesKept) {
        cache->files[path].identity = identity;
    }
}

// The identity is the one before the reading: if it is still the file's, and was
// settled then, the content belongs to it.
void KeepContent(Cache* cache, const char* path, const FileIdentity& identity,
                 const Json::Value& content) {
    FileIdentity after;
    if (cache->bytes + identity.size > kMostBytesKept || !IdentifyFile(path, &after) ||
        !(after == identity)) {
        return;
    }
    Note(cache, path, identity);
    const auto file = cache->files.find(path);
    if (file == cache->files.end()) {
        return;
    }
    file->second.content = content;
    file->second.hasContent = true;
    cache->bytes += identity.size;
}

bool ReadWithCache(Cache* cache, Json::Value& out, const char* path, Keep keep) {
    FileIdentity identity;
    if (!IdentifyFile(path, &identity)) {
        const auto file = cache->files.find(path);
        if (file != cache->files.end()) {
            Forget(cache, file);
        }
        return WebAPIUtil::ReadJsonFile(out, path);
    }
    bool wasRead = false;
    if (FindKept(cache, path, identity, &out, &wasRead)) {
        return true;
    }
    const bool settled = IsSettled(identity);
    if (!WebAPIUtil::ReadJsonFile(out, path)) {
        return false;
    }
    if (settled && (wasRead || keep == Keep::kAtOnce)) {
        KeepContent(cache, path, identity, out);
    } else {
        Note(cache, path, identity);
    }
    return true;
}

}  // namespace

// Another thread's work is not waited for: a child that was forked in the middle
// of it would wait for ever.
bool ReadDescriptionFile(Json::Value& out, const char* path, Keep keep) {
    Cache& cache = TheCache();
    const std::unique_lock<std::mutex> lock(cache.mutex, std::try_to_lock);
    if (!lock.owns_lock()) {
        return WebAPIUtil::ReadJsonFile(out, path);
    }
    Json::Value content;
    bool read = false;
    try {
        read = ReadWithCache(&cache, content, path, keep);
    } catch (const std::exception&) {
        return WebAPIUtil::ReadJsonFile(out, path);
    }
    if (read) {
        out.swap(content);
    }
    return read;
}

}  // namespace TALO
