#ifndef TALO_HOSTS_LINUX_TASK_CONNECTION_H
#define TALO_HOSTS_LINUX_TASK_CONNECTION_H

#include <sqlite3.h>
#include <sys/types.h>

#include <map>
#include <memory>
#include <string>

#include "hosts/linux/task/TaskModule.h"

namespace host {

constexpr char kTaskFile[] = "tasks.db";

// An open database with its prepared statements. Each step of the store takes
// one from OpenedStore and holds it no longer than the step lasts.
class Connection {
  public:
    // Null, logged, when the database cannot be opened or is none of ours.
    static std::unique_ptr<Connection> Open(const std::string& folder, long long lockWait);
    ~Connection();
    Connection(const Connection&) = delete;
    Connection& operator=(const Connection&) = delete;

    sqlite3* Handle() const;

    // The statement of a text, which has to be a constant: it is compiled when it
    // is first wanted. Null, logged, when it cannot be.
    sqlite3_stmt* Prepared(const char* sql);

    // A step that can as well be taken later waits for nobody for long, and gives
    // way without a word. At first it is not so.
    void GiveWay(bool giveWay);

    // Logs what SQLite says about the last failure. The connection is not taken
    // for another step then.
    void Fail(const char* doing);

    // Whether it is fit for another step: nothing has failed, and the file is
    // still the one of that name.
    bool IsUsable() const;

  private:
    Connection(const std::string& path, long long lockWait);
    bool OpenFile();
    static int OnBusy(void* self, int round);

    const std::string path_;
    const long long lockWait_;
    long long waitUntil_ = 0;
    bool giveWay_ = false;
    bool failed_ = false;
    dev_t device_ = 0;
    ino_t file_ = 0;
    sqlite3* handle_ = nullptr;
    std::map<const char*, sqlite3_stmt*> statements_;
};

}  // namespace host

#endif
