#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "src/request/APIRequestPrivate.h"
#include "tests/fake/FakePlatform.h"
#include "tests/support/Json.h"
#include "webapi/APIRequest.h"

namespace {

using support::Parse;
using TALO::APIRequest;

constexpr unsigned int kNoUser = 4294967295u;

APIRequest Request(const std::string& document) {
    return APIRequest(Parse(document));
}

Json::Value Session(const APIRequest& request, const char* key) {
    TALO::APIRequestPrivate* d = nullptr;
    std::memcpy(&d, reinterpret_cast<const char*>(&request) + sizeof(void*), sizeof d);
    return d->GetData("session", key, Json::Value("absent"));
}

struct ListRow {
    const char* list;
    int mask;
};

TEST(AllowedUsers, AreAMaskOfTheDescriptionsList) {
    const ListRow rows[] = {
        {R"(["admin.local"])", 1},
        {R"(["admin.domain"])", 2},
        {R"(["admin.ldap"])", 4},
        {R"(["normal.local"])", 8},
        {R"(["normal.domain"])", 16},
        {R"(["normal.ldap"])", 32},
        {R"(["admin.local", "admin.domain", "admin.ldap",
             "normal.local", "normal.domain", "normal.ldap"])",
         63},
        {R"(["admin.local", "normal.ldap", "ADMIN.LOCAL", 7])", 33},
        {R"(["admin.local", "admin.local"])", 1},
        {R"(["admin.local ", " admin.local", "admin", "local", ""])", 0},
        {R"(["current.users"])", 0},
        {R"([["admin.local"], {"admin.local": true}, null, true, 1])", 0},
        {R"([1, "normal.local"])", 8},
        {R"([])", 0},
        {R"("admin.local")", 0},
        {R"({"admin.local": true})", 0},
        {R"(null)", 0},
        {R"(63)", 0},
    };
    for (const ListRow& row : rows) {
        const APIRequest request =
            Request(std::string(R"({"reqLib": {"allowUser": )") + row.list + "}}");
        EXPECT_EQ(request.GetAllowUser(), row.mask) << row.list;
        EXPECT_EQ(request.GetAllowUser(), row.mask) << row.list << ", asked again";
    }
}

TEST(AllowedUsers, AreNoneWithoutADescription) {
    EXPECT_EQ(APIRequest{Json::Value()}.GetAllowUser(), 0);
}

TEST(AllowedUsers, OfTheSessionAreTakenWithoutALookAtTheDescription) {
    EXPECT_EQ(Request(R"({"session": {"allowUser": 8}, "reqLib": {"allowUser": ["admin.local"]}})")
                  .GetAllowUser(),
              8);
}

TEST(AllowedUsers, OfTheSessionAreComputedWhenTheyAreZero) {
    EXPECT_EQ(Request(R"({"session": {"allowUser": 0}, "reqLib": {"allowUser": ["admin.local"]}})")
                  .GetAllowUser(),
              1);
}

TEST(AllowedUsers, AreComputedOnceAndKept) {
    APIRequest request = Request(R"({"reqLib": {"allowUser": ["admin.local"]}})");
    EXPECT_EQ(request.GetAllowUser(), 1);
    EXPECT_EQ(Session(request, "allowUser"), Json::Value(1));
    request.InitAPIInfo(Parse(R"({"allowUser": ["normal.local"]})"));
    EXPECT_EQ(request.GetAllowUser(), 1);
}

TEST(AllowedUsers, AreComputedAgainForNewSessionFacts) {
    APIRequest request = Request(R"({"reqLib": {"allowUser": ["admin.local"]}})");
    EXPECT_EQ(request.GetAllowUser(), 1);
    request.InitAPIInfo(Parse(R"({"allowUser": ["normal.local"]})"));
    request.InitSession(Parse(R"({"username": "ann"})"));
    EXPECT_EQ(request.GetAllowUser(), 8);
}

TEST(AllowedUsers, OfAListWithoutAKnownClassAreKeptAsZeroAndComputedAgain) {
    APIRequest request = Request(R"({"reqLib": {"allowUser": ["somebody"]}})");
    EXPECT_EQ(request.GetAllowUser(), 0);
    EXPECT_EQ(Session(request, "allowUser"), Json::Value(0));
    request.InitAPIInfo(Parse(R"({"allowUser": ["normal.local"]})"));
    EXPECT_EQ(request.GetAllowUser(), 8);
}

