#include "AccountRoot.h"

#include <stdarg.h>
#include <sys/stat.h>
#include <syslog.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>

#include "platform/Paths.h"

namespace fs = std::filesystem;

namespace {

std::vector<std::string>& Lines() {
    static std::vector<std::string> lines;
    return lines;
}

}  // namespace

// Stands before the C library's: what the host logs comes here.
extern "C" void syslog(int, const char* format, ...) {
    char line[2048];
    va_list arguments;
    va_start(arguments, format);
    (void)vsnprintf(line, sizeof line, format, arguments);
    va_end(arguments);
    Lines().push_back(line);
}

const std::vector<std::string>& Logged() {
    return Lines();
}

bool WasLogged(const std::string& part) {
    for (const std::string& line : Lines()) {
        if (line.find(part) != std::string::npos) {
            return true;
        }
    }
    return false;
}

std::string ReadFile(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(file), {});
}

void WriteFile(const std::string& path, const std::string& content) {
    fs::create_directories(fs::path(path).parent_path());
    std::ofstream(path, std::ios::binary) << content;
}

void AccountRoot::SetUp() {
    fs::remove_all(ACCOUNT_ROOT);
    fs::create_directories(TALO_MODULE_DIR);
    fs::create_symlink(PASSWORD_MODULE, std::string(TALO_MODULE_DIR) + "talo-password.so");
    Lines().clear();
}

void AccountRoot::TearDown() {
    fs::remove_all(ACCOUNT_ROOT);
}

void AccountRoot::WriteAccounts(const std::string& content) {
    WriteFile(TALO_ACCOUNTS_FILE, content);
    ASSERT_EQ(0, chmod(TALO_ACCOUNTS_FILE, 0600));
}

std::string AccountRoot::ReadAccounts() {
    return ReadFile(TALO_ACCOUNTS_FILE);
}

void AccountRoot::Configure(const std::string& line) {
    WriteFile(TALO_HOST_CONF, line + "\n");
}

std::string AccountRoot::Line(const std::string& name, unsigned uid, const std::string& more) {
    return "{\"name\":\"" + name + "\",\"uid\":" + std::to_string(uid) +
           (more.empty() ? "" : "," + more) + "}\n";
}
