#include <gtest/gtest.h>
#include <syslog.h>
#include <time.h>

#include <climits>
#include <cstring>
#include <regex>
#include <stdexcept>
#include <string>

#include "src/response/APIResponsePrivate.h"
#include "tests/support/Json.h"
#include "tests/support/LogCapture.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

namespace {

using support::Parse;
using TALO::APIRequest;
using TALO::APIResponse;
using TALO::APIResponsePrivate;

APIResponsePrivate* Private(const APIResponse& response) {
    APIResponsePrivate* d = nullptr;
    std::memcpy(&d, &response, sizeof d);
    return d;
}

// A cookie of the session with every argument that a test may change.
struct Wish {
    std::string name = "id";
    std::string value = "abc";
    std::string path = "/";
    long minutes = 0;
    std::string domain = "";
    bool secure = false;
    bool httponly = false;

    bool AddTo(APIResponse& response) const {
        return Private(response)->AddCookie(name, value, path, minutes, domain, secure, httponly);
    }
};

// The only cookie that a new response then has.
std::string Line(const Wish& wish, APIRequest* request = nullptr) {
    APIResponse response(request);
    EXPECT_TRUE(wish.AddTo(response));
    const Json::Value cookies = response.GetCookies();
    EXPECT_EQ(cookies.size(), 1u);
    return cookies[0].asString();
}

std::string LineAt(const char* clientTime, long minutes) {
    APIRequest request(Parse(std::string(R"({"getParam": {"client_time": )") + clientTime + "}}"));
    Wish wish;
    wish.minutes = minutes;
    return Line(wish, &request);
}

std::string ExpiryAt(time_t when) {
    char text[64];
    struct tm parts = {};
    EXPECT_NE(gmtime_r(&when, &parts), nullptr);
    EXPECT_NE(strftime(text, sizeof text, "%a, %d-%b-%Y %H:%M:%S GMT", &parts), 0u);
    return std::string("id=abc; path=/; expires=") + text;
}

TEST(AddCookie, WritesNameValueAndPath) {
    EXPECT_EQ(Line(Wish()), "id=abc; path=/");
}

TEST(AddCookie, WritesItsPartsInOrder) {
    Wish wish;
    wish.path = "/web";
    wish.minutes = -1;
    wish.domain = "example.com";
    wish.secure = true;
    wish.httponly = true;
    EXPECT_EQ(Line(wish),
              "id=abc; path=/web; expires=Thu, 01-Jan-1970 00:00:01 GMT; domain=example.com; "
              "secure; httponly");
}

TEST(AddCookie, WritesEachOptionalPartAlone) {
    Wish domain, secure, httponly;
    domain.domain = "example.com";
    secure.secure = true;
    httponly.httponly = true;
    EXPECT_EQ(Line(domain), "id=abc; path=/; domain=example.com");
    EXPECT_EQ(Line(secure), "id=abc; path=/; secure");
    EXPECT_EQ(Line(httponly), "id=abc; path=/; httponly");
}

TEST(AddCookie, EncodesTheValueAndNothingElse) {
    Wish wish;
    wish.value = "a b;c=d\r\n\xC3\xA4";
    wish.path = "/a b";
    EXPECT_EQ(Line(wish), "id=a%20b%3Bc%3Dd%0D%0A%C3%A4; path=/a b");
}

TEST(AddCookie, RefusesEmptyPartsWithoutALogLine) {
    const support::LogCapture log;
    Wish name, value, path;
    name.name = "";
    value.value = "";
    path.path = "";
    for (const Wish* wish : {&name, &value, &path}) {
        APIResponse response(nullptr);
        EXPECT_FALSE(wish->AddTo(response));
        EXPECT_EQ(response.GetCookies(), Json::Value(Json::arrayValue));
    }
    EXPECT_TRUE(log.Lines().empty());
}

TEST(AddCookie, AcceptsLettersDigitsUnderscoresAndHyphens) {
    Wish wish;
    wish.name = "ABCXYZabcxyz0189_-";
    EXPECT_EQ(Line(wish), "ABCXYZabcxyz0189_-=abc; path=/");
}

TEST(AddCookie, RefusesEveryOtherCharacterInANameAndLogsIt) {
    for (int byte = 0; byte < 256; ++byte) {
        const char character = static_cast<char>(byte);
        const bool allowed = (byte >= '0' && byte <= '9') || (byte >= 'A' && byte <= 'Z') ||
                             (byte >= 'a' && byte <= 'z') || byte == '_' || byte == '-';
        for (const std::string& name : {std::string("k") + character, character + std::string("k"),
                                        std::string(1, character)}) {
            const support::LogCapture log;
            Wish wish;
            wish.name = name;
            APIResponse response(nullptr);
            EXPECT_EQ(wish.AddTo(response), allowed) << byte;
            EXPECT_EQ(response.GetCookies().size(), allowed ? 1u : 0u) << byte;
            EXPECT_EQ(log.Lines().size(), allowed ? 0u : 1u) << byte;
        }
    }
}

TEST(AddCookie, NamesSourceOperationAndKeyInTheLog) {
    const support::LogCapture log;
    Wish wish;
    wish.name = "a.b.c";
    APIResponse response(nullptr);
    EXPECT_FALSE(wish.AddTo(response));
    ASSERT_EQ(log.Lines().size(), 1u) << "once, at the first such character";
    EXPECT_EQ(log.Lines()[0].priority, LOG_ERR);
    EXPECT_TRUE(std::regex_match(
        log.Lines()[0].text,
        std::regex(R"(\w+\.cpp\(\d+\)AddCookie: key\[a\.b\.c\] contains invalid character)")))
        << log.Lines()[0].text;
}

TEST(AddCookie, ChecksTheNameBeforeItsPartsAreEncoded) {
    APIResponse response(nullptr);
    Wish bad;
    bad.name = "a%20b";
    EXPECT_FALSE(bad.AddTo(response));
}

TEST(AddCookie, DeletesWithAnyNegativeNumberOfMinutes) {
    for (const long minutes : {-1L, -60L, LONG_MIN}) {
        Wish wish;
        wish.minutes = minutes;
        EXPECT_EQ(Line(wish), "id=abc; path=/; expires=Thu, 01-Jan-1970 00:00:01 GMT") << minutes;
        EXPECT_EQ(LineAt("1000000", minutes), Line(wish)) << "whatever the client's clock says";
    }
}

TEST(AddCookie, HasNoExpiryForZeroMinutesAlsoWithAClientTime) {
    EXPECT_EQ(LineAt("1000000", 0), "id=abc; path=/");
}

struct ClockRow {
    const char* clientTime;
    long minutes;
    const char* expiry;
};

TEST(AddCookie, FollowsTheClocksOfClients) {
    const ClockRow rows[] = {
        {"0", 1, "Thu, 01-Jan-1970 00:01:00 GMT"},
        {"\"0\"", 1, "Thu, 01-Jan-1970 00:01:00 GMT"},
        {"60", 1, "Thu, 01-Jan-1970 00:02:00 GMT"},
        {"\"60\"", 1, "Thu, 01-Jan-1970 00:02:00 GMT"},
        {"-60", 1, "Thu, 01-Jan-1970 00:00:00 GMT"},
        {"0", 20L * 365 * 24 * 60, "Wed, 27-Dec-1989 00:00:00 GMT"},
        {"2147483647", 1, "Tue, 19-Jan-2038 03:15:07 GMT"},
        {"null", 1, "Thu, 01-Jan-1970 00:01:00 GMT"},
    };
    for (const ClockRow& row : rows) {
        EXPECT_EQ(LineAt(row.clientTime, row.minutes),
                  std::string("id=abc; path=/; expires=") + row.expiry)
            << row.clientTime;
    }
}

TEST(AddCookie, SurvivesAClientTimeThatIsNoInteger) {
    for (const char* time : {"\"soon\"", "[1]", "{}", "1e300", "9223372036854775807"}) {
        EXPECT_EQ(LineAt(time, 1), LineAt("0", 1)) << time;
    }
}

TEST(AddCookie, TakesItsOwnClockWithoutAClientTime) {
    APIRequest plain{Json::Value()};
    for (APIRequest* request : {static_cast<APIRequest*>(nullptr), &plain}) {
        Wish wish;
        wish.minutes = 90;
        const time_t before = time(nullptr);
        const std::string line = Line(wish, request);
        const time_t after = time(nullptr);
        bool found = false;
        for (time_t now = before; now <= after; ++now) {
            found = found || line == ExpiryAt(now + 90 * 60);
        }
        EXPECT_TRUE(found) << line;
    }
}

TEST(AddCookie, KeepsEveryCookieInOrder) {
    APIResponse response(nullptr);
    EXPECT_TRUE(response.AddCookie("/", "one", "1"));
    EXPECT_FALSE(response.AddCookie("/", "", "1"));
    EXPECT_TRUE(response.AddCookie("/", "two", "2"));
    EXPECT_TRUE(response.AddCookie("/", "one", "1"));
    EXPECT_EQ(response.GetCookies(),
              Parse(R"(["one=1; path=/", "two=2; path=/", "one=1; path=/"])"));
    EXPECT_EQ(response.GetHeaders().size(), 1u) << "no header is set for a cookie";
}

TEST(AddCookie, TakesThePathFirstInItsPublicForm) {
    APIResponse response(nullptr);
    EXPECT_TRUE(response.AddCookie("/path", "name", "value"));
    EXPECT_EQ(response.GetCookies()[0], Json::Value("name=value; path=/path"));
    EXPECT_FALSE(response.AddCookie("name", "/path", "value")) << "a path is no name";
}

TEST(AddCookie, HasNoExpiryInItsPublicFormWhateverTheClock) {
    APIRequest request(Parse(R"({"getParam": {"client_time": 5}})"));
    APIResponse response(&request);
    EXPECT_TRUE(response.AddCookie("/", "name", "value"));
    EXPECT_EQ(response.GetCookies()[0], Json::Value("name=value; path=/"));
}

struct RedirectRow {
    const char* environ;
    const char* path;
    const char* location;
};

TEST(Redirect, LeadsToAPathOfTheClientsHost) {
    const RedirectRow rows[] = {
        {R"({"HTTPS": "on", "HTTP_HOST": "nas:5001"})", "a/b", "https://nas:5001/a/b"},
        {R"({"HTTPS": "on", "HTTP_HOST": "nas:5001"})", "/a/b", "https://nas:5001/a/b"},
        {R"({"SCRIPT_URI": "http://x/", "HTTP_HOST": "[::1]"})", "/", "http://[::1]/"},
        {R"({"HTTPS": "on", "HTTP_HOST": "nas"})", "//other", "https://nas//other"},
        {R"({"HTTPS": "on", "HTTP_HOST": "nas"})", "http://other/x", "https://nas/http://other/x"},
        {R"({"HTTPS": "on", "HTTP_HOST": "[bad"})", "x", "https://[bad/x"},
        {R"({"HTTPS": "on"})", "x", "https:///x"},
        {R"({"HTTP_HOST": "nas"})", "x", "://nas/x"},
        {R"({})", "/x", ":///x"},
    };
    for (const RedirectRow& row : rows) {
        Json::Value document(Json::objectValue);
        document["environ"] = Parse(row.environ);
        APIRequest request(document);
        APIResponse response(&request);
        EXPECT_TRUE(response.Redirect(row.path)) << row.location;
        EXPECT_EQ(response.GetHeader("Location", "none"), row.location);
        EXPECT_EQ(response.GetHeader("Status", "none"), "302") << row.location;
        EXPECT_EQ(response.GetStatus(), 302) << row.location;
        EXPECT_EQ(Private(response)->GetData("option", "statusMsg", Json::Value()),
                  Json::Value(""));
    }
}

TEST(Redirect, OfThePrivateHalfLeavesTheStatus) {
    APIRequest request(Parse(R"({"environ": {"HTTP_HOST": "nas"}})"));
    APIResponse response(&request);
    EXPECT_TRUE(Private(response)->Redirect("/x"));
    EXPECT_EQ(response.GetHeader("Location", "none"), "://nas/x");
    EXPECT_FALSE(response.HasHeader("Status"));
}

TEST(Redirect, FailsWithoutARequestAndLeavesTheStatus) {
    APIResponse response(nullptr);
    EXPECT_FALSE(response.Redirect("/x"));
    EXPECT_FALSE(Private(response)->Redirect("")) << "before the path is looked at";
    EXPECT_FALSE(response.HasHeader("Location"));
    EXPECT_FALSE(response.HasHeader("Status"));
    EXPECT_EQ(response.GetStatus(), 200);
}

TEST(Redirect, ThrowsForAnEmptyPath) {
    APIRequest request{Json::Value()};
    APIResponse response(&request);
    EXPECT_THROW((void)response.Redirect(""), std::out_of_range);
    EXPECT_FALSE(response.HasHeader("Location"));
    EXPECT_FALSE(response.HasHeader("Status"));
}

TEST(Redirect, ReplacesAnEarlierOne) {
    APIRequest request(Parse(R"({"environ": {"HTTP_HOST": "nas", "HTTPS": "on"}})"));
    APIResponse response(&request);
    EXPECT_TRUE(response.Redirect("/one"));
    EXPECT_TRUE(response.Redirect("/two"));
    EXPECT_EQ(response.GetHeader("Location", "none"), "https://nas/two");
}

}  // namespace
