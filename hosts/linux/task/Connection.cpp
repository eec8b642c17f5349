#include "hosts/linux/task/Connection.h"

#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include "hosts/linux/task/Clock.h"
#include "hosts/linux/task/Place.h"
#include "hosts/linux/task/Schema.h"
#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {

constexpr char kSource[] = "Connection.cpp";

constexpr int kShortestPauseUs = 500;
constexpr int kPauseSpreadUs = 3000;
constexpr long long kGiveWayMs = 50;

}  // namespace

Connection::Connection(const std::string& path, long long lockWait)
    : path_(path), lockWait_(lockWait) {}

std::unique_ptr<Connection> Connection::Open(const std::string& folder, long long lockWait) {
    const std::string path = folder + "/" + kTaskFile;
    std::unique_ptr<Connection> made;
    if (MakeTaskPlace(folder, path)) {
        made.reset(new Connection(path, lockWait));
    }
    if (made != nullptr && !(made->OpenFile() && PrepareSchema(made.get()))) {
        made.reset();
    }
    return made;
}

Connection::~Connection() {
    for (const auto& entry : statements_) {
        (void)sqlite3_finalize(entry.second);
    }
    (void)sqlite3_close(handle_);
}

bool Connection::OpenFile() {
    struct stat facts = {};
    const int flags = SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX | SQLITE_OPEN_EXRESCODE;
    if (sqlite3_open_v2(path_.c_str(), &handle_, flags, nullptr) != SQLITE_OK) {
        Fail("open it");
        return false;
    }
    if (stat(path_.c_str(), &facts) != 0) {
        HOST_LOG("cannot use the task store %s: %m", path_.c_str());
        return false;
    }
    device_ = facts.st_dev;
    file_ = facts.st_ino;
    (void)sqlite3_busy_handler(handle_, OnBusy, this);
    // Requests are short: the last one to close would write the whole log back,
    // and remove it, each time.
    (void)sqlite3_db_config(handle_, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 1, nullptr);
    (void)sqlite3_db_config(handle_, SQLITE_DBCONFIG_DEFENSIVE, 1, nullptr);
    (void)sqlite3_db_config(handle_, SQLITE_DBCONFIG_TRUSTED_SCHEMA, 0, nullptr);
    return true;
}

// SQLite's own waits get so long that somebody can be passed by all others.
int Connection::OnBusy(void* self, int round) {
    Connection* connection = static_cast<Connection*>(self);
    const long long now = SteadyMilliseconds();
    if (round == 0) {
        connection->waitUntil_ =
            now + (connection->giveWay_ ? kGiveWayMs : connection->lockWait_ * 1000);
    }
    if (now >= connection->waitUntil_) {
        return 0;
    }
    (void)usleep(static_cast<useconds_t>(kShortestPauseUs + Spread(kPauseSpreadUs)));
    return 1;
}

sqlite3* Connection::Handle() const {
    return handle_;
}

sqlite3_stmt* Connection::Prepared(const char* sql) {
    sqlite3_stmt*& statement = statements_[sql];
    if (statement == nullptr && sqlite3_prepare_v3(handle_, sql, -1, SQLITE_PREPARE_PERSISTENT,
                                                   &statement, nullptr) != SQLITE_OK) {
        Fail("read it");
    }
    return statement;
}

void Connection::GiveWay(bool giveWay) {
    giveWay_ = giveWay;
}

void Connection::Fail(const char* doing) {
    const int code = sqlite3_extended_errcode(handle_);
    const char* kind = "";
    if (giveWay_ && (code & 0xff) == SQLITE_BUSY) {
        return;
    }
    switch (code & 0xff) {
        case SQLITE_BUSY:
        case SQLITE_LOCKED:
            kind = "another process has locked it: ";
            break;
        case SQLITE_CORRUPT:
        case SQLITE_NOTADB:
            kind = "the file is damaged, and left as it is: ";
            break;
        case SQLITE_FULL:
            kind = "no space is left: ";
            break;
        case SQLITE_READONLY:
            kind = "it can only be read: ";
            break;
        default:
            break;
    }
    failed_ = true;
    HOST_LOG("the task store %s: cannot %s: %s%s (%d)", path_.c_str(), doing, kind,
             sqlite3_errmsg(handle_), code);
}

bool Connection::IsUsable() const {
    struct stat facts = {};
    return !failed_ && stat(path_.c_str(), &facts) == 0 && facts.st_dev == device_ &&
           facts.st_ino == file_;
}

}  // namespace host
