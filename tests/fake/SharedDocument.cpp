#include "tests/fake/SharedDocument.h"

#include <errno.h>
#include <pthread.h>
#include <stdlib.h>
#include <string.h>
#include <sys/mman.h>

#include <atomic>
#include <string>

namespace fake {

namespace {

constexpr size_t kRoom = 8 * 1024 * 1024;

}  // namespace

// Two places: a change is written beside what is valid, then made the valid one.
struct SharedDocument::Region {
    pthread_mutex_t mutex;
    std::atomic<int> valid;
    size_t size[2];
    char text[2][kRoom];
};

// Held by a process that is killed, it passes to the next one.
class SharedDocument::Lock {
  public:
    explicit Lock(Region* region) : region_(region) {
        if (pthread_mutex_lock(&region_->mutex) == EOWNERDEAD) {
            (void)pthread_mutex_consistent(&region_->mutex);
        }
    }
    ~Lock() {
        (void)pthread_mutex_unlock(&region_->mutex);
    }
    Lock(const Lock&) = delete;
    Lock& operator=(const Lock&) = delete;

  private:
    Region* region_;
};

SharedDocument::SharedDocument() {
    void* room = mmap(nullptr, sizeof(Region), PROT_READ | PROT_WRITE,
                      MAP_SHARED | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    if (room == MAP_FAILED) {
        abort();
    }
    region = static_cast<Region*>(room);
    pthread_mutexattr_t attributes;
    (void)pthread_mutexattr_init(&attributes);
    (void)pthread_mutexattr_setpshared(&attributes, PTHREAD_PROCESS_SHARED);
    (void)pthread_mutexattr_setrobust(&attributes, PTHREAD_MUTEX_ROBUST);
    (void)pthread_mutex_init(&region->mutex, &attributes);
    (void)pthread_mutexattr_destroy(&attributes);
}

SharedDocument::~SharedDocument() {
    (void)munmap(region, sizeof(Region));
}

Json::Value SharedDocument::Load() const {
    const int valid = region->valid;
    const std::string text(region->text[valid], region->size[valid]);
    Json::Value document(Json::objectValue);
    if (!text.empty()) {
        Json::CharReaderBuilder builder;
        builder["allowSpecialFloats"] = true;
        const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
        if (!reader->parse(text.data(), text.data() + text.size(), &document, nullptr)) {
            abort();
        }
    }
    return document;
}

void SharedDocument::Store(const Json::Value& document) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["useSpecialFloats"] = true;
    const std::string text = Json::writeString(builder, document);
    if (text.size() > kRoom) {
        abort();
    }
    const int next = 1 - region->valid;
    memcpy(region->text[next], text.data(), text.size());
    region->size[next] = text.size();
    region->valid = next;
}

Json::Value SharedDocument::Read() {
    const Lock lock(region);
    return Load();
}

bool SharedDocument::Change(const std::function<bool(Json::Value*)>& change) {
    const Lock lock(region);
    Json::Value document = Load();
    if (!change(&document)) {
        return false;
    }
    Store(document);
    return true;
}

}  // namespace fake
