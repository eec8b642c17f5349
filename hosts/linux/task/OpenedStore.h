#ifndef TALO_HOSTS_LINUX_TASK_OPENEDSTORE_H
#define TALO_HOSTS_LINUX_TASK_OPENEDSTORE_H

#include <mutex>

#include "hosts/linux/task/Connection.h"
#include "hosts/linux/task/TaskModule.h"

namespace host {

// Settles the place of the store for this process.
void UseStoreOf(const TaloTaskHost* host);

// A setting in seconds; the fallback for one that is negative, too.
long long StoreSeconds(const char* key, long long fallback);

// The process's one connection, for one step of one thread. It is opened when it
// is first wanted and when the last one is of no use any more. It never crosses
// a fork: it is closed before, in whatever way the C library forks, and both
// sides open their own when they want one.
class OpenedStore {
  public:
    OpenedStore();
    OpenedStore(const OpenedStore&) = delete;
    OpenedStore& operator=(const OpenedStore&) = delete;

    // Null when there is none; the reason is logged.
    Connection* Get() const;

    // Changes with every new connection.
    unsigned long long Generation() const;

  private:
    const std::lock_guard<std::mutex> lock_;
    Connection* connection_;
};

}  // namespace host

#endif
