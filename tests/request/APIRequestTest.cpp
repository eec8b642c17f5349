#include "webapi/APIRequest.h"

#include <gtest/gtest.h>

#include "tests/request/Private.h"
#include "tests/support/Json.h"

using support::Parse;
using TALO::APIRequest;

namespace {

// Looks at every section, also those that have no accessor of their own.
struct Store : TALO::APIRequestPrivate {
    Store() : TALO::APIRequestPrivate(nullptr) {}
    const Json::Value& Everything() const {
        return store;
    }
};

TEST(Request, CreatesItsEightSectionsEmpty) {
    EXPECT_EQ(Store().Everything(), Parse(R"({"environ": {}, "cookie": {}, "reqLib": {},
        "session": {}, "param": {}, "attr": {}, "url": {}, "userAgent": {}})"));
}

TEST(Request, HasNoOtherSection) {
    Store store;
    EXPECT_FALSE(store.SetData("other", "key", 1, false));
    EXPECT_EQ(store.Everything().size(), 8u);
}

TEST(Request, IsEmptyForADocumentThatIsNoFilledObject) {
    for (const Json::Value& document :
         Parse(R"([null, {}, [], ["environ"], "environ", 5, 1.5, true])")) {
        const APIRequest request(document);
        for (const char* section :
             {"environ", "cookie", "reqLib", "session", "param", "attr", "url", "userAgent"}) {
            EXPECT_EQ(PrivateOf(request)->GetData(section, "", Json::Value()),
                      Json::Value(Json::objectValue));
        }
        EXPECT_EQ(request.GetRequestMethod(), 0);
        EXPECT_EQ(request.GetAPIClass(), "");
        EXPECT_EQ(request.GetAPIMethod(), "");
        EXPECT_EQ(request.GetAPIVersion(), 0);
        EXPECT_EQ(request.GetUILanguage(), "enu");
        EXPECT_TRUE(request.IsTimeout());
        EXPECT_TRUE(request.IsSkipCheckIP());
        EXPECT_FALSE(request.IsAuthorized());
        EXPECT_FALSE(request.IsDemoMode());
    }
}

TEST(Request, FillsEverySectionFromItsDocument) {
    const APIRequest request(Parse(R"({
        "environ": {"REQUEST_METHOD": "GET", "HTTP_COOKIE": "id=abc"},
        "getParam": {"api": "TALO.System", "version": 2, "method": "ping", "text": "hi"},
        "postParam": {"count": 3},
        "reqLib": {"authLevel": 1},
        "session": {"username": "mia"}})"));
    EXPECT_EQ(request.GetRequestMethod(), 1);
    EXPECT_EQ(request.GetSessionID(), "abc");
    EXPECT_EQ(request.GetAPIClass(), "TALO.System");
    EXPECT_EQ(request.GetAPIVersion(), 2);
    EXPECT_EQ(request.GetAPIMethod(), "ping");
    EXPECT_EQ(request.GetParam("text", Json::Value()), Json::Value("hi"));
    EXPECT_EQ(request.GetParam("count", Json::Value()), Json::Value(3));
    EXPECT_EQ(request.GetAPIInfo("authLevel", Json::Value()), Json::Value(1));
    EXPECT_EQ(request.GetLoginUserName(), "mia");
}

TEST(Request, IgnoresOtherMembersOfItsDocument) {
    const APIRequest request(Parse(R"({"cookie": {"id": "abc"}, "attr": {"a": 1},
        "param": {"api": "X"}, "url": {"urlHost": "evil"}, "userAgent": {"uaIPad": true}})"));
    for (const char* section : {"cookie", "attr", "param", "url", "userAgent"}) {
        EXPECT_EQ(PrivateOf(request)->GetData(section, "", Json::Value()),
                  Json::Value(Json::objectValue))
            << section;
    }
    EXPECT_EQ(request.GetAPIClass(), "");
}

TEST(Request, FillsEachSectionOnItsOwn) {
    EXPECT_EQ(APIRequest(Parse(R"({"environ": {"A": "1"}})")).GetEnv("A", ""), Json::Value("1"));
    EXPECT_EQ(APIRequest(Parse(R"({"getParam": {"a": 1}})")).GetParam("a", 0), Json::Value(1));
    EXPECT_EQ(APIRequest(Parse(R"({"postParam": {"a": 1}})")).GetParam("a", 0), Json::Value(1));
    EXPECT_EQ(APIRequest(Parse(R"({"reqLib": {"a": 1}})")).GetAPIInfo("a", 0), Json::Value(1));
    EXPECT_EQ(APIRequest(Parse(R"({"session": {"app": "x"}})")).GetApplication(), "x");
}

TEST(Request, TakesMembersThatAreNoObjectsAsEmpty) {
    for (const char* value : {"null", "[]", "[1]", R"("text")", "5", "true", "{}"}) {
        SCOPED_TRACE(value);
        Json::Value document;
        for (const char* member : {"environ", "getParam", "postParam", "reqLib", "session"}) {
            document[member] = Parse(value);
        }
        const APIRequest request(document);
        for (const char* section : {"environ", "cookie", "reqLib", "session", "param"}) {
            EXPECT_EQ(PrivateOf(request)->GetData(section, "", Json::Value()),
                      Json::Value(Json::objectValue))
                << section;
        }
    }
}

TEST(Request, LeavesItsDocumentAlone) {
    const Json::Value document = Parse(R"({"environ": {"A": "1"},
        "getParam": {"__cIpHeRtExT": "x", "a": 1}, "postParam": {"webapi": {"__cIpHeRtExT": "x"}}})");
    const Json::Value before = document;
    const APIRequest request(document);
    EXPECT_EQ(document, before);
}

TEST(Request, ReplacesTheDescription) {
    APIRequest request(Parse(R"({"reqLib": {"a": 1, "b": 2}})"));
    request.InitAPIInfo(Parse(R"({"b": [3], "c": null})"));
    EXPECT_EQ(request.GetAPIInfo("", Json::Value()), Parse(R"({"b": [3], "c": null})"));
    request.InitAPIInfo(Json::Value());
    EXPECT_EQ(request.GetAPIInfo("", Json::Value()), Json::Value(Json::objectValue));
}

TEST(Request, ReplacesTheSession) {
    APIRequest request(Parse(R"({"session": {"username": "mia", "isAdmin": true}})"));
    request.InitSession(Parse(R"({"app": "x", "timeout": 15})"));
    EXPECT_EQ(request.GetLoginUserName(), "");
    EXPECT_FALSE(request.IsAdmin());
    EXPECT_EQ(request.GetApplication(), "x");
    EXPECT_EQ(request.GetTimeoutDuration(), 15);
    request.InitSession(Parse("[]"));
    EXPECT_EQ(request.GetApplication(), "");
}

}  // namespace
