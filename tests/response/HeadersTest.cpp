#include "tests/response/Fixture.h"

using support::Parse;

namespace {

typedef Response ResponseHeaders;
typedef Response ResponseStatus;

TEST_F(ResponseHeaders, StoresAndReplacesAValue) {
    EXPECT_FALSE(response.HasHeader("X-One"));
    EXPECT_TRUE(response.SetHeader("X-One", "first"));
    EXPECT_TRUE(response.SetHeader("X-One", "second"));
    EXPECT_TRUE(response.HasHeader("X-One"));
    EXPECT_EQ(response.GetHeader("X-One", "none"), "second");
    EXPECT_EQ(Stored("headers", "X-One"), Json::Value("second"));
}

TEST_F(ResponseHeaders, RefusesAnEmptyName) {
    const Json::Value before = response.GetHeaders();
    EXPECT_FALSE(response.SetHeader("", "value"));
    EXPECT_EQ(response.GetHeaders(), before);
    EXPECT_FALSE(response.HasHeader(""));
}

TEST_F(ResponseHeaders, AnswersTheFallbackForWhatIsNotThere) {
    EXPECT_EQ(response.GetHeader("X-One", "none"), "none");
    EXPECT_EQ(response.GetHeader("", "none"), "none") << "the whole section is no value";
    EXPECT_EQ(response.GetHeader("content-type", "none"), "none") << "names are case-sensitive";
}

TEST_F(ResponseHeaders, TakesOneOut) {
    response.SetHeader("X-One", "1");
    EXPECT_TRUE(response.RemoveHeader("Content-type"));
    EXPECT_FALSE(response.HasHeader("Content-type"));
    EXPECT_TRUE(response.HasHeader("X-One"));
}

TEST_F(ResponseHeaders, TakesNothingOutThatIsNotThere) {
    const Json::Value before = response.GetHeaders();
    for (const char* name : {"", "content-type", "X-One"}) {
        EXPECT_FALSE(response.RemoveHeader(name)) << name;
    }
    EXPECT_EQ(response.GetHeaders(), before);
}

TEST_F(ResponseHeaders, KeepsAnEmptyValue) {
    EXPECT_TRUE(response.SetHeader("X-One", ""));
    EXPECT_TRUE(response.HasHeader("X-One"));
    EXPECT_EQ(response.GetHeader("X-One", "none"), "");
}

TEST_F(ResponseHeaders, AnswersAllOfThem) {
    response.SetHeader("X-One", "1");
    Json::Value wanted;
    wanted["Content-type"] = "text/html; charset=\"UTF-8\"";
    wanted["X-One"] = "1";
    EXPECT_EQ(response.GetHeaders(), wanted);
}

TEST_F(ResponseHeaders, ReplacesTheContentType) {
    EXPECT_TRUE(response.SetHeader("Content-type", "image/png"));
    EXPECT_EQ(response.GetHeaders(), Parse(R"({"Content-type": "image/png"})"));
}

TEST_F(ResponseHeaders, CarriesTheServerErrorAsAHeader) {
    response.SetServerError("disk full");
    EXPECT_TRUE(response.HasServerError());
    EXPECT_EQ(response.GetServerError(), "disk full");
    EXPECT_EQ(response.GetHeader("x-request-error", ""), "disk full");
    response.SetServerError("");
    EXPECT_TRUE(response.HasServerError());
    EXPECT_EQ(response.GetServerError(), "");
}

TEST_F(ResponseHeaders, SeesAServerErrorThatWasSetAsAHeader) {
    EXPECT_TRUE(response.SetHeader("x-request-error", "out of paper"));
    EXPECT_TRUE(response.HasServerError());
    EXPECT_EQ(response.GetServerError(), "out of paper");
}

TEST_F(ResponseStatus, StoresNumberAndMessage) {
    EXPECT_TRUE(response.SetStatus(TALO::HTTP_STATUS_NOT_FOUND, "Not here"));
    EXPECT_EQ(response.GetHeader("Status", ""), "404");
    EXPECT_EQ(Stored("headers", "Status"), Json::Value("404"));
    EXPECT_EQ(Stored("option", "statusMsg"), Json::Value("Not here"));
    EXPECT_EQ(response.GetStatus(), 404);
}

TEST_F(ResponseStatus, ReplacesAnEarlierOne) {
    EXPECT_TRUE(response.SetStatus(TALO::HTTP_STATUS_NOT_FOUND, "Not here"));
    EXPECT_TRUE(response.SetStatus(TALO::HTTP_STATUS_FOUND, ""));
    EXPECT_EQ(response.GetStatus(), 302);
    EXPECT_EQ(Stored("option", "statusMsg"), Json::Value(""));
}

TEST_F(ResponseStatus, StoresNoMessageWhenTheHeaderCannotBeSet) {
    LoseSection("headers");
    EXPECT_FALSE(response.SetStatus(TALO::HTTP_STATUS_NOT_FOUND, "Not here"));
    EXPECT_EQ(Stored("option", "statusMsg"), Json::Value("nothing stored"));
    EXPECT_EQ(response.GetStatus(), 200);
    EXPECT_EQ(response.GetHeaders(), Json::Value(Json::objectValue));
}

TEST_F(ResponseStatus, FailsWhenTheMessageCannotBeStored) {
    LoseSection("option");
    EXPECT_FALSE(response.SetStatus(TALO::HTTP_STATUS_NOT_FOUND, "Not here"));
    EXPECT_EQ(response.GetStatus(), 404);
}

TEST_F(ResponseStatus, ReadsTheNumberOutOfTheHeader) {
    response.SetHeader("Status", "503 Service Unavailable");
    EXPECT_EQ(response.GetStatus(), 503);
    response.SetHeader("Status", "  201");
    EXPECT_EQ(response.GetStatus(), 201);
}

TEST_F(ResponseStatus, AnswersANumberForAHeaderThatHoldsNone) {
    for (const char* text : {"", "abc", "99999999999999999999"}) {
        response.SetHeader("Status", text);
        EXPECT_NO_THROW((void)response.GetStatus());
    }
    response.SetHeader("Status", "abc");
    EXPECT_EQ(response.GetStatus(), 0);
}

TEST(HTTPStatus, IsTheNumberItself) {
    EXPECT_EQ(static_cast<int>(TALO::HTTP_STATUS_OK), 200);
    EXPECT_EQ(static_cast<int>(TALO::HTTP_STATUS_FOUND), 302);
    EXPECT_EQ(static_cast<int>(TALO::HTTP_STATUS_NOT_FOUND), 404);
    EXPECT_EQ(static_cast<int>(TALO::HTTP_STATUS_INTERNAL_SERVER_ERROR), 500);
}

}  // namespace
