#include "tests/entry/PermissionFixture.h"

namespace {

using support::Parse;
using TALO::APIRequest;
using TALO::APIResponse;

class Permission : public rights::PermissionFixture {};

struct LevelRow {
    const char* level;
    bool need;
    bool skip;
};

const LevelRow kLevels[] = {
    {"\"(absent)\"", true, false},
    {"null", true, false},
    {"0", false, false},
    {"\"0\"", false, false},
    {"1", true, false},
    {"2", true, true},
    {"3", true, false},
    {"-1", true, false},
    {"false", true, false},
    {"true", true, false},
    {"\"abc\"", true, false},
    {"\"\"", true, false},
    {"\"0x\"", true, false},
    {"\" 0\"", true, false},
    {"0.5", true, false},
    {"-0.5", true, false},
    {"2.5", true, false},
    {"4294967296", true, false},
    {"18446744073709551615", true, false},
    {"[]", true, false},
    {"[0]", true, false},
    {"{}", true, false},
};

TEST_F(Permission, IsNeededUnlessTheLevelIsZeroAndSkippedOnlyAtTwo) {
    for (const LevelRow& row : kLevels) {
        Json::Value description(Json::objectValue);
        if (Parse(row.level) != Json::Value("(absent)")) {
            description["authLevel"] = Parse(row.level);
        }
        APIRequest request{Json::Value()};
        request.InitAPIInfo(description);
        EXPECT_EQ(Entry().NeedPermission(&request), row.need) << row.level;
        EXPECT_EQ(Entry().SkipPermission(&request), row.skip) << row.level;
    }
}

TEST_F(Permission, OfAStrangerDependsOnTheLevelAlone) {
    for (const LevelRow& row : kLevels) {
        Describe(std::string(R"({"authLevel": )") + row.level + "}");
        EndRequest();
        Call("who", "Test.Rights", "");
        EXPECT_EQ(Run(), row.need && !row.skip ? 119 : 0) << row.level;
    }
}

TEST_F(Permission, IsNeededAndNotSkippedWithoutARequest) {
    EXPECT_TRUE(Entry().NeedPermission(nullptr));
    EXPECT_FALSE(Entry().SkipPermission(nullptr));
}

TEST_F(Permission, OfAnOpenAPIAsksNobody) {
    Call("who", "Test.Rights.Open");
    EXPECT_EQ(Run(), 0);
    EXPECT_EQ(Checks(), 0u);
    EXPECT_EQ(Entry().response->GetBody()["data"]["authorized"], Json::Value(false));
}

TEST_F(Permission, OfAnOptionalLoginIsLookedFor) {
    Call("who", "Test.Rights.Optional");
    EXPECT_EQ(Run(), 0);
    EXPECT_EQ(Entry().response->GetBody()["data"]["user"], Json::Value("ann"));
    EndRequest();
    Call("who", "Test.Rights.Optional", "id=other");
    EXPECT_EQ(Run(), 0);
    EXPECT_EQ(Entry().response->GetBody()["data"]["user"], Json::Value(""));
    EXPECT_EQ(Entry().response->GetServerError(), "noprivilege") << "the text of the check stays";
}

TEST_F(Permission, GrantedLeavesTheResponseWithoutError) {
    Asked().response->SetError(117, Json::Value());
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(Entry().response->GetError(), 0);
    EXPECT_EQ(Entry().response->GetBody(), Parse(R"({"success": true})"));
    EXPECT_FALSE(Entry().response->HasServerError());
}

struct RefusalRow {
    int result;
    int code;
    const char* text;
};

TEST_F(Permission, RefusedByTheSessionCheckSaysWhyToTheClient) {
    const RefusalRow rows[] = {
        {-1, 106, "timeout"},     {-5, 119, "unauth"},      {0, 105, "noprivilege"},
        {3, 105, "noprivilege"},  {-2, 105, "noprivilege"}, {-3, 105, "noprivilege"},
        {-4, 105, "noprivilege"}, {-7, 105, "noprivilege"},
    };
    for (const RefusalRow& row : rows) {
        Session().result = row.result;
        EndRequest();
        Asked();
        EXPECT_FALSE(Permitted()) << row.result;
        Json::Value body = Parse(R"({"success": false})");
        body["error"]["code"] = row.code;
        EXPECT_EQ(Entry().response->GetBody(), body) << row.result;
        EXPECT_EQ(Entry().response->GetServerError(), row.text) << row.result;
    }
}

TEST_F(Permission, WithoutASessionIdIs119) {
    Asked("who", "Test.Rights", "");
    EXPECT_FALSE(Permitted());
    EXPECT_EQ(Entry().response->GetError(), 119);
    EXPECT_EQ(Entry().response->GetServerError(), "unauth");
    EXPECT_EQ(Checks(), 0u);
}

TEST_F(Permission, ChecksTheVariantThatTheMethodAllows) {
    Asked("who");
    EXPECT_TRUE(Permitted());
    ASSERT_EQ(Checks(), 1u);
    EXPECT_EQ(fake::Now().authCalls[0].allowTimeout, 0);
    EndRequest();
    Asked("tolerant");
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(fake::Now().authCalls[1].allowTimeout, 1);
}

TEST_F(Permission, OfATimedOutSessionIsThatOfTheMethod) {
    Session().result = -1;
    Asked("who");
    EXPECT_FALSE(Permitted());
    EXPECT_EQ(Entry().response->GetError(), 106);
    EndRequest();
    Asked("tolerant");
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(Entry().response->GetError(), 0);
}

TEST_F(Permission, IsRefusedWith105AndNoTextToAnotherClassOfUser) {
    for (const char* list : {R"(["admin.local", "normal.domain", "normal.ldap"])", "[]",
                             "\"(absent)\"", "null", "\"normal.local\"", "{}", "[7]"}) {
        Describe(std::string(R"({"allowUser": )") + list + "}");
        EndRequest();
        Asked();
        EXPECT_FALSE(Permitted()) << list;
        EXPECT_EQ(Entry().response->GetError(), 105) << list;
        EXPECT_FALSE(Entry().response->HasServerError()) << list;
    }
}

struct ClassRow {
    const char* user;
    bool admin;
    const char* userClass;
};

TEST_F(Permission, MatchesTheClassOfTheLogin) {
    const ClassRow rows[] = {
        {"ann", false, "normal.local"},        {"DOM\\ann", false, "normal.domain"},
        {"ann@x", false, "normal.ldap"},       {"DOM\\ann@x", false, "normal.domain"},
        {"ann@x\\y", false, "normal.domain"},  {"root", true, "admin.local"},
        {"DOM\\root", true, "admin.domain"},   {"root@x", true, "admin.ldap"},
        {"DOM\\root@x", true, "admin.domain"},
    };
    for (const ClassRow& row : rows) {
        for (const ClassRow& listed : rows) {
            Json::Value list(Json::objectValue);
            list["allowUser"].append(listed.userClass);
            APIRequest request{Json::Value()};
            request.InitAPIInfo(list);
            Json::Value facts(Json::objectValue);
            facts["isAdmin"] = row.admin;
            Entry().request->InitSession(facts);
            EXPECT_EQ(Entry().CheckAllowUser(&request, row.user),
                      std::string(row.userClass) == listed.userClass)
                << row.user << " in " << listed.userClass;
        }
    }
}

TEST_F(Permission, MatchesNoNullName) {
    EXPECT_FALSE(Asked().CheckAllowUser(Entry().request, nullptr));
    EXPECT_TRUE(Entry().CheckAllowUser(Entry().request, "ann"));
}

TEST_F(Permission, AsksForThePrivilegeOfTheCallerAtHisAddress) {
    fake::Now().remoteAddress = "192.0.2.7";
    Asked("who", "Test.Rights.Photo");
    EXPECT_FALSE(Permitted());
    EXPECT_EQ(Entry().response->GetError(), 105);
    EXPECT_FALSE(Entry().response->HasServerError());
    ASSERT_EQ(fake::Now().privilegeCalls.size(), 1u);
    EXPECT_EQ(fake::Now().privilegeCalls[0].user, "ann");
    EXPECT_EQ(fake::Now().privilegeCalls[0].privilege, "Photos");
    EXPECT_EQ(fake::Now().privilegeCalls[0].remoteIP, "192.0.2.7");
    fake::Now().privileges.insert("ann/Photos");
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(Entry().response->GetError(), 0);
}

TEST_F(Permission, AsksForNoPrivilegeThatTheAPIDoesNotName) {
    for (const char* privilege : {"\"(absent)\"", "\"\"", "null"}) {
        Describe(std::string(R"({"appPriv": )") + privilege + "}");
        EndRequest();
        Asked();
        EXPECT_TRUE(Permitted()) << privilege;
    }
    EXPECT_TRUE(fake::Now().privilegeCalls.empty());
}

TEST_F(Permission, IsRefusedForAPrivilegeThatIsNoText) {
    fake::Now().privileges = {"ann/Photos", "ann/"};
    for (const char* privilege :
         {R"(["Photos"])", "[]", "{}", R"({"Photos": true})", "7", "true"}) {
        Describe(std::string(R"({"appPriv": )") + privilege + "}");
        EndRequest();
        Asked();
        EXPECT_FALSE(Permitted()) << privilege;
        EXPECT_EQ(Entry().response->GetError(), 105) << privilege;
    }
}

TEST_F(Permission, LooksAtTheClassBeforeThePrivilege) {
    fake::Now().privileges.insert("ann/Photos");
    Describe(R"({"allowUser": ["admin.local"]})", "Test.Rights.Photo");
    Asked("who", "Test.Rights.Photo");
    EXPECT_FALSE(Permitted());
    EXPECT_TRUE(fake::Now().privilegeCalls.empty());
}

TEST_F(Permission, GrantedWritesTheFactsAgainWithThePrivilege) {
    fake::Now().privileges.insert("ann/Photos");
    Session().options = {{1, "1"}, {6, "webpriv"}, {7, "App"}, {10, "45"}};
    Session().language = "ger";
    Session().file = "/session/s1";
    const std::string facts = R"("username": "ann", "isAdmin": false, "sessFile": "/session/s1",
        "isTimeout": false, "timeout": 45, "isSkipCheckIP": true, "uiLang": "ger", "app": "App",
        "webapi": "webpriv", "isAuthorized": true})";
    Asked("who", "Test.Rights.Photo");
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(SessionOf(*Entry().request), Parse(R"({"appPriv": "Photos", )" + facts));
    EndRequest();
    Asked("who", "Test.Rights");
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(SessionOf(*Entry().request), Parse(R"({"appPriv": "", )" + facts));
}

