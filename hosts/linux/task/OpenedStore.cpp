#include "hosts/linux/task/OpenedStore.h"

#include <pthread.h>
#include <unistd.h>

#include <memory>

#include "hosts/linux/task/Clock.h"
#include "hosts/linux/task/Sweep.h"
#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {

constexpr char kSource[] = "OpenedStore.cpp";

constexpr long long kLockWaitSeconds = 10;
constexpr long long kLookMs = 1000;

// It lives as long as the process: threads may still use it while others end.
struct Store {
    std::mutex mutex;
    const TaloTaskHost* host = nullptr;
    std::unique_ptr<Connection> connection;
    pid_t owner = 0;
    bool closesBeforeForks = false;
    unsigned long long generation = 0;
    long long nextLook = 0;
};

Store& TheStore();

// SQLite remembers per process which locks it holds, and the system takes them
// from the child. A child with the parent's memory of them would read and write
// without any. So nothing is open when a process forks.
void CloseBeforeFork() {
    TheStore().mutex.lock();
    TheStore().connection.reset();
}

void GoOnAfterFork() {
    TheStore().mutex.unlock();
}

// Before anybody can hold the mutex: a child that is forked past these would find
// it locked for good.
Store* MakeStore() {
    auto* store = new Store;
    store->closesBeforeForks = pthread_atfork(CloseBeforeFork, GoOnAfterFork, GoOnAfterFork) == 0;
    return store;
}

Store& TheStore() {
    static Store* const store = MakeStore();
    return *store;
}

bool OpenStore(Store* store) {
    if (store->connection != nullptr && store->owner != getpid()) {
        // Someone forked past the C library. The connection is the parent's: even
        // to close it would be wrong.
        HOST_LOG("the task store cannot be used: the process was forked in an unknown way");
        return false;
    }
    if (store->connection != nullptr && store->connection->IsUsable()) {
        return true;
    }
    store->connection.reset();
    if (!store->closesBeforeForks) {
        HOST_LOG("the task store cannot be used: it would not survive a fork");
        return false;
    }
    if (store->host == nullptr) {
        return false;
    }
    store->connection =
        Connection::Open(store->host->folder, StoreSeconds("task_lock_wait", kLockWaitSeconds));
    store->owner = getpid();
    ++store->generation;
    store->nextLook = 0;
    return store->connection != nullptr;
}

// The sweep is nobody's task, so everybody who comes by looks whether it is due.
bool OpenSweptStore(Store* store) {
    if (!OpenStore(store)) {
        return false;
    }
    const long long now = SteadyMilliseconds();
    if (now < store->nextLook) {
        return true;
    }
    SweepIfDue(store->connection.get());
    const bool still = OpenStore(store);
    store->nextLook = now + kLookMs;
    return still;
}

}  // namespace

void UseStoreOf(const TaloTaskHost* host) {
    const std::lock_guard<std::mutex> lock(TheStore().mutex);
    TheStore().host = host;
}

long long StoreSeconds(const char* key, long long fallback) {
    const long long seconds = TheStore().host->seconds(key, fallback);
    return seconds < 0 ? fallback : seconds;
}

OpenedStore::OpenedStore() : lock_(TheStore().mutex), connection_(nullptr) {
    if (OpenSweptStore(&TheStore())) {
        connection_ = TheStore().connection.get();
    }
}

Connection* OpenedStore::Get() const {
    return connection_;
}

unsigned long long OpenedStore::Generation() const {
    return TheStore().generation;
}

}  // namespace host
