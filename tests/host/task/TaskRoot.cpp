#include "TaskRoot.h"

#include <sqlite3.h>
#include <stdarg.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <stdexcept>

#include "platform/Paths.h"
#include "tests/support/Json.h"

namespace fs = std::filesystem;

namespace {

std::string& Log() {
    static std::string lines;
    return lines;
}

struct Closer {
    sqlite3* database = nullptr;
    ~Closer() {
        (void)sqlite3_close(database);
    }
};

// By the same SQLite as the module's: it has to know of every file that is open
// in the process.
std::string Query(const std::string& sql) {
    Closer closer;
    std::string answer;
    const auto take = [](void* out, int, char** values, char**) {
        std::string* text = static_cast<std::string*>(out);
        *text = text->empty() && values[0] != nullptr ? values[0] : *text;
        return 0;
    };
    char* problem = nullptr;
    (void)sqlite3_open(TaskRoot::Database().c_str(), &closer.database);
    (void)sqlite3_busy_timeout(closer.database, 10000);
    (void)sqlite3_db_config(closer.database, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 1, nullptr);
    if (sqlite3_exec(closer.database, sql.c_str(), take, &answer, &problem) != SQLITE_OK) {
        throw std::runtime_error(sql + ": " + problem);
    }
    return answer;
}

}  // namespace

// Stands before the C library's: what the host logs comes here.
extern "C" __attribute__((visibility("default"))) void syslog(int, const char* format, ...) {
    char line[2048];
    va_list arguments;
    va_start(arguments, format);
    (void)vsnprintf(line, sizeof line, format, arguments);
    va_end(arguments);
    Log() += std::string(line) + "\n";
}

bool WasLogged(const std::string& part) {
    return Log().find(part) != std::string::npos;
}

std::string Logged() {
    return Log();
}

void ClearTasks() {
    const fs::path module = fs::path(TALO_MODULE_DIR) / "talo-task.so";
    fs::remove_all(TALO_TASK_DIR);
    fs::remove_all(TALO_HOST_CONF);
    fs::create_directories(module.parent_path());
    if (!fs::exists(module)) {
        fs::copy_file(TASK_MODULE, module);
    }
    Log().clear();
}

int InProcess(const std::function<int()>& body) {
    return WaitFor(StartProcess(body));
}

pid_t StartProcess(const std::function<int()>& body) {
    const pid_t child = fork();
    if (child == 0) {
        const int status = body();
        (void)fflush(stdout);
        _exit(::testing::Test::HasFailure() ? 99 : status);
    }
    return child;
}

int WaitFor(pid_t process) {
    int status = -1;
    if (waitpid(process, &status, 0) != process) {
        return -1;
    }
    return WIFSIGNALED(status) ? 1000 + WTERMSIG(status) : WEXITSTATUS(status);
}

// A new file, since the old one may be in use.
static void PutModule(const char* built) {
    const fs::path module = fs::path(TALO_MODULE_DIR) / "talo-task.so";
    fs::create_directories(module.parent_path());
    fs::remove(module);
    fs::copy_file(built, module);
}

void TaskRoot::SetUp() {
    PutModule(TASK_MODULE);
    ClearTasks();
}

void TaskRoot::TearDown() {
    ClearTasks();
    PutModule(INSTALLED_TASK_MODULE);
}

void TaskRoot::Configure(const std::string& lines) {
    fs::create_directories(fs::path(TALO_HOST_CONF).parent_path());
    std::ofstream(TALO_HOST_CONF) << lines << "\n";
}

std::string TaskRoot::Database() {
    return TALO_TASK_DIR "/tasks.db";
}

void TaskRoot::Do(const std::string& sql) {
    (void)Query(sql);
}

std::string TaskRoot::Ask(const std::string& sql) {
    return Query(sql);
}

void TaskRoot::MakeSweepDue() {
    Do("UPDATE state SET value = 0");
}

Json::Value TaskRoot::Stored(const std::string& id, const char* property) {
    return ORB::Task("anna", id.c_str()).getProperty(property);
}

bool TaskRoot::IsFinished(const std::string& id) {
    return ORB::Task("anna", id.c_str()).isFinished();
}

bool TaskRoot::Begin(ORB::Task* task) {
    task->beginUpdate();
    (void)task->setProperty("info", support::Parse("{\"api\":\"TALO.Test\",\"param\":{}}"));
    (void)task->setProperty("auto_remove", true);
    return task->endUpdate();
}

bool TaskRoot::Report(ORB::Task* task) {
    task->beginUpdate();
    (void)task->setProperty("body", support::Parse("{\"success\":true,\"data\":{\"n\":1}}"));
    (void)task->setProperty("task_run", true);
    return task->endUpdate();
}

std::string TaskRoot::Id(const char* prefix) {
    return ORB::TaskUtil::getUniqueID("anna", prefix);
}
