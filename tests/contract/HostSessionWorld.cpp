#include <fcntl.h>
#include <stdlib.h>
#include <sys/stat.h>

#include <filesystem>
#include <stdexcept>

#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/sdk/Sessions.h"
#include "platform/Paths.h"
#include "tests/contract/SessionWorld.h"

namespace fs = std::filesystem;

namespace {

constexpr char kAddress[] = "192.0.2.1";

void Require(bool done, const std::string& problem) {
    if (!done) {
        throw std::runtime_error(problem);
    }
}

// Accounts and sessions of the private root.
class HostSessionWorld : public SessionWorld {
  public:
    HostSessionWorld() {
        Clear();
        fs::create_directories(fs::path(TALO_ACCOUNTS_FILE).parent_path());
        (void)setenv("HTTP_HOST", "nas.local", 1);
        (void)setenv("REMOTE_ADDR", kAddress, 1);
    }
    ~HostSessionWorld() override {
        Clear();
    }

    std::string LogIn(const Login& login) override {
        MakeAccount(login);
        talo::Session session;
        session.user = login.user;
        session.address = kAddress;
        session.skipAddress = login.exempt;
        session.language = login.language;
        session.application = login.application;
        session.privilege = login.privilege;
        session.timeout = login.timeout;
        std::string id;
        Require(talo::CreateSession(session, &id), "no session");
        return id;
    }
    void TimeOut(const std::string& id) override {
        const struct timespec longAgo[2] = {{1000000000, 0}, {1000000000, 0}};
        Require(utimensat(AT_FDCWD, FileOf(id).c_str(), longAgo, 0) == 0, "no such file");
    }
    void LogOut(const std::string& id) override {
        Require(talo::EndSession(id), "no such session");
    }
    void RemoveAccount(const std::string& id) override {
        talo::Session session;
        std::string problem;
        Require(talo::FindSession(id, &session), "no such session");
        Require(talo::RemoveAccount(session.user, &problem), problem);
    }
    void AskFromAnotherAddress(const std::string&) override {
        ComeFrom("203.0.113.5");
    }
    void AskFromAnotherSite(const std::string&) override {
        (void)setenv("HTTP_ORIGIN", "http://evil.example", 1);
    }
    void ComeFrom(const std::string& address) override {
        (void)setenv("REMOTE_ADDR", address.c_str(), 1);
    }
    void Grant(const std::string& user, const std::string& privilege) override {
        std::string problem;
        Require(talo::GrantPrivilege(user, privilege, "", &problem), problem);
    }
    int UidOf(const std::string& user) override {
        talo::Account account;
        Require(talo::FindAccount(user, &account), "no such account");
        return static_cast<int>(account.uid);
    }
    std::string FileOf(const std::string& id) override {
        return fs::canonical(TALO_SESSION_DIR) / id;
    }

  private:
    static void MakeAccount(const Login& login) {
        talo::Account known;
        std::string problem;
        if (!talo::FindAccount(login.user, &known)) {
            Require(talo::AddAccount(login.user, "password", &problem), problem);
        }
        if (login.administrator) {
            Require(talo::SetGroups(login.user, {"administrators"}, &problem), problem);
        }
    }
    static void Clear() {
        for (const char* variable : {"REMOTE_ADDR", "HTTP_HOST", "HTTP_ORIGIN",
                                     "HTTP_SEC_FETCH_SITE", "HTTP_X_FORWARDED_FOR"}) {
            (void)unsetenv(variable);
        }
        for (const char* path :
             {TALO_SESSION_DIR, TALO_ACCOUNTS_FILE, TALO_ACCOUNTS_FILE ".lock", TALO_HOST_CONF}) {
            fs::remove_all(path);
        }
    }
};

}  // namespace

std::unique_ptr<SessionWorld> MakeSessionWorld() {
    return std::make_unique<HostSessionWorld>();
}