TEST_F(Permission, KeepsThePrivilegeForAMethodThatAllowsATimeOut) {
    fake::Now().privileges.insert("ann/Photos");
    Call("tolerant", "Test.Rights.Photo");
    EXPECT_EQ(Run(), 0);
    EXPECT_EQ(Entry().response->GetBody()["data"]["priv"], Json::Value(true));
}

TEST_F(Permission, RefusedForTheClassWritesNoPrivilege) {
    Describe(R"({"allowUser": []})", "Test.Rights.Photo");
    Asked("who", "Test.Rights.Photo");
    EXPECT_FALSE(Permitted());
    EXPECT_FALSE(SessionOf(*Entry().request).isMember("appPriv"));
}

TEST_F(Permission, ForgetsTheMaskOfAllowedUsersAndComputesItAgain) {
    Asked();
    EXPECT_EQ(Entry().request->GetAllowUser(), 9);
    EXPECT_TRUE(Permitted());
    EXPECT_FALSE(SessionOf(*Entry().request).isMember("allowUser"));
    EXPECT_EQ(Entry().request->GetAllowUser(), 9);
}

TEST_F(Permission, OfAnElementTakesTheLoginOfTheEntryAndTheDescriptionOfTheElement) {
    Session().user = "root";
    fake::Now().administrators.insert("root");
    Asked("who", "Test.Rights.Photo");
    const auto element = Element("who", "Test.Rights.Admin");
    element->InitSession(Parse(R"({"username": "mallory", "isAdmin": false, "app": "Other"})"));
    APIResponse response(element.get());
    EXPECT_TRUE(Entry().CheckPermission(element.get(), &response));
    EXPECT_EQ(SessionOf(*element),
              Parse(R"({"appPriv": "", "username": "root", "isAdmin": true, "sessFile": "",
                        "isTimeout": false, "timeout": 30, "isSkipCheckIP": false,
                        "uiLang": "enu", "app": "", "webapi": "", "isAuthorized": true})"));
    EXPECT_EQ(Entry().response->GetBody(), Json::Value(Json::objectValue)) << "not its response";
}

