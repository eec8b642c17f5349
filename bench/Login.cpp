#include <cstdio>
#include <string>

#include "Groups.h"
#include "Harness.h"
#include "Spawn.h"
#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/sdk/Sessions.h"

namespace bench {

namespace {

const char kUser[] = "bench";

// An account and a session for the run; both go at its end.
class Login {
  public:
    Login() {
        std::string problem;
        if (!talo::AddAccount(kUser, "a password of the bench", &problem)) {
            std::fprintf(stderr, "%s\n", problem.c_str());
        }
        talo::Session session;
        session.user = kUser;
        session.address = "127.0.0.1";
        ready_ = talo::CreateSession(session, &id_);
    }
    ~Login() {
        std::string problem;
        (void)talo::EndSession(id_);
        (void)talo::RemoveAccount(kUser, &problem);
    }
    Login(const Login&) = delete;
    Login& operator=(const Login&) = delete;
    bool IsReady() const {
        return ready_;
    }
    const std::string& Id() const {
        return id_;
    }

  private:
    std::string id_;
    bool ready_ = false;
};

std::string Compound(int elements) {
    std::string query = "api=TALO.Entry.Request&version=1&method=request&compound=[";
    for (int element = 0; element < elements; ++element) {
        query += element == 0 ? "" : ",";
        query += R"({"api":"TALO.System","version":2,"method":"info"})";
    }
    return query + "]";
}

}  // namespace

void Sessions() {
    const Login login;
    if (!login.IsReady()) {
        std::fprintf(stderr, "no session could be made\n");
        return;
    }
    const auto ping = Get("api=TALO.System&version=2&method=ping");
    const auto info = Get("api=TALO.System&version=2&method=info", login.Id());
    Compare("What a session check costs",
            {{"ping, no session", [&] { RunProcess(kEntry, ping); }},
             {"info under a session", [&] { RunProcess(kEntry, info); }}},
            101, 5);
    const auto one = Get(Compound(1), login.Id());
    const auto eleven = Get(Compound(11), login.Id());
    const auto hundred = Get(Compound(101), login.Id());
    Compare("Elements of a compound request",
            {{"1 element", [&] { RunProcess(kEntry, one); }},
             {"11 elements", [&] { RunProcess(kEntry, eleven); }},
             {"101 elements", [&] { RunProcess(kEntry, hundred); }}},
            51, 5);
}

}  // namespace bench
