#include "platform/Task.h"

#include <new>
#include <utility>
#include <vector>

#include "hosts/linux/task/NoThrow.h"
#include "hosts/linux/task/PropertyText.h"
#include "hosts/linux/task/SecretParams.h"
#include "hosts/linux/task/TaskName.h"
#include "hosts/linux/task/TaskRecord.h"
#include "hosts/linux/task/TaskStore.h"
#include "hosts/linux/util/HostLog.h"

namespace ORB {

namespace {

constexpr char kSource[] = "Task.cpp";
constexpr char kInfo[] = "info";

}  // namespace

struct Task::State {
    std::string user;
    std::string id;
    const TaloTaskModule* store = nullptr;  // null as long as there is no record
    long long number = 0;
    Json::Value secrets;
    host::TaskRecord record;

    bool updating = false;
    bool refused = false;
    std::map<std::string, std::string> batch;  // names and texts

    bool Open();
    bool Read();
    void EndBatch();
    bool Put(const char* name, const Json::Value& value);
    bool Store();
};

bool Task::State::Open() {
    if (!host::IsTaskUser(user) || !host::IsTaskId(id)) {
        HOST_LOG("no task can be had: \"%s\" of \"%s\" cannot be one", id.c_str(), user.c_str());
        return false;
    }
    const TaloTaskModule* module = host::TaskStore();
    // Between the two a remove can come.
    if (module == nullptr || module->find(user.c_str(), id.c_str(), 1, &number) != kTaskDone ||
        host::ReadTaskRecord(*module, number, &record) != kTaskDone) {
        return false;
    }
    store = module;
    return true;
}

bool Task::State::Read() {
    EndBatch();
    if (store == nullptr) {
        return false;
    }
    const int answer = host::ReadTaskRecord(*store, number, &record);
    if (answer == kTaskMissing) {
        record = host::TaskRecord();
    }
    return answer == kTaskDone;
}

void Task::State::EndBatch() {
    updating = false;
    refused = false;
    batch.clear();
}

bool Task::State::Put(const char* name, const Json::Value& value) {
    std::string text;
    if (name == nullptr || !host::IsPropertyName(name) ||
        !host::WriteProperty(
            std::string(name) == kInfo ? host::WithoutSecrets(value, secrets) : value, &text)) {
        HOST_LOG("a task cannot have this property: \"%s\"", name != nullptr ? name : "");
        refused = true;
        return false;
    }
    batch[name].swap(text);
    return true;
}

// What is stored is what the handle knows then, as if it had read it.
bool Task::State::Store() {
    std::vector<TaloTaskText> texts;
    std::map<std::string, Json::Value> values;
    for (const auto& entry : batch) {
        texts.push_back({entry.first.c_str(), entry.second.data(), entry.second.size()});
        if (!host::ReadProperty(entry.second.data(), entry.second.size(), &values[entry.first])) {
            return false;
        }
    }
    if (store->write(number, texts.data(), texts.size()) != kTaskDone) {
        return false;
    }
    for (auto& entry : values) {
        record.properties[entry.first].swap(entry.second);
    }
    return true;
}

Task::Task(const char* user, const char* taskId) {
    (void)host::NoThrow(false, [&] {
        state = std::make_unique<State>();
        state->user = user != nullptr ? user : "";
        state->id = taskId != nullptr ? taskId : "";
        return state->Open();
    });
}

Task::~Task() {}

bool Task::isValid() const {
    return state != nullptr && state->store != nullptr;
}

const char* Task::getTaskId() const {
    return state != nullptr ? state->id.c_str() : "";
}

void Task::setSecretParams(const Json::Value& names) {
    (void)host::NoThrow(false, [&] {
        if (state != nullptr) {
            state->secrets = names;
        }
        return true;
    });
}

void Task::beginUpdate() {
    if (isValid()) {
        state->updating = true;
    }
}

bool Task::setProperty(const char* name, const Json::Value& value) {
    if (!isValid()) {
        return false;
    }
    if (state->updating) {
        const bool put = host::NoThrow(false, [&] { return state->Put(name, value); });
        state->refused = state->refused || !put;
        return put;
    }
    const bool stored =
        host::NoThrow(false, [&] { return state->Put(name, value) && state->Store(); });
    state->EndBatch();
    return stored;
}

bool Task::endUpdate() {
    if (!isValid() || !state->updating) {
        return false;
    }
    const bool stored = !state->refused && host::NoThrow(false, [&] { return state->Store(); });
    state->EndBatch();
    return stored;
}

bool Task::hasProperty(const char* name) const {
    return host::NoThrow(false, [&] {
        return isValid() && name != nullptr && state->record.properties.count(name) != 0;
    });
}

Json::Value Task::getProperty(const char* name) const {
    return host::NoThrow(Json::Value(), [&] {
        if (!isValid() || name == nullptr) {
            return Json::Value();
        }
        const auto found = state->record.properties.find(name);
        return found != state->record.properties.end() ? found->second : Json::Value();
    });
}

bool Task::getBoolProperty(const char* name, bool fallback) const {
    return host::NoThrow(fallback, [&] {
        const Json::Value value = getProperty(name);
        return value.isBool() ? value.asBool() : fallback;
    });
}

bool Task::setCreatePid(int pid) {
    return isValid() &&
           state->store->setProcess(state->number, pid, &state->record.process) == kTaskDone;
}

int Task::getCreatePid() const {
    return isValid() && state->store->lives(&state->record.process) == kTaskDone
               ? state->record.process.pid
               : 0;
}

bool Task::reload() {
    return state != nullptr && host::NoThrow(false, [&] { return state->Read(); });
}

bool Task::waitForDataReady(const char* property, unsigned long timeout) {
    return host::NoThrow(false, [&] {
        if (!isValid() || property == nullptr || !host::IsPropertyName(property)) {
            return false;
        }
        const int answer = state->store->wait(state->number, property, timeout);
        return state->Read() && answer == kTaskDone;
    });
}

bool Task::finish(bool autoRemove) {
    return host::NoThrow(false, [&] {
        if (!isValid() || state->store->finish(state->number, autoRemove ? 1 : 0) != kTaskDone) {
            return false;
        }
        state->record.finished = true;
        state->record.properties["auto_remove"] = autoRemove;
        return true;
    });
}

bool Task::isFinished() const {
    return isValid() && state->record.finished;
}

bool Task::remove() {
    return host::NoThrow(false, [&] {
        if (!isValid() || state->store->remove(state->number) == kTaskFailed) {
            return false;
        }
        state->EndBatch();
        state->record = host::TaskRecord();
        return true;
    });
}

}  // namespace ORB
