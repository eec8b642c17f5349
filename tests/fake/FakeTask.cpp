#include "tests/fake/FakeTask.h"

#include <signal.h>
#include <stdio.h>
#include <string.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <map>
#include <set>
#include <thread>

#include "platform/Task.h"
#include "tests/fake/FakePlatform.h"
#include "tests/fake/SharedDocument.h"

namespace fake {

namespace {

constexpr int kMaxCalls = 20000;
constexpr size_t kMaxPrefix = 64;
constexpr size_t kMaxId = 127;
constexpr std::chrono::milliseconds kPause(1);
const char kMask[] = "*****";

// What the processes have asked for. Entries past the last are not kept.
struct CallLog {
    std::atomic<int> size;
    struct Entry {
        int pid;
        char operation[32];
        char detail[96];
    } entries[kMaxCalls];
};

CallLog* Log() {
    static CallLog* const log = [] {
        void* room = mmap(nullptr, sizeof(CallLog), PROT_READ | PROT_WRITE,
                          MAP_SHARED | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
        return static_cast<CallLog*>(room);
    }();
    return log;
}

SharedDocument& Store() {
    static SharedDocument document;
    return document;
}

// Whether this operation is to fail.
bool Fails(const char* operation, const std::string& detail = "") {
    CallLog* log = Log();
    const int place = log->size++;
    if (place < kMaxCalls) {
        CallLog::Entry& entry = log->entries[place];
        entry.pid = getpid();
        (void)snprintf(entry.operation, sizeof entry.operation, "%s", operation);
        (void)snprintf(entry.detail, sizeof entry.detail, "%s", detail.c_str());
    }
    const bool planned = ++Tasks().operations == Tasks().failOperation;
    if (Tasks().operations == Tasks().killOperation) {
        (void)raise(SIGKILL);
    }
    return Now().Called(operation) || planned;
}

// When a process began, in ticks since the machine's start; 0 when there is no
// such process, or only what is left until its parent asks for it.
unsigned long long StartTime(int pid) {
    char line[1024] = {};
    FILE* file = fopen(("/proc/" + std::to_string(pid) + "/stat").c_str(), "re");
    if (pid <= 0 || file == nullptr) {
        return 0;
    }
    const bool read = fgets(line, sizeof line, file) != nullptr;
    (void)fclose(file);
    const char* rest = read ? strrchr(line, ')') : nullptr;
    char state = 'Z';
    unsigned long long start = 0;
    if (rest == nullptr ||
        sscanf(rest,
               ") %c %*d %*d %*d %*d %*d %*u %*u %*u %*u %*u %*u %*u %*d %*d %*d %*d %*d %*d"
               " %llu",
               &state, &start) != 2) {
        return 0;
    }
    return state == 'Z' || state == 'X' ? 0 : start;
}

void SetPid(Json::Value* record, int pid) {
    (*record)["pid"] = pid;
    (*record)["start"] = Json::UInt64(StartTime(pid));
}

int NextNumber(Json::Value* document) {
    const int number = (*document)["made"].asInt() + 1;
    (*document)["made"] = number;
    return number;
}

bool IsName(const std::string& text, size_t most) {
    return text.size() <= most && text.find_first_not_of(
                                      "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ"
                                      "0123456789_-.") == std::string::npos;
}

std::string Text(const char* text) {
    return text == nullptr ? "" : text;
}

Json::Value* Find(Json::Value* document, const std::string& user, const std::string& id) {
    Json::Value& users = (*document)["users"];
    return users.isMember(user) && users[user].isMember(id) ? &users[user][id] : nullptr;
}

Json::Value NewRecord(int number = 0) {
    Json::Value record(Json::objectValue);
    record["number"] = number;  // in the order of their making
    record["properties"] = Json::Value(Json::objectValue);
    record["pid"] = 0;
    record["finished"] = false;
    return record;
}

}  // namespace

TaskScript& Tasks() {
    static TaskScript script;
    return script;
}

std::vector<TaskCall> TaskCalls() {
    std::vector<TaskCall> calls;
    const int size = std::min<int>(Log()->size, kMaxCalls);
    for (int index = 0; index < size; ++index) {
        const CallLog::Entry& entry = Log()->entries[index];
        calls.push_back({entry.pid, entry.operation, entry.detail});
    }
    return calls;
}

Json::Value TaskRecord(const std::string& user, const std::string& id) {
    Json::Value document = Store().Read();
    const Json::Value* record = Find(&document, user, id);
    return record == nullptr ? Json::Value() : *record;
}

void PutTask(const std::string& user, const std::string& id, const Json::Value& properties, int pid,
             bool finished) {
    (void)Store().Change([&](Json::Value* document) {
        Json::Value record = NewRecord(NextNumber(document));
        record["properties"] = properties;
        record["finished"] = finished;
        if (pid != 0) {
            SetPid(&record, pid);
        }
        (*document)["users"][user][id] = record;
        return true;
    });
}

std::vector<std::string> TaskIds(const std::string& user) {
    const Json::Value document = Store().Read();
    const Json::Value& records = document["users"][user];
    std::map<int, std::string> ids;
    for (auto record = records.begin(); record != records.end(); ++record) {
        ids[(*record)["number"].asInt()] = record.name();
    }
    std::vector<std::string> ordered;
    for (const auto& entry : ids) {
        ordered.push_back(entry.second);
    }
    return ordered;
}

void ResetTasks() {
    Tasks() = TaskScript();
    Log()->size = 0;
    // The numbers go on, so that a process left over from before finds its record gone.
    (void)Store().Change([](Json::Value* document) {
        const Json::Value made = (*document)["made"];
        *document = Json::Value(Json::objectValue);
        (*document)["made"] = made;
        return true;
    });
}

}  // namespace fake

namespace ORB {

using fake::Fails;
using fake::Store;

// A handle reads what it saw last: when it was made, stored something, reloaded
// or waited.
struct Task::State {
    std::string user;
    std::string id;
    int number = 0;  // of the record: another one of the same id is not the handle's
    bool valid = false;
    bool batch = false;
    bool batchFailed = false;
    std::set<std::string> secrets;
    Json::Value pending = Json::Value(Json::objectValue);
    Json::Value record = fake::NewRecord();

