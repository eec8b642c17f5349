#include "hosts/linux/task/Sweep.h"

#include <string.h>

#include <vector>

#include "hosts/linux/task/Clock.h"
#include "hosts/linux/task/OpenedStore.h"
#include "hosts/linux/task/ProcessIdentity.h"
#include "hosts/linux/task/Statement.h"

namespace host {

namespace {

constexpr long long kSweepEvery = 60;
constexpr long long kKeepAutoRemove = 3600;
constexpr long long kKeepFinished = 7ll * 24 * 3600;
// From the record to the process that runs the task. A parent that lives needs
// some milliseconds for it.
constexpr long long kStartWait = 600;

// One sweep must not hold up those who write.
constexpr size_t kMostAtOnce = 1000;

constexpr char kLostBody[] = "{\"success\":false,\"error\":{\"code\":117}}";

struct Candidate {
    long long number;
    TaloTaskProcess process;
};

bool IsDue(Connection* connection, long long now) {
    Statement statement(connection, "SELECT value FROM state WHERE name = 'swept'");
    if (!statement.Step()) {
        return false;
    }
    // A clock that was set back would stop the sweep.
    const long long last = statement.Number(0);
    return last > now || now - last >= kSweepEvery;
}

// Of those who find it due at once, one gets it.
bool Claim(Connection* connection, long long now) {
    Transaction transaction(connection, Lasting::kUnlessPowerFails);
    return transaction.HasBegun() && IsDue(connection, now) &&
           Statement(connection, "UPDATE state SET value = ? WHERE name = 'swept'")
               .Bind(now)
               .Run() &&
           transaction.Commit();
}

TaloTaskProcess ProcessOf(const Statement& row, int column) {
    TaloTaskProcess process = {};
    process.pid = static_cast<int>(row.Number(column));
    process.start = static_cast<unsigned long long>(row.Number(column + 1));
    strncpy(process.boot, row.Text(column + 2), sizeof process.boot - 1);
    return process;
}

// The rows of number, pid, start and boot whose process is gone.
std::vector<Candidate> WithoutProcess(Statement* rows) {
    std::vector<Candidate> found;
    while (found.size() < kMostAtOnce && rows->Step()) {
        const Candidate candidate = {rows->Number(0), ProcessOf(*rows, 1)};
        if (!ProcessLives(candidate.process)) {
            found.push_back(candidate);
        }
    }
    return found;
}

std::vector<Candidate> LostOnes(Connection* connection, long long now) {
    Statement rows(connection,
                   "SELECT number, pid, start, boot FROM task"
                   " WHERE finished = 0 AND (pid <> 0 OR created <= ?)");
    rows.Bind(now - StoreSeconds("task_start_wait", kStartWait));
    return WithoutProcess(&rows);
}

// Unless it was finished, or given another process, since it was looked at.
bool EndOne(Connection* connection, const Candidate& lost, long long now) {
    static constexpr char kLost[] = "lost";
    static constexpr char kTrue[] = "true";
    static constexpr char kBody[] = "body";
    return Statement(connection,
                     "UPDATE task SET finished = ?, auto_remove = EXISTS (SELECT 1 FROM property"
                     " WHERE task = number AND name = 'auto_remove' AND value = 'true')"
                     " WHERE number = ? AND finished = 0 AND pid = ? AND start = ?")
               .Bind(now)
               .Bind(lost.number)
               .Bind(lost.process.pid)
               .Bind(static_cast<long long>(lost.process.start))
               .Run() &&
           (sqlite3_changes(connection->Handle()) == 0 ||
            (Statement(connection, "INSERT OR REPLACE INTO property VALUES (?, ?, ?)")
                 .Bind(lost.number)
                 .Bind(kLost, strlen(kLost))
                 .Bind(kTrue, strlen(kTrue))
                 .Run() &&
             Statement(connection, "INSERT OR IGNORE INTO property VALUES (?, ?, ?)")
                 .Bind(lost.number)
                 .Bind(kBody, strlen(kBody))
                 .Bind(kLostBody, strlen(kLostBody))
                 .Run()));
}

// A Stop finishes the record of a process that may still live a while.
std::vector<Candidate> OutdatedOnes(Connection* connection, long long now) {
    Statement rows(connection,
                   "SELECT number, pid, start, boot FROM task WHERE finished <> 0"
                   " AND finished <= CASE WHEN auto_remove THEN ? ELSE ? END");
    rows.Bind(now - StoreSeconds("task_keep_auto_remove", kKeepAutoRemove))
        .Bind(now - StoreSeconds("task_keep_finished", kKeepFinished));
    return WithoutProcess(&rows);
}

bool DropOne(Connection* connection, const Candidate& outdated) {
    return Statement(connection, "DELETE FROM property WHERE task = ?")
               .Bind(outdated.number)
               .Run() &&
           Statement(connection, "DELETE FROM task WHERE number = ?").Bind(outdated.number).Run();
}

template <typename Change>
bool ChangeAll(Connection* connection, const std::vector<Candidate>& all, Change change) {
    if (all.empty()) {
        return true;
    }
    Transaction transaction(connection);
    if (!transaction.HasBegun()) {
        return false;
    }
    for (const Candidate& candidate : all) {
        if (!change(candidate)) {
            return false;
        }
    }
    return transaction.Commit();
}

void Sweep(Connection* connection, long long now) {
    (void)(ChangeAll(connection, LostOnes(connection, now),
                     [&](const Candidate& lost) { return EndOne(connection, lost, now); }) &&
           ChangeAll(connection, OutdatedOnes(connection, now),
                     [&](const Candidate& outdated) { return DropOne(connection, outdated); }));
}

}  // namespace

void SweepIfDue(Connection* connection) {
    const long long now = SecondsOfDay();
    if (sqlite3_db_readonly(connection->Handle(), "main") != 0) {
        return;
    }
    connection->GiveWay(true);
    const bool claimed = IsDue(connection, now) && Claim(connection, now);
    connection->GiveWay(false);
    if (claimed) {
        Sweep(connection, now);
    }
}

}  // namespace host
