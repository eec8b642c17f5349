#include <stdlib.h>

#include <filesystem>
#include <string>
#include <vector>

#include "src/base/ErrorCode.h"
#include "tests/entry/RelayFixture.h"
#include "tests/support/PrivateMember.h"
#include "tests/support/TempFolder.h"

namespace support {

struct RelayPermissionCache {
    typedef Json::Value TALO::WebEntry::*Type;
    friend Type Find(RelayPermissionCache);
};
template struct PrivateMember<RelayPermissionCache, &TALO::WebEntry::permissionCache>;

}  // namespace support

// Who may have a call forwarded: whoever has a session. What he may do there is
// for the other appliance to say.

namespace {

class RelaySession : public RelayFixture {
  protected:
    // The results of the session check that the entry has in store: with timed-out
    // sessions allowed, and without.
    static Json::Value Cached(ProbeEntry& entry) {
        return (entry.*Find(support::RelayPermissionCache()))["permResult"];
    }

    // Whether the first check of the session let timed-out ones pass.
    static int FirstAllowance() {
        return fake::Now().authCalls.empty() ? -1 : fake::Now().authCalls[0].allowTimeout;
    }
};

TEST_F(RelaySession, IsNeededWhateverTheAPIAsksFor) {
    for (const char* level : {"0", "1", "2", "null"}) {
        DescribeFar(std::string(R"({"authLevel": )") + level + "}");
        for (const char* cookie : {"", "lang=enu", "id="}) {
            Refuse(Far().With("HTTP_COOKIE", cookie), TALO::kErrorNoSession, [](ProbeEntry&) {
                EXPECT_EQ(Operations(), "");
                EXPECT_TRUE(fake::Now().authCalls.empty());
            });
        }
        RefuseAtOnce(Far().With("HTTP_COOKIE", "id=other"), TALO::kErrorPermission);
        (void)Forward(Far(), [](const fake::RelayCall&) {});
    }
}

// The reply has the code alone: no "x-request-error" line tells it once more.
TEST_F(RelaySession, MapsEachResultOfThePlatformToACode) {
    const struct {
        int result;
        int code;
    } rows[] = {
        {-1, TALO::kErrorSessionTimeout}, {-2, TALO::kErrorPermission},
        {-3, TALO::kErrorPermission},     {-4, TALO::kErrorPermission},
        {-5, TALO::kErrorNoSession},      {-6, TALO::kErrorPermission},
        {0, TALO::kErrorPermission},      {3, TALO::kErrorPermission},
        {100, TALO::kErrorPermission},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.result);
        Session().result = row.result;
        RefuseAtOnce(Far(), row.code);
    }
    for (const int result : {1, 2}) {
        Session().result = result;
        (void)Forward(Far(), [](const fake::RelayCall&) {});
    }
}

TEST_F(RelaySession, MayComeAsAParameter) {
    const Call call = Far("&_sid=s1").Without("HTTP_COOKIE");
    (void)Forward(call, [](const fake::RelayCall& forwarded) {
        // The platform's client drops it: the target has sessions of its own.
        EXPECT_EQ(forwarded.params["_sid"], "s1");
    });
}

TEST_F(RelaySession, AsksForNoClassOfUserAndNoPrivilege) {
    for (const char* rights :
         {R"({"authLevel": 1, "allowUser": ["admin.local"]})", R"({"authLevel": 1})",
          R"({"authLevel": 1, "allowUser": []})",
          R"({"authLevel": 1, "allowUser": ["normal.local"], "appPriv": "Photos"})"}) {
        SCOPED_TRACE(rights);
        DescribeFar(rights);
        (void)Forward(
            Far(), [](const fake::RelayCall&) { EXPECT_TRUE(fake::Now().privilegeCalls.empty()); });
    }
}

struct AllowanceRow {
    const char* description;
    const char* method;
    int allowed;
};