    // Changes the stored record, if there still is one, and looks at it.
    template <typename Action>
    bool Change(Action action) {
        return valid && Store().Change([&](Json::Value* document) {
            Json::Value* stored = fake::Find(document, user, id);
            if (stored == nullptr || (*stored)["number"] != number) {
                return false;
            }
            action(stored);
            record = *stored;
            return true;
        });
    }

    bool Look() {
        const Json::Value stored = fake::TaskRecord(user, id);
        const bool found = valid && !stored.isNull() && stored["number"] == number;
        record = found ? stored : fake::NewRecord();
        batch = false;
        return found;
    }

    Json::Value Masked(const std::string& name, const Json::Value& value) const {
        Json::Value masked = value;
        if (name == "info" && value.isObject() && value["param"].isObject()) {
            for (const std::string& parameter : value["param"].getMemberNames()) {
                if (parameter == "_sid" || parameter == "passwd" || secrets.count(parameter) != 0) {
                    masked["param"][parameter] = fake::kMask;
                }
            }
        }
        return masked;
    }

    bool Write(const Json::Value& properties) {
        return Change([&](Json::Value* stored) {
            for (const std::string& name : properties.getMemberNames()) {
                (*stored)["properties"][name] = properties[name];
            }
        });
    }
};

Task::Task(const char* user, const char* taskId) : state(std::make_unique<State>()) {
    state->user = fake::Text(user);
    state->id = fake::Text(taskId);
    if (Fails("Task.Task", state->user + " " + state->id) || state->user.empty() ||
        state->id.empty() || !fake::IsName(state->id, fake::kMaxId)) {
        return;
    }
    state->valid = true;
    (void)Store().Change([&](Json::Value* document) {
        Json::Value& record = (*document)["users"][state->user][state->id];
        if (record.isNull()) {
            record = fake::NewRecord(fake::NextNumber(document));
        }
        state->record = record;
        state->number = record["number"].asInt();
        return true;
    });
}

Task::~Task() {
    (void)Fails("Task.~Task");
}

bool Task::isValid() const {
    return state->valid;
}

const char* Task::getTaskId() const {
    return state->id.c_str();
}

void Task::setSecretParams(const Json::Value& names) {
    (void)Fails("Task.setSecretParams");
    state->secrets.clear();
    if (names.isArray()) {
        for (const Json::Value& name : names) {
            if (name.isString()) {
                state->secrets.insert(name.asString());
            }
        }
    }
}

void Task::beginUpdate() {
    (void)Fails("Task.beginUpdate");
    state->batch = true;
    state->batchFailed = false;
    state->pending = Json::Value(Json::objectValue);
}

bool Task::setProperty(const char* name, const Json::Value& value) {
    if (Fails("Task.setProperty", name)) {
        state->batchFailed = true;
        return false;
    }
    Json::Value change(Json::objectValue);
    change[name] = state->Masked(name, value);
    if (!state->batch) {
        return state->Write(change);
    }
    state->pending[name] = change[name];
    return state->valid;
}

bool Task::endUpdate() {
    const bool open = state->batch && !state->batchFailed;
    state->batch = false;
    return !Fails("Task.endUpdate") && open && state->Write(state->pending);
}

bool Task::hasProperty(const char* name) const {
    return state->record["properties"].isMember(name);
}

Json::Value Task::getProperty(const char* name) const {
    return hasProperty(name) ? state->record["properties"][name] : Json::Value();
}

bool Task::getBoolProperty(const char* name, bool fallback) const {
    (void)Fails("Task.getBoolProperty", name);
    const Json::Value value = getProperty(name);
    return value.isBool() ? value.asBool() : fallback;
}

bool Task::setCreatePid(int pid) {
    return !Fails("Task.setCreatePid", std::to_string(pid)) && fake::StartTime(pid) != 0 &&
           state->Change([&](Json::Value* stored) { fake::SetPid(stored, pid); });
}

int Task::getCreatePid() const {
    const int pid = state->record["pid"].asInt();
    const unsigned long long start = fake::StartTime(pid);
    const bool lives = start != 0 && start == state->record["start"].asUInt64();
    return !Fails("Task.getCreatePid") && (lives || fake::Tasks().answersDeadPids) ? pid : 0;
}

bool Task::reload() {
    return !Fails("Task.reload") && state->Look();
}

bool Task::waitForDataReady(const char* property, unsigned long timeout) {
    if (Fails("Task.waitForDataReady", fake::Text(property) + " " + std::to_string(timeout))) {
        return false;
    }
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(timeout);
    while (state->Look() && !hasProperty(property)) {
        if (fake::Tasks().waitsPassAtOnce || std::chrono::steady_clock::now() >= end) {
            return false;
        }
        std::this_thread::sleep_for(fake::kPause);
    }
    return hasProperty(property);
}

// Whoever settles last whether the record may go early is who counts.
bool Task::finish(bool autoRemove) {
    return !Fails("Task.finish", autoRemove ? "true" : "false") &&
           state->Change([&](Json::Value* stored) {
               (*stored)["finished"] = true;
               (*stored)["properties"]["auto_remove"] = autoRemove;
           });
}

bool Task::isFinished() const {
    return state->record["finished"].asBool();
}

bool Task::remove() {
    if (Fails("Task.remove") || !state->valid) {
        return false;
    }
    state->record = fake::NewRecord();
    return Store().Change([&](Json::Value* document) {
        const Json::Value* stored = fake::Find(document, state->user, state->id);
        if (stored != nullptr && (*stored)["number"] == state->number) {
            (*document)["users"][state->user].removeMember(state->id);
        }
        return true;
    });
}

struct TaskMgr::State {
    std::string user;
    bool valid = false;
};

TaskMgr::TaskMgr(const char* user) : state(std::make_unique<State>()) {
    state->user = fake::Text(user);
    state->valid = !Fails("TaskMgr.TaskMgr", state->user) && !state->user.empty();
}

TaskMgr::~TaskMgr() = default;

bool TaskMgr::isValid() const {
    return state->valid;
}

Json::Value TaskMgr::getAllTaskId(const char* prefix) const {
    Json::Value ids(Json::arrayValue);
    if (Fails("TaskMgr.getAllTaskId", prefix == nullptr ? "(null)" : prefix) || !state->valid) {
        return ids;
    }
    const std::string wanted = fake::Text(prefix);
    for (const std::string& id : fake::TaskIds(state->user)) {
        if (id.compare(0, wanted.size(), wanted) == 0) {
            ids.append(id);
        }
    }
    return ids;
}

std::string TaskUtil::getUniqueID(const char* user, const char* prefix) {
    const std::string begin = fake::Text(prefix);
    if (Fails("TaskUtil.getUniqueID", fake::Text(user) + " " + begin) || fake::Text(user).empty() ||
        !fake::IsName(begin, fake::kMaxPrefix)) {
        return "";
    }
    std::string id;
    (void)Store().Change([&](Json::Value* document) {
        const int number = (*document)["ids"].asInt() + 1;
        (*document)["ids"] = number;
        char text[16];
        (void)snprintf(text, sizeof text, "t%08d", number);
        id = begin + text;
        return true;
    });
    return id;
}

bool TaskUtil::checkTaskExists(const char* user, const char* taskId) {
    return !Fails("TaskUtil.checkTaskExists", fake::Text(user) + " " + fake::Text(taskId)) &&
           !fake::TaskRecord(fake::Text(user), fake::Text(taskId)).isNull();
}

}  // namespace ORB