TEST_F(Permission, OfAnElementDoesNotBelieveTheElement) {
    Asked();
    const auto element = Element("who", "Test.Rights.Admin");
    element->InitSession(Parse(R"({"username": "root", "isAdmin": true, "isAuthorized": true})"));
    EXPECT_TRUE(element->SetCookie("id", "another"));
    APIResponse response(element.get());
    EXPECT_FALSE(Entry().CheckPermission(element.get(), &response));
    EXPECT_EQ(response.GetError(), 105);
    EXPECT_EQ(fake::Now().authCalls[0].sessionId, "s1");
    EXPECT_EQ(SessionOf(*element), Json::Value(Json::objectValue));
}

TEST_F(Permission, OfAnElementIsForTheMethodOfTheElement) {
    Session().result = -1;
    Asked("who");
    const auto tolerant = Element("tolerant");
    APIResponse response(tolerant.get());
    EXPECT_TRUE(Entry().CheckPermission(tolerant.get(), &response));
    EXPECT_FALSE(Permitted());
    EXPECT_EQ(Entry().response->GetError(), 106);
}

TEST_F(Permission, OfAnElementAsksForThePrivilegeAtItsAddress) {
    fake::Now().remoteAddress = "192.0.2.7";
    fake::Now().privileges.insert("ann/Photos");
    Asked();
    const auto element = Element("who", "Test.Rights.Photo");
    element->InitEnv(Parse(R"({"talo_remoteIP": "198.51.100.1"})"));
    APIResponse response(element.get());
    EXPECT_TRUE(Entry().CheckPermission(element.get(), &response));
    ASSERT_EQ(fake::Now().privilegeCalls.size(), 1u);
    EXPECT_EQ(fake::Now().privilegeCalls[0].user, "ann");
    EXPECT_EQ(fake::Now().privilegeCalls[0].remoteIP, "198.51.100.1");
    EXPECT_TRUE(element->HasAppPriv("Photos"));
    EXPECT_FALSE(Entry().request->HasAppPriv("Photos"));
}

TEST_F(Permission, LogsNothing) {
    Asked();
    EXPECT_TRUE(Permitted());
    EndRequest();
    Asked("who", "Test.Rights", "");
    EXPECT_FALSE(Permitted());
    EXPECT_TRUE(log.Lines().empty());
}

}  // namespace
