#include "hosts/linux/task/TaskRecord.h"

#include <exception>
#include <utility>

#include "hosts/linux/task/PropertyText.h"
#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {

constexpr char kSource[] = "TaskRecord.cpp";

// The module does not see exceptions.
struct Reading {
    TaskRecord record;
    bool failed = false;
};

void TakeFacts(void* context, const TaloTaskFacts* facts) {
    TaskRecord& record = static_cast<Reading*>(context)->record;
    record.process = facts->process;
    record.finished = facts->finished != 0;
}

void TakeProperty(void* context, const TaloTaskText* property) {
    Reading* reading = static_cast<Reading*>(context);
    try {
        Json::Value value;
        if (!ReadProperty(property->text, property->size, &value)) {
            HOST_LOG("the property \"%s\" of a task is damaged", property->name);
            return;
        }
        reading->record.properties[property->name].swap(value);
    } catch (const std::exception& problem) {
        HOST_LOG("a task cannot be read: %s", problem.what());
        reading->failed = true;
    }
}

}  // namespace

int ReadTaskRecord(const TaloTaskModule& store, long long number, TaskRecord* record) {
    Reading reading;
    const int answer = store.read(number, &reading, TakeFacts, TakeProperty);
    if (reading.failed) {
        return kTaskFailed;
    }
    if (answer == kTaskDone) {
        *record = std::move(reading.record);
    }
    return answer;
}

}  // namespace host