TEST(AllowedUsers, OfNoListAreNotKept) {
    for (const char* document :
         {R"({})", R"({"reqLib": {"allowUser": []}})", R"({"reqLib": {"allowUser": "text"}})"}) {
        const APIRequest request = Request(document);
        EXPECT_EQ(request.GetAllowUser(), 0) << document;
        EXPECT_EQ(Session(request, "allowUser"), Json::Value("absent")) << document;
    }
}

class LoginUID : public ::testing::Test {
  protected:
    LoginUID() {
        fake::Reset();
        fake::Now().uids["ann"] = 1026;
    }
    ~LoginUID() override {
        fake::Reset();
    }
    static size_t Asked() {
        return fake::Now().uidCalls.size();
    }
    static constexpr char kAnn[] = R"({"environ": {"HTTP_COOKIE": "id=s1"},
                                       "session": {"username": "ann"}})";
};

struct StoredRow {
    const char* uid;
    unsigned int expected;
};

TEST_F(LoginUID, OfTheSessionIsTakenWithoutAskingThePlatform) {
    const StoredRow rows[] = {
        {"1026", 1026},          {"0", 0},           {"-1", kNoUser},
        {"4294967295", kNoUser}, {"-2", 4294967294}, {"2147483648", 2147483648u},
        {"\"1026\"", 1026},
    };
    for (const StoredRow& row : rows) {
        Json::Value document = Parse(kAnn);
        document["session"]["uid"] = Parse(row.uid);
        EXPECT_EQ(APIRequest(document).GetLoginUID(), row.expected) << row.uid;
    }
    EXPECT_EQ(Asked(), 0u);
}

TEST_F(LoginUID, IsNobodyWithoutAUserNameAndWithoutAsking) {
    for (const char* session : {R"({})", R"({"username": ""})"}) {
        Json::Value document = Parse(kAnn);
        document["session"] = Parse(session);
        EXPECT_EQ(APIRequest(document).GetLoginUID(), kNoUser) << session;
    }
    EXPECT_EQ(Asked(), 0u);
}

TEST_F(LoginUID, IsAskedForWithSessionAndUser) {
    EXPECT_EQ(Request(kAnn).GetLoginUID(), 1026u);
    ASSERT_EQ(Asked(), 1u);
    EXPECT_EQ(fake::Now().uidCalls[0].sessionId, "s1");
    EXPECT_EQ(fake::Now().uidCalls[0].user, "ann");
}

TEST_F(LoginUID, IsAskedForAlsoWithoutASessionCookie) {
    EXPECT_EQ(Request(R"({"session": {"username": "ann"}})").GetLoginUID(), 1026u);
    ASSERT_EQ(Asked(), 1u);
    EXPECT_EQ(fake::Now().uidCalls[0].sessionId, "");
}

TEST_F(LoginUID, IsNeverKept) {
    const APIRequest request = Request(kAnn);
    EXPECT_EQ(request.GetLoginUID(), 1026u);
    EXPECT_EQ(Session(request, "uid"), Json::Value("absent"));
    fake::Now().uids["ann"] = 1027;
    EXPECT_EQ(request.GetLoginUID(), 1027u);
    fake::Now().uids["ann"] = 0;
    EXPECT_EQ(request.GetLoginUID(), 0u);
    EXPECT_EQ(request.GetLoginUID(), 0u);
    EXPECT_EQ(Asked(), 4u);
}

TEST_F(LoginUID, OfASessionThatDoesNotResolveIsTheNegativeAnswer) {
    fake::Now().uids["ann"] = -1;
    EXPECT_EQ(Request(kAnn).GetLoginUID(), kNoUser);
    fake::Now().uids["ann"] = -3;
    EXPECT_EQ(Request(kAnn).GetLoginUID(), 4294967293u);
    fake::Now().uids.clear();
    EXPECT_EQ(Request(kAnn).GetLoginUID(), kNoUser);
}

}  // namespace
