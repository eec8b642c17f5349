#include <gtest/gtest.h>

#include "tests/fake/FakePlatform.h"
#include "tests/support/Json.h"
#include "webapi/APIRequest.h"

using support::Parse;
using TALO::APIRequest;

namespace {

// A request whose session holds one fact.
class Fact {
  public:
    Fact(const char* key, const Json::Value& value) : request(Document(key, value)) {}
    APIRequest request;

  private:
    static Json::Value Document(const char* key, const Json::Value& value) {
        Json::Value document;
        document["session"][key] = value;
        return document;
    }
};

struct TextRow {
    const char* key;
    std::string (APIRequest::*get)() const;
    const char* byDefault;
};

const TextRow kTexts[] = {
    {"app", &APIRequest::GetApplication, ""},
    {"sessFile", &APIRequest::GetSessionFilePath, ""},
    {"uiLang", &APIRequest::GetUILanguage, "enu"},
    {"username", &APIRequest::GetLoginUserName, ""},
    {"webapi", &APIRequest::GetWebAPIPriv, ""},
};

struct FlagRow {
    const char* key;
    bool (APIRequest::*get)() const;
    bool byDefault;
};

const FlagRow kFlags[] = {
    {"isAuthorized", &APIRequest::IsAuthorized, false},
    {"isTimeout", &APIRequest::IsTimeout, true},
    {"isSkipCheckIP", &APIRequest::IsSkipCheckIP, true},
    {"isAdmin", &APIRequest::IsAdmin, false},
};

TEST(SessionFacts, AnswerTheirDefaultsWhenAbsent) {
    const APIRequest request((Json::Value()));
    for (const TextRow& row : kTexts) {
        EXPECT_EQ((request.*row.get)(), row.byDefault) << row.key;
    }
    for (const FlagRow& row : kFlags) {
        EXPECT_EQ((request.*row.get)(), row.byDefault) << row.key;
    }
    EXPECT_EQ(request.GetTimeoutDuration(), 0);
    EXPECT_FALSE(request.HasAppPriv("any"));
}

TEST(SessionFacts, AnswerTheStoredTexts) {
    for (const TextRow& row : kTexts) {
        const Fact fact(row.key, "stored");
        for (const TextRow& other : kTexts) {
            EXPECT_EQ((fact.request.*other.get)(), &other == &row ? "stored" : other.byDefault)
                << row.key << " read as " << other.key;
        }
    }
}

TEST(SessionFacts, ReadOtherTypesAsTexts) {
    for (const TextRow& row : kTexts) {
        SCOPED_TRACE(row.key);
        EXPECT_EQ((Fact(row.key, "").request.*row.get)(), "");
        EXPECT_EQ((Fact(row.key, 12).request.*row.get)(), "12");
        EXPECT_EQ((Fact(row.key, true).request.*row.get)(), "true");
        EXPECT_EQ((Fact(row.key, 1.5).request.*row.get)(), "1.5");
        EXPECT_EQ((Fact(row.key, Json::Value()).request.*row.get)(), "") << "null has no default";
        EXPECT_NO_THROW((void)(Fact(row.key, Parse(R"(["a"])")).request.*row.get)());
        EXPECT_NO_THROW((void)(Fact(row.key, Parse(R"({"a": 1})")).request.*row.get)());
    }
}

TEST(SessionFacts, AnswerTheStoredFlags) {
    for (const FlagRow& row : kFlags) {
        for (const bool stored : {false, true}) {
            const Fact fact(row.key, stored);
            for (const FlagRow& other : kFlags) {
                EXPECT_EQ((fact.request.*other.get)(), &other == &row ? stored : other.byDefault)
                    << row.key << " read as " << other.key;
            }
        }
    }
}

TEST(SessionFacts, ReadOtherTypesAsFlags) {
    for (const FlagRow& row : kFlags) {
        SCOPED_TRACE(row.key);
        for (const Json::Value& value :
             Parse(R"(["true", "false", "0", 1, -1, 0.5, [0], {"a": 0}])")) {
            EXPECT_TRUE((Fact(row.key, value).request.*row.get)()) << value;
        }
        for (const Json::Value& value : Parse(R"(["", 0, 0.0, [], {}, null])")) {
            EXPECT_FALSE((Fact(row.key, value).request.*row.get)()) << value;
        }
    }
}

TEST(SessionFacts, ReadTheTimeoutAsAnInteger) {
    const auto timeout = [](const Json::Value& value) {
        return Fact("timeout", value).request.GetTimeoutDuration();
    };
    EXPECT_EQ(timeout(15), 15);
    EXPECT_EQ(timeout("15"), 15);
    EXPECT_EQ(timeout("-1"), -1);
    EXPECT_EQ(timeout(15.9), 15);
    EXPECT_EQ(timeout(true), 1);
    EXPECT_EQ(timeout(Json::Value()), 0);
    EXPECT_EQ(timeout("abc"), 0);
    EXPECT_EQ(timeout("15 minutes"), 0);
    EXPECT_EQ(timeout(""), 0);
    EXPECT_EQ(timeout(Parse("2147483648")), 0);
    EXPECT_EQ(timeout("99999999999999999999"), 0);
    EXPECT_EQ(timeout(Parse("[15]")), 0);
    EXPECT_EQ(timeout(Parse(R"({"a": 15})")), 0);
}

TEST(SessionFacts, CompareTheWholeApplicationPrivilege) {
    const auto has = [](const Json::Value& stored, const char* name) {
        return Fact("appPriv", stored).request.HasAppPriv(name);
    };
    EXPECT_TRUE(has("TALO.Files", "TALO.Files"));
    EXPECT_FALSE(has("TALO.Files", "TALO.File"));
    EXPECT_FALSE(has("TALO.File", "TALO.Files"));
    EXPECT_FALSE(has("TALO.Files", "talo.files"));
    EXPECT_FALSE(has("TALO.Files", ""));
    EXPECT_TRUE(has("", ""));
    EXPECT_FALSE(has(Parse(R"(["TALO.Files"])"), "TALO.Files"));
    EXPECT_FALSE(has(Parse(R"({"TALO.Files": true})"), "TALO.Files"));
    EXPECT_FALSE(has(5, "5"));
    EXPECT_FALSE(has(true, "true"));
    EXPECT_FALSE(has(Json::Value(), ""));
}

TEST(SessionFacts, AreNotReadFromElsewhere) {
    const APIRequest request(Parse(R"({"environ": {"username": "eve", "isAdmin": "1"},
        "getParam": {"username": "eve", "isAdmin": true, "isAuthorized": true, "isTimeout": false},
        "reqLib": {"username": "eve", "isAdmin": true}})"));
    EXPECT_EQ(request.GetLoginUserName(), "");
    EXPECT_FALSE(request.IsAdmin());
    EXPECT_FALSE(request.IsAuthorized());
    EXPECT_TRUE(request.IsTimeout());
}

TEST(DemoMode, IsNeverOn) {
    EXPECT_FALSE(APIRequest(Parse(R"({"session": {"isDemo": true}, "environ": {"DEMO": "1"}})"))
                     .IsDemoMode());
}

class PreferenceFolder : public ::testing::Test {
  protected:
    PreferenceFolder() {
        fake::Reset();
        fake::Now().userPreference = {{"mia", "/prefs/mia"}, {"", "/prefs/nobody"}};
        fake::Now().groupPreference = {{"staff", "/prefs/@staff"}};
    }
    ~PreferenceFolder() override {
        fake::Reset();
    }

