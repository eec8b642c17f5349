#include <string>

#include "hosts/linux/sdk/Accounts.h"
#include "tests/host/cgi/Authorization.h"

namespace {

class Authorize : public AuthorizationTest {
  protected:
    // A session of one whose address is not checked.
    std::string OpenExempt() {
        talo::Session session;
        session.user = "normal";
        session.address = "192.0.2.1";
        session.skipAddress = true;
        return Open(session);
    }
};

TEST_F(Authorize, TellsAUserFromAnAdministrator) {
    EXPECT_EQ(Ask(Open("normal"), kAll), 1);
    EXPECT_STREQ(name, "normal");
    EXPECT_EQ(Ask(Open("boss"), kAll), 2);
    EXPECT_STREQ(name, "boss");
}

TEST_F(Authorize, SeesAGroupThatAnAccountGotOrLostMeanwhile) {
    const std::string id = Open("normal");
    std::string problem;
    ASSERT_TRUE(talo::SetGroups("normal", {"administrators"}, &problem)) << problem;
    EXPECT_EQ(Ask(id, kAll), 2);
    ASSERT_TRUE(talo::SetGroups("normal", {}, &problem)) << problem;
    EXPECT_EQ(Ask(id, kAll), 1);
}

TEST_F(Authorize, RefusesATimedOutSessionWithMinus1) {
    const std::string id = Open();
    LeaveUnused(id, 31 * 60);
    EXPECT_EQ(Ask(id, kAll), -1);
    EXPECT_TRUE(IsUntouched());
    LeaveUnused(id, 29 * 60);
    EXPECT_EQ(Ask(id, kAll), 1);
}

TEST_F(Authorize, LetsATimedOutSessionPassWhenTheRequestAllowsIt) {
    const std::string id = Open();
    LeaveUnused(id, 31 * 60);
    EXPECT_EQ(Ask(id, kAll, 1), 1);
    EXPECT_EQ(Ask(id, kAll, 0), -1);
}

TEST_F(Authorize, LetsATimedOutSessionPassWhenTheContextAllowsIt) {
    const std::string id = Open();
    LeaveUnused(id, 31 * 60);
    PrepareEx(30, 1);
    EXPECT_EQ(Ask(id, kAll, 0), 1);
    PrepareEx(30, 0);
    EXPECT_EQ(Ask(id, kAll, 0), -1);
    EXPECT_EQ(Ask(id, kAll, 1), 1);
}

TEST_F(Authorize, CountsTheMinutesOfTheContext) {
    const std::string id = Open();
    LeaveUnused(id, 31 * 60);
    PrepareEx(60, 0);
    EXPECT_EQ(Ask(id, kAll), 1);
    PrepareEx(30, 0);
    EXPECT_EQ(Ask(id, kAll), -1);
    LeaveUnused(id, 10 * 60);
    PrepareEx(5, 0);
    EXPECT_EQ(Ask(id, kAll), -1);
}

TEST_F(Authorize, RefusesAnIdWithoutASessionWithMinus2) {
    for (const std::string& id :
         {UnusedId(), std::string(), std::string("s"), std::string(65536, 's'),
          std::string("../session/") + UnusedId(), std::string("/etc/passwd"),
          std::string("%2e%2e"), std::string("..")}) {
        EXPECT_EQ(Ask(id, kAll), -2) << id.substr(0, 60);
        EXPECT_TRUE(IsUntouched());
    }
}

TEST_F(Authorize, RefusesASessionThatHasEnded) {
    const std::string id = Open();
    EXPECT_EQ(Ask(id, kAll), 1);
    ASSERT_TRUE(talo::EndSession(id));
    EXPECT_EQ(Ask(id, kAll), -2);
}

TEST_F(Authorize, KeepsTheSessionFoundLastWhenTheNextIsRefused) {
    const std::string id = Open();
    ASSERT_EQ(Ask(id, kAll), 1);
    EXPECT_EQ(Ask(UnusedId(), kAll), -2);
    EXPECT_EQ(ctx.sessionFile, PathOf(id));
}

TEST_F(Authorize, RefusesAnotherAddressWithMinus3) {
    const std::string id = Open();
    MoveAway();
    EXPECT_EQ(Ask(id, kAll), -3);
    EXPECT_TRUE(IsUntouched());
    host.SayNothingOf("REMOTE_ADDR");
    EXPECT_EQ(Ask(id, kAll), -3);
    host.Say("REMOTE_ADDR", "::ffff:192.0.2.1");
    EXPECT_EQ(Ask(id, kAll), 1);
}

TEST_F(Authorize, KnowsTheAddressBehindATrustedProxyOnly) {
    const std::string id = Open();
    host.Say("REMOTE_ADDR", "10.0.0.1");
    host.Say("HTTP_X_FORWARDED_FOR", "192.0.2.1");
    EXPECT_EQ(Ask(id, kAll), -3);
    host.Configure("trusted_proxies=\"10.0.0.1\"\n");
    EXPECT_EQ(Ask(id, kAll), 1);
}

TEST_F(Authorize, DoesNotBindAnExemptSessionToItsAddress) {
    const std::string exempt = OpenExempt();
    const std::string bound = Open();
    MoveAway();
    EXPECT_EQ(Ask(exempt, kAll), 1);
    EXPECT_EQ(Ask(bound, kAll), -3);
}

TEST_F(Authorize, BindsNoSessionToItsAddressWhenTheHostSaysSo) {
    host.Configure("skip_ip_check=\"yes\"\n");
    Prepare();
    EXPECT_EQ(ctx.skipIPCheck, 1);
    const std::string id = Open();
    MoveAway();
    EXPECT_EQ(Ask(id, kAll), 1);
}

TEST_F(Authorize, RefusesAnotherSitesPageWithMinus4) {
    const std::string id = Open();
    ComeFromElsewhere();
    EXPECT_EQ(Ask(id, kAll), -4);
    EXPECT_TRUE(IsUntouched());
    host.SayNothingOf("HTTP_ORIGIN");
    EXPECT_EQ(Ask(id, kAll), 1);
    host.Say("HTTP_SEC_FETCH_SITE", "cross-site");
    EXPECT_EQ(Ask(id, kAll), -4);
}

TEST_F(Authorize, RefusesAnAccountThatIsGoneOrLockedWithMinus6) {
    const std::string id = Open();
    std::string problem;
    ASSERT_TRUE(talo::SetLocked("normal", true, &problem)) << problem;
    EXPECT_EQ(Ask(id, kAll), -6);
    EXPECT_TRUE(IsUntouched());
    ASSERT_TRUE(talo::SetLocked("normal", false, &problem)) << problem;
    EXPECT_EQ(Ask(id, kAll), 1);
    ASSERT_TRUE(talo::RemoveAccount("normal", &problem)) << problem;
    EXPECT_EQ(Ask(id, kAll), -6);
}

TEST_F(Authorize, ChecksTheAccountLast) {
    const std::string id = Open("nobody");
    LeaveUnused(id, 31 * 60);
    EXPECT_EQ(Ask(id, kAll), -1);
    ComeFromElsewhere();
    EXPECT_EQ(Ask(id, kAll), -4);
    MoveAway();
    EXPECT_EQ(Ask(id, kAll), -3);
}

TEST_F(Authorize, DoesNotRenewTheSession) {
    const std::string id = Open();
    LeaveUnused(id, 600);
    talo::Session before;
    talo::Session after;
    ASSERT_TRUE(talo::FindSession(id, &before));
    EXPECT_EQ(Ask(id, kAll), 1);
    ASSERT_TRUE(talo::FindSession(id, &after));
    EXPECT_EQ(after.lastUse, before.lastUse);
}

TEST_F(Authorize, WritesTheNameWholeOrNotAtAll) {
    const std::string id = Open();
    const TALOCGIAUTHREQUEST request = {kAll, 0};
    char small[8] = "######";
    for (const size_t size : {size_t(0), size_t(1), size_t(6)}) {
        EXPECT_LT(TaloCgiIsAuthorizedEx(&ctx, id.c_str(), small, size, &request, 0), 0) << size;
        EXPECT_STREQ(small, "######");
    }
    EXPECT_EQ(TaloCgiIsAuthorizedEx(&ctx, id.c_str(), small, 7, &request, 0), 1);
    EXPECT_STREQ(small, "normal");
}

TEST_F(Authorize, RefusesAQuestionThatLacksSomething) {
    const std::string id = Open();
    const TALOCGIAUTHREQUEST request = {kAll, 0};
    TALOCGI unprepared;
    std::memset(&unprepared, 0, sizeof unprepared);
    EXPECT_LT(TaloCgiIsAuthorizedEx(nullptr, id.c_str(), name, sizeof name, &request, 0), 0);
    EXPECT_LT(TaloCgiIsAuthorizedEx(&unprepared, id.c_str(), name, sizeof name, &request, 0), 0);
    EXPECT_LT(TaloCgiIsAuthorizedEx(&ctx, nullptr, name, sizeof name, &request, 0), 0);
    EXPECT_LT(TaloCgiIsAuthorizedEx(&ctx, id.c_str(), nullptr, sizeof name, &request, 0), 0);
    EXPECT_LT(TaloCgiIsAuthorizedEx(&ctx, id.c_str(), name, sizeof name, nullptr, 0), 0);
}

}  // namespace
