#include "webapi/APIAuth.h"

#include <stdlib.h>

#include "tests/entry/PermissionFixture.h"

namespace {

using support::Parse;
using TALO::APIAuth;
using TALO::APIRequest;
using TALO::APIResponse;

// A method's request of "ann" and its response, and a check for another session.
class APIAuthCheck : public rights::PermissionFixture {
  protected:
    APIAuthCheck() {
        response.SetError(117, Json::Value());
    }

    bool Check(const char* sessionId = "s1", bool allowTimeout = false) {
        return APIAuth::CheckPermission(&request, &response, sessionId, allowTimeout);
    }

    APIRequest request{Parse(R"({
        "reqLib": {"allowUser": ["normal.local"]},
        "session": {"username": "ann", "isAdmin": false},
        "environ": {"talo_remoteIP": "192.0.2.7", "HTTP_COOKIE": "id=own"}})")};
    APIResponse response{&request};
};

TEST_F(APIAuthCheck, GrantsAndClearsTheError) {
    EXPECT_TRUE(Check());
    EXPECT_EQ(response.GetError(), 0);
    EXPECT_EQ(response.GetBody(), Parse(R"({"success": true})"));
}

TEST_F(APIAuthCheck, RefusesANullIdWith105AndNoPlatformCall) {
    EXPECT_FALSE(Check(nullptr));
    EXPECT_EQ(response.GetError(), 105);
    EXPECT_EQ(fake::Now().calls["TaloCgiInitEx"], 0);
    EXPECT_EQ(Checks(), 0u);
}

TEST_F(APIAuthCheck, AsksThePlatformAlsoForAnEmptyId) {
    EXPECT_FALSE(Check(""));
    EXPECT_EQ(response.GetError(), 105);
    ASSERT_EQ(Checks(), 1u);
    EXPECT_EQ(fake::Now().authCalls[0].sessionId, "");
}

struct AuthRow {
    int result;
    int code;
};

TEST_F(APIAuthCheck, MapsEachResultOfThePlatformToACode) {
    const AuthRow rows[] = {{1, 0},    {2, 0},    {0, 105},  {3, 105},  {100, 105}, {-1, 106},
                            {-2, 105}, {-3, 107}, {-4, 105}, {-5, 105}, {-6, 105},  {-7, 105}};
    for (const AuthRow& row : rows) {
        Session().result = row.result;
        response.SetError(117, Json::Value());
        EXPECT_EQ(Check(), row.code == 0) << row.result;
        EXPECT_EQ(response.GetError(), row.code) << row.result;
        EXPECT_FALSE(response.HasServerError()) << row.result;
    }
}

TEST_F(APIAuthCheck, PreparesAContextOfItsOwnAndReleasesIt) {
    fake::Now().configuredTimeout = 77;
    EXPECT_TRUE(Check("s1", false));
    EXPECT_TRUE(Check("s1", true));
    ASSERT_EQ(fake::Now().contextCalls.size(), 2u);
    for (const size_t variant : {0u, 1u}) {
        const fake::ContextCall& call = fake::Now().contextCalls[variant];
        EXPECT_EQ(call.timeout, 77);
        EXPECT_EQ(call.allowTimeout, variant == 1 ? 1 : 0);
        EXPECT_EQ(call.userClass, "current.users");
        EXPECT_EQ(call.prefix, "");
    }
    EXPECT_EQ(fake::Now().openContexts, 0);
}

TEST_F(APIAuthCheck, LeavesTheTimeoutOutOfTheAuthorizationRequest) {
    for (const bool allowTimeout : {false, true}) {
        fake::Now().authCalls.clear();
        EXPECT_TRUE(Check("s1", allowTimeout));
        ASSERT_EQ(Checks(), 1u);
        const fake::AuthCall& call = fake::Now().authCalls[0];
        EXPECT_EQ(call.sessionId, "s1") << "the one given, not the request's own";
        EXPECT_EQ(call.checkMask, 15);
        EXPECT_EQ(call.allowTimeout, 0);
        EXPECT_EQ(call.nameSize, 493u);
        EXPECT_TRUE(call.nameWasZero);
        EXPECT_EQ(call.flags, 0);
    }
}

TEST_F(APIAuthCheck, RefusesWithoutAContext) {
    fake::Now().FailCall("TaloCgiInitEx", 1);
    EXPECT_FALSE(Check());
    EXPECT_EQ(response.GetError(), 105);
}

TEST_F(APIAuthCheck, KeepsNothing) {
    const Json::Value before = SessionOf(request);
    EXPECT_TRUE(Check());
    EXPECT_TRUE(Check());
    EXPECT_EQ(Checks(), 2u);
    EXPECT_EQ(SessionOf(request), before);
    EXPECT_EQ(getenv("TALO_WEBAPI_USERNAME"), nullptr);
    EXPECT_TRUE(fake::Now().touched.empty());
    EXPECT_TRUE(fake::Now().optionCalls.empty());
}

TEST_F(APIAuthCheck, TakesTheUserFromTheRequestAndNotFromTheSession) {
    Session().user = "root@ldap";
    EXPECT_TRUE(Check());
    request.InitSession(Parse(R"({"username": "DOM\\ann"})"));
    EXPECT_FALSE(Check());
    EXPECT_EQ(response.GetError(), 105);
    request.InitSession(Parse(R"({"username": "ann", "isAdmin": true})"));
    EXPECT_FALSE(Check());
    EXPECT_EQ(response.GetError(), 105);
}

TEST_F(APIAuthCheck, RefusesAnAPIWithoutAListOfUsers) {
    for (const char* description : {R"({})", R"({"allowUser": []})", R"({"allowUser": null})",
                                    R"({"allowUser": "normal.local"})"}) {
        request.InitAPIInfo(Parse(description));
        EXPECT_FALSE(Check()) << description;
        EXPECT_EQ(response.GetError(), 105) << description;
    }
}

TEST_F(APIAuthCheck, AsksForThePrivilegeAfterTheClass) {
    request.InitAPIInfo(Parse(R"({"allowUser": ["normal.local"], "appPriv": "Photos"})"));
    EXPECT_FALSE(Check());
    EXPECT_EQ(response.GetError(), 105);
    ASSERT_EQ(fake::Now().privilegeCalls.size(), 1u);
    EXPECT_EQ(fake::Now().privilegeCalls[0].user, "ann");
    EXPECT_EQ(fake::Now().privilegeCalls[0].privilege, "Photos");
    EXPECT_EQ(fake::Now().privilegeCalls[0].remoteIP, "192.0.2.7");
    fake::Now().privileges.insert("ann/Photos");
    EXPECT_TRUE(Check());
    EXPECT_EQ(response.GetError(), 0);
    request.InitAPIInfo(Parse(R"({"allowUser": [], "appPriv": "Photos"})"));
    EXPECT_FALSE(Check());
    EXPECT_EQ(fake::Now().privilegeCalls.size(), 2u);
}

TEST_F(APIAuthCheck, RefusesAPrivilegeThatIsNoText) {
    request.InitAPIInfo(Parse(R"({"allowUser": ["normal.local"], "appPriv": ["Photos"]})"));
    EXPECT_FALSE(Check());
    EXPECT_EQ(response.GetError(), 105);
}

TEST_F(APIAuthCheck, LooksAtTheSessionBeforeAnythingElse) {
    Session().result = -1;
    request.InitAPIInfo(Parse(R"({"allowUser": [], "appPriv": "Photos"})"));
    EXPECT_FALSE(Check());
    EXPECT_EQ(response.GetError(), 106);
    EXPECT_TRUE(fake::Now().privilegeCalls.empty());
}

TEST_F(APIAuthCheck, MatchesTheUserClassByTheRequestsFlag) {
    request.InitAPIInfo(Parse(R"({"allowUser": ["admin.domain", "normal.ldap"]})"));
    EXPECT_TRUE(APIAuth::CheckAllowUser(&request, "ann@x"));
    EXPECT_FALSE(APIAuth::CheckAllowUser(&request, "DOM\\ann"));
    EXPECT_FALSE(APIAuth::CheckAllowUser(&request, "ann"));
    EXPECT_FALSE(APIAuth::CheckAllowUser(&request, nullptr));
    request.InitSession(Parse(R"({"isAdmin": true})"));
    EXPECT_TRUE(APIAuth::CheckAllowUser(&request, "DOM\\ann"));
    EXPECT_TRUE(APIAuth::CheckAllowUser(&request, "DOM\\ann@x"));
    EXPECT_FALSE(APIAuth::CheckAllowUser(&request, "ann@x"));
}

}  // namespace