    Fact mia{"username", "mia"};
};

TEST_F(PreferenceFolder, IsTheOneOfTheLoginUser) {
    EXPECT_EQ(mia.request.GetPreferenceDir(), "/prefs/mia");
    EXPECT_EQ(Fact("username", "").request.GetPreferenceDir(), "/prefs/nobody");
}

TEST_F(PreferenceFolder, IsTmpWhenTheUserHasNone) {
    EXPECT_EQ(Fact("username", "ben").request.GetPreferenceDir(), "/tmp");
    fake::Now().FailCall("TALOUserPreferenceDirGet", 1);
    EXPECT_EQ(mia.request.GetPreferenceDir(), "/tmp");
    EXPECT_EQ(mia.request.GetPreferenceDir(), "/prefs/mia");
}

TEST_F(PreferenceFolder, IsTheOneOfTheGroup) {
    EXPECT_EQ(mia.request.GetGroupPreferenceDir("staff"), "/prefs/@staff");
    EXPECT_EQ(mia.request.GetGroupPreferenceDir("mia"), "/tmp");
    fake::Now().FailCall("TALOGroupPreferenceDirGet", 1);
    EXPECT_EQ(mia.request.GetGroupPreferenceDir("staff"), "/tmp");
}

TEST_F(PreferenceFolder, MayBe1023BytesLong) {
    const std::string longest = "/" + std::string(1022, 'x');
    fake::Now().userPreference["mia"] = longest;
    fake::Now().groupPreference["staff"] = longest;
    EXPECT_EQ(mia.request.GetPreferenceDir(), longest);
    EXPECT_EQ(mia.request.GetGroupPreferenceDir("staff"), longest);
    fake::Now().userPreference["mia"] = longest + "x";
    fake::Now().groupPreference["staff"] = longest + "x";
    EXPECT_EQ(mia.request.GetPreferenceDir(), "/tmp");
    EXPECT_EQ(mia.request.GetGroupPreferenceDir("staff"), "/tmp");
}

}  // namespace
