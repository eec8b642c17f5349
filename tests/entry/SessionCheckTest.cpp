#include <stdlib.h>

#include <climits>

#include "tests/entry/PermissionFixture.h"

namespace {

using support::Parse;

class SessionCheck : public rights::PermissionFixture {
  protected:
    static std::string Login() {
        const char* name = getenv("TALO_WEBAPI_USERNAME");
        return name != nullptr ? name : "(unset)";
    }
    // The session's facts after a check of it.
    Json::Value Facts() {
        EndRequest();
        EXPECT_EQ(Call().CheckPermission(false), 0);
        return SessionOf(*Entry().request);
    }
};

struct ResultRow {
    int result;
    int code;
};

TEST_F(SessionCheck, MapsEachResultOfThePlatformToACode) {
    const ResultRow rows[] = {
        {2, 0},    {1, 0},    {0, 105},  {3, 105},  {100, 105}, {INT_MAX, 105}, {-1, 106},
        {-2, 105}, {-3, 105}, {-4, 105}, {-5, 119}, {-6, 105},  {-7, 105},      {INT_MIN, 105},
    };
    for (const ResultRow& row : rows) {
        Session().result = row.result;
        EndRequest();
        EXPECT_EQ(Call().CheckPermission(false), row.code) << row.result;
        EXPECT_EQ(Entry().CheckPermission(false), row.code) << row.result << ", from the cache";
    }
}

TEST_F(SessionCheck, AsksForEveryCheckWithAZeroedNameOf493Bytes) {
    EXPECT_EQ(Call().CheckPermission(false), 0);
    EXPECT_EQ(Entry().CheckPermission(true), 0);
    ASSERT_EQ(Checks(), 2u);
    for (const size_t variant : {0u, 1u}) {
        const fake::AuthCall& call = fake::Now().authCalls[variant];
        EXPECT_EQ(call.sessionId, "s1");
        EXPECT_EQ(call.checkMask, 15);
        EXPECT_EQ(call.allowTimeout, variant == 1 ? 1 : 0);
        EXPECT_EQ(call.nameSize, 493u);
        EXPECT_TRUE(call.nameWasZero);
        EXPECT_EQ(call.flags, 0);
    }
}

TEST_F(SessionCheck, TakesANameThatFillsTheBuffer) {
    Session().user = std::string(492, 'n');
    EXPECT_EQ(Facts()["username"], Json::Value(std::string(492, 'n')));
}

TEST_F(SessionCheck, AsksThePlatformOnceForEachVariant) {
    Session().result = -1;
    Session().timeoutAllowed = 1;
    Call();
    EXPECT_EQ(Entry().CheckPermission(true), 0);
    EXPECT_EQ(Entry().CheckPermission(true), 0);
    EXPECT_EQ(Checks(), 1u);
    EXPECT_EQ(Entry().CheckPermission(false), 106);
    EXPECT_EQ(Checks(), 2u);
    EXPECT_EQ(Entry().CheckPermission(false), 106);
    EXPECT_EQ(Entry().CheckPermission(true), 0);
    EXPECT_EQ(Checks(), 2u);
}

TEST_F(SessionCheck, KeepsTheResultOfTheSecondVariantApartFromAnEmptyFirst) {
    Session().timeoutAllowed = -3;
    Call();
    EXPECT_EQ(Entry().CheckPermission(false), 0);
    EXPECT_EQ(Entry().CheckPermission(true), 105);
    EXPECT_EQ(Entry().CheckPermission(false), 0);
    EXPECT_EQ(Checks(), 2u);
}

TEST_F(SessionCheck, KeepsItsResultAlthoughTheSessionChanges) {
    Call();
    EXPECT_EQ(Entry().CheckPermission(false), 0);
    Session().result = -1;
    EXPECT_EQ(Entry().CheckPermission(false), 0);
    EndRequest();
    EXPECT_EQ(Call().CheckPermission(false), 106) << "another request asks again";
}

TEST_F(SessionCheck, WithoutASessionIdIs119AndNoPlatformCall) {
    for (const char* cookie : {"", "lang=en", "id=", "sid=s1"}) {
        EndRequest();
        EXPECT_EQ(Call("who", "Test.Rights", cookie).CheckPermission(false), 119) << cookie;
        EXPECT_EQ(Entry().CheckPermission(true), 119) << cookie;
        EXPECT_EQ(SessionOf(*Entry().request), Json::Value(Json::objectValue)) << cookie;
    }
    EXPECT_EQ(Checks(), 0u);
    EXPECT_EQ(Login(), "(unset)");
}

TEST_F(SessionCheck, RemembersThatThereWasNoSessionId) {
    EXPECT_EQ(Call("who", "Test.Rights", "").CheckPermission(false), 119);
    EXPECT_TRUE(Entry().request->SetCookie("id", "s1"));
    EXPECT_EQ(Entry().CheckPermission(false), 119);
    EXPECT_EQ(Entry().CheckPermission(true), 0) << "the other variant was not asked";
    EXPECT_EQ(Checks(), 1u);
}

TEST_F(SessionCheck, WritesEveryFactOfTheSession) {
    Session().user = "root";
    Session().options = {{1, "1"}, {6, "webpriv"}, {7, "Photos"}, {10, "45"}};
    Session().language = "ger";
    Session().file = "/session/s1";
    fake::Now().administrators.insert("root");
    EXPECT_EQ(Facts(), Parse(R"({"username": "root", "isAdmin": true, "sessFile": "/session/s1",
                                 "isTimeout": false, "timeout": 45, "isSkipCheckIP": true,
                                 "uiLang": "ger", "app": "Photos", "webapi": "webpriv",
                                 "isAuthorized": true})"));
}

TEST_F(SessionCheck, WritesTheDefaultsOfASessionWithoutOptions) {
    EXPECT_EQ(Facts(), Parse(R"({"username": "ann", "isAdmin": false, "sessFile": "",
                                 "isTimeout": false, "timeout": 30, "isSkipCheckIP": false,
                                 "uiLang": "enu", "app": "", "webapi": "", "isAuthorized": true})"));
}

TEST_F(SessionCheck, AsksForEachOptionWithItsDefault) {
    (void)Facts();
    std::map<int, std::string> asked;
    for (const fake::OptionCall& call : fake::Now().optionCalls) {
        EXPECT_TRUE(asked.emplace(call.option, call.fallback).second) << call.option;
    }
    EXPECT_EQ(asked, (std::map<int, std::string>{{1, "(null)"}, {6, ""}, {7, ""}, {10, "0"}}));
}

TEST_F(SessionCheck, ReplacesFactsThatWereThereBefore) {
    Call().request->InitSession(Parse(R"({"appPriv": "Photos", "username": "root"})"));
    EXPECT_EQ(Entry().CheckPermission(false), 0);
    EXPECT_FALSE(Entry().request->HasAppPriv("Photos"));
    EXPECT_EQ(Entry().request->GetLoginUserName(), "ann");
}

TEST_F(SessionCheck, TakesTheAdministratorFromTheGroupAndNotFromTheResult) {
    Session().result = 2;
    EXPECT_EQ(Facts()["isAdmin"], Json::Value(false));
    fake::Now().administrators.insert("ann");
    Session().result = 1;
    EXPECT_EQ(Facts()["isAdmin"], Json::Value(true));
    fake::Now().FailCall("TLIBGroupIsAdminGroupMem", 1);
    EXPECT_EQ(Facts()["isAdmin"], Json::Value(false)) << "a failed look-up makes nobody one";
}

struct TimeoutRow {
    const char* option;  // null: unset
    int minutes;
};

TEST_F(SessionCheck, TakesTheDefaultTimeoutWhereTheOptionGivesNone) {
    fake::Now().defaultTimeout = 33;
    const TimeoutRow rows[] = {
        {nullptr, 33}, {"", 33},      {"0", 33}, {"00", 33},  {"abc", 33}, {"0x10", 33},
        {"45", 45},    {"45min", 45}, {" 7", 7}, {"010", 10}, {"-5", -5},  {"1", 1},
    };
    for (const TimeoutRow& row : rows) {
        Session().options.clear();
        if (row.option != nullptr) {
            Session().options[10] = row.option;
        }
        EXPECT_EQ(Facts()["timeout"], Json::Value(row.minutes)) << (row.option ? row.option : "-");
    }
}

struct SkipRow {
    const char* option;  // null: unset
    int context;
    bool skips;
};

TEST_F(SessionCheck, TakesTheContextsAddressCheckOnlyWithoutTheOption) {
    const SkipRow rows[] = {
        {nullptr, 0, false}, {nullptr, 1, true}, {nullptr, 2, false}, {nullptr, -1, false},
        {"1", 0, true},      {"1", 1, true},     {"0", 1, false},     {"0", 0, false},
        {"", 1, false},      {"yes", 1, false},  {"01", 1, false},    {"11", 1, false},
    };
    for (const SkipRow& row : rows) {
        fake::Now().skipIPCheck = row.context;
        Session().options.clear();
        if (row.option != nullptr) {
            Session().options[1] = row.option;
        }
        EXPECT_EQ(Facts()["isSkipCheckIP"], Json::Value(row.skips))
            << (row.option ? row.option : "-") << " " << row.context;
    }
}

TEST_F(SessionCheck, WritesFactsForEveryAcceptedIdAlsoWithoutAccess) {
    for (const int result : {0, 1, 2, 3}) {
        (void)setenv("TALO_WEBAPI_USERNAME", "before", 1);
        Session().result = result;
        EndRequest();
        (void)Call().CheckPermission(false);
        EXPECT_EQ(Entry().request->GetLoginUserName(), "ann") << result;
        EXPECT_TRUE(Entry().request->IsAuthorized()) << result;
        EXPECT_FALSE(Entry().request->IsTimeout()) << result;
        EXPECT_EQ(Login(), "ann") << result;
    }
}

TEST_F(SessionCheck, WritesNothingForARefusedId) {
    for (const int result : {-1, -2, -3, -5, -7}) {
        (void)setenv("TALO_WEBAPI_USERNAME", "before", 1);
        Session().result = result;
        EndRequest();
        (void)Call().CheckPermission(false);
        EXPECT_EQ(SessionOf(*Entry().request), Json::Value(Json::objectValue)) << result;
        EXPECT_EQ(Login(), "before") << result;
    }
}

TEST_F(SessionCheck, LeavesTheLoginNameInTheEnvironmentForTheProcess) {
    EXPECT_EQ(Call().CheckPermission(false), 0);
    EndRequest();
    EXPECT_EQ(Login(), "ann");
}

TEST_F(SessionCheck, OfATimedOutSessionThatCountsSaysThatItIsNotTimedOut) {
    Session().result = -1;
    EXPECT_EQ(Call().CheckPermission(true), 0);
    EXPECT_FALSE(Entry().request->IsTimeout());
}

}  // namespace
