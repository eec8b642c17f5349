#ifndef TESTS_HOST_CGI_AUTHORIZATION_H
#define TESTS_HOST_CGI_AUTHORIZATION_H

#include <cstring>
#include <string>

#include "platform/Cgi.h"
#include "tests/host/cgi/SessionFixture.h"

// Asks for the right of a session, from the appliance's own page at the address
// that it was opened from.
class AuthorizationTest : public SessionTest {
  protected:
    AuthorizationTest() : ctx() {
        host.AddAccount("normal");
        host.AddAdministrator("boss");
        host.Say("REMOTE_ADDR", "192.0.2.1");
        host.Say("HTTP_HOST", "nas.local");
        host.Say("HTTP_ORIGIN", "http://nas.local");
        Prepare();
    }
    ~AuthorizationTest() override {
        TaloCgiFree(&ctx);
    }

    void Prepare() {
        TaloCgiFree(&ctx);
        ASSERT_EQ(TaloCgiInit("", &ctx), 0);
    }

    void PrepareEx(int timeout, int allowTimeout) {
        TaloCgiFree(&ctx);
        ASSERT_EQ(TaloCgiInitEx(&ctx, timeout, allowTimeout, "current.users", ""), 0);
    }

    int Ask(const std::string& id, int mask, int allowTimeout = 0) {
        const TALOCGIAUTHREQUEST request = {mask, allowTimeout};
        std::memset(name, '#', sizeof name);
        return TaloCgiIsAuthorizedEx(&ctx, id.c_str(), name, sizeof name, &request, 0);
    }

    // Nothing of a refused session shows.
    bool IsUntouched() const {
        return std::string(name, sizeof name) == std::string(sizeof name, '#') &&
               std::string(ctx.sessionFile).empty() &&
               TaloCgiGetOption(const_cast<TALOCGI*>(&ctx), 7, nullptr) == nullptr;
    }

    void MoveAway() {
        host.Say("REMOTE_ADDR", "203.0.113.5");
    }
    void ComeFromElsewhere() {
        host.Say("HTTP_ORIGIN", "http://evil.example");
    }

    static constexpr int kAll = 15;
    TALOCGI ctx;
    char name[64];
};

#endif
