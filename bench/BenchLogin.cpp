#include "BenchLogin.h"

#include <cstdio>

#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/sdk/Sessions.h"

namespace bench {

namespace {
const char kUser[] = "bench";
}

Login::Login() {
    std::string problem;
    if (!talo::AddAccount(kUser, "a password of the bench", &problem)) {
        std::fprintf(stderr, "%s\n", problem.c_str());
    }
    talo::Session session;
    session.user = kUser;
    session.address = "127.0.0.1";
    ready_ = talo::CreateSession(session, &id_);
}

std::string Login::User() {
    return kUser;
}

Login::~Login() {
    std::string problem;
    (void)talo::EndSession(id_);
    (void)talo::RemoveAccount(kUser, &problem);
}

}  // namespace bench