constexpr AllowanceRow kAllowances[] = {
    {"{}", "list", 0},
    {"{}", "tolerant", 0},
    {R"({"skipTimeout": false})", "tolerant", 0},
    {R"({"skipTimeout": null})", "tolerant", 0},
    {R"({"skipTimeout": 0})", "list", 0},
    {R"({"skipTimeout": ""})", "list", 0},
    {R"({"skipTimeout": true})", "list", 1},
    {R"({"skipTimeout": true})", "tolerant", 1},
    {R"({"skipTimeout": 1})", "list", 1},
    {R"({"methods": {"1": [{"list": {"skipTimeout": true}}]}})", "list", 0},
};

TEST_F(RelaySession, MayHaveTimedOutWhereTheAPIsDescriptionSaysSo) {
    Session().result = -1;
    for (const AllowanceRow& row : kAllowances) {
        SCOPED_TRACE(std::string(row.description) + " " + row.method);
        DescribeFar(row.description);
        const Call call =
            ByAnn(Get(std::string("api=Test.Far&version=1&relay_nd=7&method=") + row.method));
        if (row.allowed == 0) {
            Refuse(call, TALO::kErrorSessionTimeout,
                   [](ProbeEntry&) { EXPECT_EQ(FirstAllowance(), 0); });
        } else {
            (void)Forward(call, [](const fake::RelayCall&) { EXPECT_EQ(FirstAllowance(), 1); });
        }
    }
}

TEST_F(RelaySession, IsCheckedOnceForEachVariantOfARequest) {
    (void)Inside(Far(), [](ProbeEntry& entry) {
        (void)entry.Run(Json::Value());
        EXPECT_TRUE(Cached(entry)[0].isNull());
        EXPECT_EQ(Cached(entry)[1], 1);
        EXPECT_EQ(entry.CheckPermission(false), 0);
        EXPECT_EQ(fake::Now().authCalls.size(), 1u);
    });
    Session().timeoutAllowed = 2;
    DescribeFar(R"({"skipTimeout": true})");
    (void)Inside(Far(), [](ProbeEntry& entry) {
        ASSERT_TRUE(entry.Initialize(Json::Value()));
        EXPECT_EQ(entry.CheckPermission(true), 0);
        EXPECT_EQ(fake::Now().authCalls.size(), 1u);
        EXPECT_TRUE(entry.ProcessRelay(entry.request, entry.response));
        EXPECT_EQ(Cached(entry)[0], 2);
        size_t tolerant = 0;
        for (const fake::AuthCall& check : fake::Now().authCalls) {
            tolerant += check.allowTimeout == 1 ? 1 : 0;
        }
        EXPECT_EQ(tolerant, 1u);
    });
}

TEST_F(RelaySession, GivesTheRequestItsFacts) {
    (void)Inside(Far(), [](ProbeEntry& entry) {
        (void)entry.Run(Json::Value());
        EXPECT_EQ(entry.request->GetLoginUserName(), "ann");
        EXPECT_TRUE(entry.request->IsAuthorized());
        EXPECT_STREQ(getenv("TALO_WEBAPI_USERNAME"), "ann");
    });
}

// Who works on another appliance all day is at work here too.
TEST_F(RelaySession, LivesOnByTheCallUnlessThatIsPassiveOrItHasTimedOut) {
    const support::TempFolder folder;
    const std::string file = std::filesystem::canonical(folder.Write("s1", "{}")).string();
    fake::Now().sessionDir = std::filesystem::path(file).parent_path().string();
    const auto renews = [](const char* method, const std::vector<std::string>& files) {
        SCOPED_TRACE(method);
        (void)Forward(ByAnn(Get(std::string("api=Test.Far&version=1&relay_nd=7&method=") + method)),
                      [&files](const fake::RelayCall&) {
                          std::vector<std::string> touched;
                          for (const fake::TouchCall& touch : fake::Now().touched) {
                              touched.push_back(touch.path);
                          }
                          EXPECT_EQ(touched, files);
                      });
    };
    renews("list", {file});
    renews("passive", {});
    DescribeFar(R"({"skipTimeout": true})");
    renews("list", {file});
    Session().result = -1;
    renews("list", {});
    DescribeFar("{}");
    Refuse(Far(), TALO::kErrorSessionTimeout,
           [](ProbeEntry&) { EXPECT_TRUE(fake::Now().touched.empty()); });
}

}  // namespace
