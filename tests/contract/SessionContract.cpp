#include <cstring>
#include <string>

#include "platform/Cgi.h"
#include "platform/System.h"
#include "tests/contract/SessionWorld.h"

namespace {

constexpr int kAllChecks = 15;

class SessionContract : public ::testing::Test {
  protected:
    SessionContract() : world(MakeSessionWorld()), ctx() {}
    ~SessionContract() override {
        TaloCgiFree(&ctx);
    }

    int Ask(const std::string& id, int allowTimeout = 0) {
        TaloCgiFree(&ctx);
        EXPECT_EQ(TaloCgiInit("", &ctx), 0);
        std::memset(name, 0, sizeof name);
        const TALOCGIAUTHREQUEST request = {kAllChecks, allowTimeout};
        return TaloCgiIsAuthorizedEx(&ctx, id.c_str(), name, sizeof name, &request, 0);
    }

    void ExpectRefused(const std::string& id, int result) {
        EXPECT_EQ(Ask(id), result);
        EXPECT_STREQ(name, "");
        EXPECT_STREQ(ctx.sessionFile, "");
    }

    static Login As(const std::string& user, bool administrator = false) {
        Login login;
        login.user = user;
        login.administrator = administrator;
        return login;
    }

    const std::unique_ptr<SessionWorld> world;
    TALOCGI ctx;
    char name[64];
};

TEST_F(SessionContract, AcceptsAUserWith1AndAnAdministratorWith2) {
    const std::string normal = world->LogIn(As("normal"));
    const std::string boss = world->LogIn(As("boss", true));
    EXPECT_EQ(Ask(normal), 1);
    EXPECT_STREQ(name, "normal");
    EXPECT_EQ(ctx.sessionFile, world->FileOf(normal));
    EXPECT_EQ(Ask(boss), 2);
    EXPECT_STREQ(name, "boss");
    EXPECT_EQ(ctx.sessionFile, world->FileOf(boss));
}

TEST_F(SessionContract, FindsTheSessionsFileInTheContextsFolder) {
    const std::string id = world->LogIn(As("normal"));
    ASSERT_EQ(Ask(id), 1);
    EXPECT_EQ(std::string(ctx.sessionDir) + "/" + id, ctx.sessionFile);
}

TEST_F(SessionContract, RefusesATimedOutSessionWithMinus1UnlessItIsAllowed) {
    const std::string id = world->LogIn(As("normal"));
    world->TimeOut(id);
    ExpectRefused(id, -1);
    EXPECT_EQ(Ask(id, 1), 1);
    EXPECT_STREQ(name, "normal");
}

TEST_F(SessionContract, RefusesASessionThatIsNotThereWithMinus2) {
    const std::string id = world->LogIn(As("normal"));
    for (const std::string& other : {std::string(), std::string("x"), id + "x", "../" + id,
                                     std::string("/"), std::string(65536, 's')}) {
        ExpectRefused(other, -2);
    }
    world->LogOut(id);
    ExpectRefused(id, -2);
}

TEST_F(SessionContract, RefusesAnotherAddressWithMinus3) {
    const std::string id = world->LogIn(As("normal"));
    world->AskFromAnotherAddress(id);
    ExpectRefused(id, -3);
    EXPECT_EQ(Ask(id, 1), -3);
}

TEST_F(SessionContract, RefusesAnotherSitesPageWithMinus4) {
    const std::string id = world->LogIn(As("normal"));
    world->AskFromAnotherSite(id);
    ExpectRefused(id, -4);
    EXPECT_EQ(Ask(id, 1), -4);
}

TEST_F(SessionContract, RefusesAnAccountThatIsGoneWithMinus6) {
    const std::string id = world->LogIn(As("normal"));
    world->RemoveAccount(id);
    ExpectRefused(id, -6);
}

TEST_F(SessionContract, AnswersTheOptionsOfTheSessionFound) {
    Login login;
    login.exempt = true;
    login.language = "fre";
    login.application = "photo";
    login.privilege = "a,b";
    login.timeout = 45;
    ASSERT_EQ(Ask(world->LogIn(login)), 1);
    EXPECT_STREQ(TaloCgiGetOption(&ctx, 1, "x"), "1");
    EXPECT_STREQ(TaloCgiGetOption(&ctx, 6, "x"), "a,b");
    EXPECT_STREQ(TaloCgiGetOption(&ctx, 7, "x"), "photo");
    EXPECT_STREQ(TaloCgiGetOption(&ctx, 10, "x"), "45");
    EXPECT_STREQ(TaloCgiGetLang(&ctx), "fre");
}

TEST_F(SessionContract, AnswersTheFallbackForAnOptionThatIsUnset) {
    ASSERT_EQ(Ask(world->LogIn(As("normal"))), 1);
    for (const int option : {1, 6, 7, 10, 99}) {
        EXPECT_STREQ(TaloCgiGetOption(&ctx, option, "fallback"), "fallback") << option;
        EXPECT_EQ(TaloCgiGetOption(&ctx, option, nullptr), nullptr) << option;
    }
    EXPECT_STREQ(TaloCgiGetLang(&ctx), "enu");
}

TEST_F(SessionContract, PreparesAContextWithoutAnEntry) {
    const std::string id = world->LogIn(As("normal"));
    const TALOCGIAUTHREQUEST request = {kAllChecks, 0};
    std::memset(name, 0, sizeof name);
    ASSERT_EQ(TaloCgiInitEx(&ctx, 30, 0, "current.users", ""), 0);
    EXPECT_EQ(TaloCgiIsAuthorizedEx(&ctx, id.c_str(), name, sizeof name, &request, 0), 1);
    EXPECT_STREQ(name, "normal");
}

TEST_F(SessionContract, WritesTheClientsAddressWholeOrNotAtAll) {
    char buffer[65] = "untouched";
    for (const char* address : {"192.0.2.100", "2001:db8::1"}) {
        world->ComeFrom(address);
        std::memcpy(buffer, "untouched", 10);
        EXPECT_NE(TaloCgiGetRemoteIP(buffer, std::strlen(address)), 0);
        EXPECT_STREQ(buffer, "untouched");
        EXPECT_EQ(TaloCgiGetRemoteIP(buffer, std::strlen(address) + 1), 0);
        EXPECT_STREQ(buffer, address);
    }
    std::memcpy(buffer, "untouched", 10);
    world->ComeFrom("");
    EXPECT_NE(TaloCgiGetRemoteIP(buffer, sizeof buffer), 0);
    EXPECT_STREQ(buffer, "untouched");
}

TEST_F(SessionContract, KnowsTheIdOfWhoIsLoggedIn) {
    const std::string normal = world->LogIn(As("normal"));
    const std::string other = world->LogIn(As("other"));
    EXPECT_EQ(TaloCgiUIDGet(normal.c_str(), "normal"), world->UidOf("normal"));
    EXPECT_EQ(TaloCgiUIDGet(other.c_str(), "other"), world->UidOf("other"));
    EXPECT_NE(world->UidOf("normal"), world->UidOf("other"));
    EXPECT_LT(TaloCgiUIDGet(normal.c_str(), "stranger"), 0);
    world->RemoveAccount(normal);
    EXPECT_LT(TaloCgiUIDGet(normal.c_str(), "normal"), 0);
}

TEST_F(SessionContract, KnowsWhoIsAnAdministrator) {
    (void)world->LogIn(As("normal"));
    (void)world->LogIn(As("boss", true));
    EXPECT_EQ(TLIBGroupIsAdminGroupMem("boss", 0), 1);
    EXPECT_EQ(TLIBGroupIsAdminGroupMem("normal", 0), 0);
}

TEST_F(SessionContract, KnowsWhoHoldsAPrivilege) {
    (void)world->LogIn(As("normal"));
    (void)world->LogIn(As("other"));
    world->Grant("normal", "TALO.Photo");
    EXPECT_NE(TLIBAppPrivUserHas("normal", "TALO.Photo", "192.0.2.1"), 0);
    EXPECT_EQ(TLIBAppPrivUserHas("normal", "TALO.Video", "192.0.2.1"), 0);
    EXPECT_EQ(TLIBAppPrivUserHas("other", "TALO.Photo", "192.0.2.1"), 0);
    EXPECT_EQ(TLIBAppPrivUserHas("stranger", "TALO.Photo", "192.0.2.1"), 0);
}

TEST_F(SessionContract, HasATimeoutOfSomeMinutes) {
    EXPECT_GT(TLIBCConfGetORBTimeout(), 0);
    ASSERT_EQ(TaloCgiInit("", &ctx), 0);
    EXPECT_GT(ctx.defaultTimeout, 0);
}

TEST(LowerCaseContract, LowersAsciiWithinTheSize) {
    const struct {
        const char* text;
        size_t size;
        const char* lowered;
    } rows[] = {
        {"", 0, ""},
        {"AbC-Z9@[`{", 0, "abc-z9@[`{"},
        {"\xC3\x89", 0, "\xC3\x89"},
        {"ABC", 2, "abC"},
        {"ABC", 100, "abc"},
    };
    for (const auto& row : rows) {
        char buffer[32];
        std::strcpy(buffer, row.text);
        TLIBCStrCaseLower(buffer, row.size);
        EXPECT_STREQ(buffer, row.lowered) << row.text;
    }
}

}  // namespace
