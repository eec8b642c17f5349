#include "tests/host/cgi/SessionFixture.h"

#include <fcntl.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <time.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <stdexcept>

#include "hosts/linux/account/AccountFile.h"
#include "hosts/linux/account/Password.h"
#include "platform/Paths.h"

namespace fs = std::filesystem;

namespace {

constexpr char kAccountsLock[] = TALO_ACCOUNTS_FILE ".lock";

constexpr const char* kVariables[] = {"REMOTE_ADDR", "HTTP_X_FORWARDED_FOR",
                                      "HTTP_ORIGIN", "HTTP_SEC_FETCH_SITE",
                                      "HTTP_HOST",   "HTTP_COOKIE"};

void Clear() {
    for (const char* variable : kVariables) {
        (void)unsetenv(variable);
    }
    for (const char* path :
         {TALO_SESSION_DIR, TALO_THROTTLE_DIR, TALO_ACCOUNTS_FILE, kAccountsLock, TALO_HOST_CONF}) {
        fs::remove_all(path);
    }
}

}  // namespace

Host::Host() {
    Clear();
    fs::create_directories(fs::path(TALO_HOST_CONF).parent_path());
}

Host::~Host() {
    Clear();
}

void Host::Say(const std::string& name, const std::string& value) {
    (void)setenv(name.c_str(), value.c_str(), 1);
}

void Host::SayNothingOf(const std::string& name) {
    (void)unsetenv(name.c_str());
}

void Host::Configure(const std::string& lines) {
    std::ofstream(TALO_HOST_CONF, std::ios::binary) << lines;
}

void Host::AddAccount(const std::string& name) {
    std::string problem;
    ASSERT_TRUE(host::AppendToFile(TALO_ACCOUNTS_FILE, name, host::kDummyHash, &problem))
        << problem;
}

void Host::AddAdministrator(const std::string& name) {
    std::string problem;
    AddAccount(name);
    ASSERT_TRUE(talo::SetGroups(name, {"administrators"}, &problem)) << problem;
}

SessionTest::SessionTest() {
    char folder[] = "/dev/shm/session-test-XXXXXX";
    if (mkdtemp(folder) == nullptr) {
        throw std::runtime_error("no folder in memory");
    }
    folder_ = folder;
    fs::create_directories(fs::path(TALO_SESSION_DIR).parent_path());
    fs::create_directory_symlink(folder_, TALO_SESSION_DIR);
}

SessionTest::~SessionTest() {
    fs::remove_all(folder_);
}

std::string SessionTest::Open(const std::string& user) {
    talo::Session session;
    session.user = user;
    session.address = "192.0.2.1";
    return Open(session);
}

std::string SessionTest::Open(const talo::Session& session) {
    std::string id;
    EXPECT_TRUE(talo::CreateSession(session, &id));
    return id;
}

std::string SessionTest::PathOf(const std::string& name) const {
    return folder_ + "/" + name;
}

std::vector<std::string> SessionTest::Names() const {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(folder_)) {
        names.push_back(entry.path().filename());
    }
    std::sort(names.begin(), names.end());
    return names;
}

void SessionTest::Write(const std::string& name, const std::string& content) const {
    std::ofstream(PathOf(name), std::ios::binary) << content;
}

std::string SessionTest::Read(const std::string& name) const {
    std::ifstream file(PathOf(name), std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void SessionTest::LeaveUnused(const std::string& name, long long seconds) const {
    struct timespec times[2] = {};
    times[0].tv_sec = times[1].tv_sec = time(nullptr) - static_cast<time_t>(seconds);
    ASSERT_EQ(utimensat(AT_FDCWD, PathOf(name).c_str(), times, AT_SYMLINK_NOFOLLOW), 0);
}

bool SessionTest::Exists(const std::string& id) {
    talo::Session session;
    return talo::FindSession(id, &session);
}

std::string UnusedId() {
    return "s" + std::string(43, 'A');
}
