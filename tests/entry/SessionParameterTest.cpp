#include <cstdlib>
#include <string>

#include "tests/entry/EntryTest.h"
#include "tests/support/Json.h"

namespace {

class SessionParameter : public EntryTest {
  protected:
    // Initializes with a cookie header (null for none) and a query, and answers
    // whether all three views of the cookie are `expected`.
    static void ExpectCookie(const char* header, const std::string& query,
                             const std::string& expected, const std::string& sessionId) {
        SCOPED_TRACE(std::string(header != nullptr ? header : "(none)") + " with " + query);
        const Call call = header != nullptr ? Get(query).With("HTTP_COOKIE", header) : Get(query);
        Inside(call, [&](ProbeEntry& entry) {
            EXPECT_TRUE(entry.Initialize(Json::Value()));
            EXPECT_STREQ(std::getenv("HTTP_COOKIE"), expected.c_str());
            EXPECT_EQ(fake::Now().cookiesRead.back(), expected);
            EXPECT_EQ(fake::Now().cookiesRead.size(), 2u);
            EXPECT_EQ(entry.request->GetEnv("HTTP_COOKIE", Json::Value()), expected);
            EXPECT_EQ(entry.request->GetSessionID(), sessionId);
        });
    }

    static void ExpectUntouched(const Call& call) {
        Inside(call, [](ProbeEntry& entry) {
            EXPECT_TRUE(entry.Initialize(Json::Value()));
            EXPECT_STREQ(std::getenv("HTTP_COOKIE"), "id=OLD");
            EXPECT_EQ(fake::Now().cookiesRead, std::vector<std::string>{"id=OLD"});
            EXPECT_EQ(entry.request->GetSessionID(), "OLD");
        });
    }
};

TEST_F(SessionParameter, GoesBehindTheCookiesThereAre) {
    ExpectCookie("lang=en", "_sid=XYZ", "lang=en; id=XYZ", "XYZ");
}

TEST_F(SessionParameter, PutsAnOlderSessionOutOfTheWay) {
    ExpectCookie("id=OLD", "_sid=XYZ", "abandoned=OLD; id=XYZ", "XYZ");
}

TEST_F(SessionParameter, ReplacesTheFirstMatchAlsoWithinALongerName) {
    ExpectCookie("sid=S1", "_sid=XYZ", "sabandoned=S1; id=XYZ", "XYZ");
    ExpectCookie("sid=S1; id=OLD", "_sid=XYZ", "sabandoned=S1; id=OLD; id=XYZ", "XYZ");
    ExpectCookie("id=A; id=B", "_sid=XYZ", "abandoned=A; id=B; id=XYZ", "XYZ");
}

TEST_F(SessionParameter, IsTheWholeHeaderWhenThereIsNone) {
    ExpectCookie(nullptr, "_sid=XYZ", "id=XYZ", "XYZ");
    ExpectCookie("", "_sid=XYZ", "id=XYZ", "XYZ");
}

TEST_F(SessionParameter, MayBeEmpty) {
    ExpectCookie("id=OLD", "_sid=", "abandoned=OLD; id=", "");
}

TEST_F(SessionParameter, ComesFromTheBodyToo) {
    Inside(Post("_sid=XYZ").With("HTTP_COOKIE", "id=OLD").With("QUERY_STRING", "_sid=QUERY"),
           [](ProbeEntry& entry) {
               EXPECT_TRUE(entry.Initialize(Json::Value()));
               EXPECT_STREQ(std::getenv("HTTP_COOKIE"), "abandoned=OLD; id=XYZ");
           });
}

TEST_F(SessionParameter, ReachesTheMethod) {
    const Reply reply = Serve(GetMethod("echo", "&_sid=XYZ").With("HTTP_COOKIE", "lang=en"));
    ASSERT_EQ(reply.Code(), 0) << reply.output;
    EXPECT_EQ(reply.body["data"]["session"], "XYZ");
    EXPECT_EQ(reply.body["data"]["cookieHeader"], "lang=en; id=XYZ");
}

TEST_F(SessionParameter, IsIgnoredWhenItIsMissingOrNoText) {
    for (const char* query : {"", "sid=XYZ", "_sid=12345", "_sid=1.5", "_sid=true", "_sid=[]",
                              "_sid=%5B%22XYZ%22%5D", "_sid={}"}) {
        SCOPED_TRACE(query);
        ExpectUntouched(Get(query).With("HTTP_COOKIE", "id=OLD"));
    }
}

TEST_F(SessionParameter, StaysWhenTheContextCannotReadIt) {
    fake::Now().FailCall("TaloCgiLoadInCookies", 2);
    const Reply reply = Serve(GetMethod("echo", "&_sid=XYZ"));
    EXPECT_EQ(reply.Code(), 0);
    EXPECT_EQ(reply.body["data"]["session"], "XYZ");
}

}  // namespace
