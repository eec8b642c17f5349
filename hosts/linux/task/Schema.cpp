#include "hosts/linux/task/Schema.h"

#include <unistd.h>

#include "hosts/linux/task/Clock.h"
#include "hosts/linux/task/Statement.h"
#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {

constexpr char kSource[] = "Schema.cpp";

constexpr long long kVersion = 1;
constexpr long long kJournalWaitMs = 10000;
constexpr unsigned kJournalPauseUs = 2000;

// A record's number is never given again (AUTOINCREMENT), so that who still
// holds a record that is gone cannot write into its successor. `finished` is the
// time of it, 0 before. What the sweep has to remember is in `state`.
const char* const kTables[] = {
    "CREATE TABLE task ("
    " number INTEGER PRIMARY KEY AUTOINCREMENT,"
    " user TEXT NOT NULL,"
    " id TEXT NOT NULL,"
    " created INTEGER NOT NULL,"
    " pid INTEGER NOT NULL DEFAULT 0,"
    " start INTEGER NOT NULL DEFAULT 0,"
    " boot TEXT NOT NULL DEFAULT '',"
    " finished INTEGER NOT NULL DEFAULT 0,"
    " auto_remove INTEGER NOT NULL DEFAULT 0,"
    " UNIQUE (user, id))",
    "CREATE TABLE property ("
    " task INTEGER NOT NULL,"
    " name TEXT NOT NULL,"
    " value TEXT NOT NULL,"
    " PRIMARY KEY (task, name)) WITHOUT ROWID",
    "CREATE TABLE state (name TEXT PRIMARY KEY, value INTEGER NOT NULL) WITHOUT ROWID",
    "INSERT INTO state VALUES ('swept', 0)",
    "PRAGMA user_version = 1",
};

bool RunAll(Connection* connection, const char* const* begin, const char* const* end) {
    for (const char* const* sql = begin; sql != end; ++sql) {
        Statement statement(connection, *sql);
        while (statement.Step()) {
        }
        if (!statement.IsGood()) {
            return false;
        }
    }
    return true;
}

// Where others open the new database at the same time, SQLite answers at once
// that it is busy.
bool TurnToWriteAhead(Connection* connection) {
    const long long until = SteadyMilliseconds() + kJournalWaitMs;
    for (;;) {
        const int result = sqlite3_exec(connection->Handle(), "PRAGMA journal_mode = WAL", nullptr,
                                        nullptr, nullptr);
        if (result == SQLITE_OK) {
            return true;
        }
        if ((result & 0xff) != SQLITE_BUSY || SteadyMilliseconds() >= until) {
            connection->Fail("begin it");
            return false;
        }
        (void)usleep(kJournalPauseUs);
    }
}

bool ReadVersion(Connection* connection, long long* version) {
    Statement statement(connection, "PRAGMA user_version");
    if (!statement.Step()) {
        return false;
    }
    *version = statement.Number(0);
    return true;
}

// Only one of those who find it empty makes the tables.
bool MakeTables(Connection* connection) {
    long long version = 0;
    if (!TurnToWriteAhead(connection)) {
        return false;
    }
    Transaction transaction(connection);
    if (!transaction.HasBegun() || !ReadVersion(connection, &version)) {
        return false;
    }
    return version != 0 ||
           (RunAll(connection, std::begin(kTables), std::end(kTables)) && transaction.Commit());
}

}  // namespace

bool PrepareSchema(Connection* connection) {
    // The log is written back early: who comes first has to read all of it.
    static const char* const kSettings[] = {
        "PRAGMA wal_autocheckpoint = 32",
        "PRAGMA journal_size_limit = 4194304",
        "PRAGMA cell_size_check = ON",
    };
    long long version = 0;
    if (!RunAll(connection, std::begin(kSettings), std::end(kSettings)) ||
        !ReadVersion(connection, &version)) {
        return false;
    }
    if (version == 0 && !(MakeTables(connection) && ReadVersion(connection, &version))) {
        return false;
    }
    if (version != kVersion) {
        HOST_LOG("the task store has the format %lld, which this version cannot use", version);
        return false;
    }
    return true;
}

}  // namespace host
