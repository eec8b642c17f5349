#include "hosts/linux/task/RecordChanges.h"

#include <string.h>

#include "hosts/linux/task/Clock.h"
#include "hosts/linux/task/Statement.h"

namespace host {

namespace {

bool StoreProperty(Connection* connection, long long number, const TaloTaskText& property) {
    return Statement(connection, "INSERT OR REPLACE INTO property VALUES (?, ?, ?)")
        .Bind(number)
        .Bind(property.name, strlen(property.name))
        .Bind(property.text, property.size)
        .Run();
}

TaloTaskAnswer RecordIsThere(Connection* connection, long long number) {
    Statement statement(connection, "SELECT 1 FROM task WHERE number = ?");
    const bool found = statement.Bind(number).Step();
    if (!statement.IsGood()) {
        return kTaskFailed;
    }
    return found ? kTaskDone : kTaskMissing;
}

// Commits what `change` has done to a record that is there.
template <typename Change>
TaloTaskAnswer ChangeRecord(Connection* connection, long long number, Change change,
                            Lasting lasting = Lasting::kForGood) {
    Transaction transaction(connection, lasting);
    const TaloTaskAnswer there =
        transaction.HasBegun() ? RecordIsThere(connection, number) : kTaskFailed;
    if (there != kTaskDone) {
        return there;
    }
    return change() && transaction.Commit() ? kTaskDone : kTaskFailed;
}

}  // namespace

TaloTaskAnswer WriteProperties(Connection* connection, long long number,
                               const TaloTaskText* properties, size_t count) {
    return ChangeRecord(connection, number, [&] {
        for (size_t index = 0; index < count; ++index) {
            if (!StoreProperty(connection, number, properties[index])) {
                return false;
            }
        }
        return true;
    });
}

TaloTaskAnswer SetProcess(Connection* connection, long long number,
                          const TaloTaskProcess& process) {
    return ChangeRecord(connection, number, [&] {
        return Statement(connection,
                         "UPDATE task SET pid = ?, start = ?, boot = ? WHERE number = ?")
            .Bind(process.pid)
            .Bind(static_cast<long long>(process.start))
            .Bind(process.boot, strlen(process.boot))
            .Bind(number)
            .Run();
    });
}

TaloTaskAnswer FinishRecord(Connection* connection, long long number, bool autoRemove) {
    const char* text = autoRemove ? "true" : "false";
    return ChangeRecord(connection, number, [&] {
        return Statement(connection,
                         "UPDATE task SET finished = ?, auto_remove = ? WHERE number = ?")
                   .Bind(SecondsOfDay())
                   .Bind(autoRemove ? 1 : 0)
                   .Bind(number)
                   .Run() &&
               StoreProperty(connection, number, {"auto_remove", text, strlen(text)});
    });
}

TaloTaskAnswer RemoveRecord(Connection* connection, long long number) {
    return ChangeRecord(connection, number, [&] {
        return Statement(connection, "DELETE FROM property WHERE task = ?").Bind(number).Run() &&
               Statement(connection, "DELETE FROM task WHERE number = ?").Bind(number).Run();
    });
}

}  // namespace host
