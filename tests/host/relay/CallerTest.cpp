#include "hosts/linux/cgi/Caller.h"

#include "tests/host/cgi/Authorization.h"

namespace {

std::string CallerNow() {
    host::Caller caller = {"untouched", ""};
    return host::FindCaller(&caller) ? caller.user + "/" + caller.language : "no " + caller.user;
}

class Caller : public AuthorizationTest {
  protected:
    Caller() {
        session.user = "normal";
        session.address = "192.0.2.1";
        session.language = "ger";
    }
    talo::Session session;
};

TEST_F(Caller, IsTheUserOfTheSessionThatWasAcceptedLast) {
    EXPECT_EQ(CallerNow(), "no untouched");
    EXPECT_EQ(Ask(Open(session), kAll), 1);
    EXPECT_EQ(CallerNow(), "normal/ger");
    session.user = "boss";
    session.language = "";
    EXPECT_EQ(Ask(Open(session), kAll), 2);
    EXPECT_EQ(CallerNow(), "boss/");
}

TEST_F(Caller, IsNobodyWhoseSessionWasRefused) {
    EXPECT_EQ(Ask(UnusedId(), kAll), -2);
    EXPECT_EQ(CallerNow(), "no untouched");
    const std::string id = Open(session);
    MoveAway();
    EXPECT_EQ(Ask(id, kAll), -3);
    EXPECT_EQ(CallerNow(), "no untouched");
}

TEST_F(Caller, IsForgottenWithTheContextThatAcceptedHim) {
    TALOCGI other = {};
    EXPECT_EQ(TaloCgiInit("", &other), 0);
    EXPECT_EQ(Ask(Open(session), kAll), 1);
    TaloCgiFree(&other);
    EXPECT_EQ(CallerNow(), "normal/ger");
    TaloCgiFree(&ctx);
    EXPECT_EQ(CallerNow(), "no untouched");
}

}  // namespace
