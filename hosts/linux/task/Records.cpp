#include "hosts/linux/task/Records.h"

#include <string.h>

#include "hosts/linux/task/Clock.h"
#include "hosts/linux/task/Statement.h"

namespace host {

namespace {

// Above all that an id is made of.
constexpr char kAfterEveryId = '\x7f';

TaloTaskAnswer Answer(const Statement& statement, bool found) {
    if (!statement.IsGood()) {
        return kTaskFailed;
    }
    return found ? kTaskDone : kTaskMissing;
}

TaloTaskFacts FactsOf(const Statement& row) {
    TaloTaskFacts facts = {};
    facts.process.pid = static_cast<int>(row.Number(0));
    facts.process.start = static_cast<unsigned long long>(row.Number(1));
    strncpy(facts.process.boot, row.Text(2), sizeof facts.process.boot - 1);
    facts.finished = row.Number(3) != 0 ? 1 : 0;
    return facts;
}

}  // namespace

TaloTaskAnswer FindRecord(Connection* connection, const std::string& user, const std::string& id,
                          long long* number) {
    Statement statement(connection, "SELECT number FROM task WHERE user = ? AND id = ?");
    const bool found = statement.Bind(user).Bind(id).Step();
    if (found) {
        *number = statement.Number(0);
    }
    return Answer(statement, found);
}

TaloTaskAnswer MakeRecord(Connection* connection, const std::string& user, const std::string& id,
                          long long* number) {
    long long made = 0;
    // An empty record tells nothing yet: what it gets makes it last.
    Transaction transaction(connection, Lasting::kUnlessPowerFails);
    if (!transaction.HasBegun() ||
        !Statement(connection, "INSERT OR IGNORE INTO task (user, id, created) VALUES (?, ?, ?)")
             .Bind(user)
             .Bind(id)
             .Bind(SecondsOfDay())
             .Run() ||
        FindRecord(connection, user, id, &made) != kTaskDone || !transaction.Commit()) {
        return kTaskFailed;
    }
    *number = made;
    return kTaskDone;
}

TaloTaskAnswer ReadRecord(Connection* connection, long long number,
                          const std::function<void(const TaloTaskFacts&)>& facts,
                          const std::function<void(const TaloTaskText&)>& property) {
    // One statement sees one moment.
    Statement row(connection,
                  "SELECT pid, start, boot, finished, name, value FROM task"
                  " LEFT JOIN property ON property.task = task.number WHERE number = ?");
    bool found = false;
    for (row.Bind(number); row.Step(); found = true) {
        if (!found) {
            facts(FactsOf(row));
        }
        if (!row.IsNull(4)) {
            const char* value = row.Text(5);
            property({row.Text(4), value, row.TextSize(5)});
        }
    }
    return Answer(row, found);
}

TaloTaskAnswer HasProperty(Connection* connection, long long number, const std::string& name,
                           bool* has) {
    Statement statement(connection,
                        "SELECT EXISTS (SELECT 1 FROM property WHERE task = ?1 AND name = ?2)"
                        " FROM task WHERE number = ?1");
    const bool found = statement.Bind(number).Bind(name).Step();
    if (found) {
        *has = statement.Number(0) != 0;
    }
    return Answer(statement, found);
}

TaloTaskAnswer ListRecords(Connection* connection, const std::string& user,
                           const std::string& prefix, const std::function<void(const char*)>& id) {
    const std::string end = prefix + kAfterEveryId;
    Statement statement(connection,
                        "SELECT id FROM task WHERE user = ? AND id >= ? AND id < ?"
                        " ORDER BY number");
    statement.Bind(user).Bind(prefix).Bind(end);
    while (statement.Step()) {
        id(statement.Text(0));
    }
    return Answer(statement, true);
}

}  // namespace host
