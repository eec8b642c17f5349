#include "hosts/linux/task/TaskModule.h"

#include <string.h>

#include <exception>
#include <string>

#include "hosts/linux/task/NewId.h"
#include "hosts/linux/task/OpenedStore.h"
#include "hosts/linux/task/ProcessIdentity.h"
#include "hosts/linux/task/RecordChanges.h"
#include "hosts/linux/task/Records.h"
#include "hosts/linux/task/Wait.h"
#include "hosts/linux/util/HostLog.h"
#include "platform/Platform.h"

namespace {

constexpr char kSource[] = "TaskModule.cpp";

template <typename Step>
int Guarded(Step step) {
    try {
        return step();
    } catch (const std::exception& problem) {
        HOST_LOG("the task store failed: %s", problem.what());
        return kTaskFailed;
    }
}

// A step with the connection; what cannot be opened was logged.
template <typename Step>
int WithStore(Step step) {
    return Guarded([&]() -> int {
        const host::OpenedStore store;
        return store.Get() != nullptr ? step(store.Get()) : kTaskFailed;
    });
}

void Use(const TaloTaskHost* taken) {
    (void)Guarded([&] {
        host::UseStoreOf(taken);
        return kTaskDone;
    });
}

int Find(const char* user, const char* id, int make, long long* number) {
    return WithStore([&](host::Connection* connection) {
        const TaloTaskAnswer found = host::FindRecord(connection, user, id, number);
        return found == kTaskMissing && make != 0 ? host::MakeRecord(connection, user, id, number)
                                                  : found;
    });
}

int Read(long long number, void* context, void (*facts)(void*, const TaloTaskFacts*),
         void (*property)(void*, const TaloTaskText*)) {
    return WithStore([&](host::Connection* connection) {
        return host::ReadRecord(
            connection, number, [&](const TaloTaskFacts& read) { facts(context, &read); },
            [&](const TaloTaskText& read) { property(context, &read); });
    });
}

int Write(long long number, const TaloTaskText* properties, size_t count) {
    return WithStore([&](host::Connection* connection) {
        return host::WriteProperties(connection, number, properties, count);
    });
}

int SetProcess(long long number, int pid, TaloTaskProcess* process) {
    return WithStore([&](host::Connection* connection) {
        TaloTaskProcess found = {};
        if (!host::IdentifyProcess(pid, &found)) {
            HOST_LOG("a task cannot be run by process %d: it does not live", pid);
            return kTaskMissing;
        }
        const TaloTaskAnswer answer = host::SetProcess(connection, number, found);
        if (answer == kTaskDone) {
            *process = found;
        }
        return answer;
    });
}

int Finish(long long number, int autoRemove) {
    return WithStore([&](host::Connection* connection) {
        return host::FinishRecord(connection, number, autoRemove != 0);
    });
}

int Remove(long long number) {
    return WithStore(
        [&](host::Connection* connection) { return host::RemoveRecord(connection, number); });
}

int Lives(const TaloTaskProcess* process) {
    return Guarded([&] { return host::ProcessLives(*process) ? kTaskDone : kTaskMissing; });
}

int Wait(long long number, const char* property, unsigned long seconds) {
    return Guarded([&] { return host::WaitForProperty(number, property, seconds); });
}

int List(const char* user, const char* prefix, void* context, void (*id)(void*, const char*)) {
    return WithStore([&](host::Connection* connection) {
        return host::ListRecords(connection, user, prefix,
                                 [&](const char* found) { id(context, found); });
    });
}

int NewId(const char* user, const char* prefix, char* id, size_t size) {
    return WithStore([&](host::Connection* connection) {
        std::string made;
        const TaloTaskAnswer answer = host::MakeNewId(connection, user, prefix, &made);
        if (answer != kTaskDone || made.size() >= size) {
            return kTaskFailed;
        }
        memcpy(id, made.c_str(), made.size() + 1);
        return kTaskDone;
    });
}

}  // namespace

extern "C" {
extern TALO_PLATFORM const TaloTaskModule taloTaskModule;
const TaloTaskModule taloTaskModule = {Use,    Find,  Read, Write, SetProcess, Finish,
                                       Remove, Lives, Wait, List,  NewId};
}
