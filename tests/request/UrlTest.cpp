#include <gtest/gtest.h>

#include <string>

#include "tests/fake/FakePlatform.h"
#include "tests/support/Json.h"
#include "webapi/APIRequest.h"

namespace {

using support::Parse;
using TALO::APIRequest;

APIRequest Request(const Json::Value& environ) {
    Json::Value document(Json::objectValue);
    document["environ"] = environ;
    return APIRequest(document);
}

APIRequest Asking(const std::string& environ) {
    return Request(Parse(environ));
}

class RemoteAddress : public ::testing::Test {
  protected:
    RemoteAddress() {
        fake::Reset();
    }
    ~RemoteAddress() override {
        fake::Reset();
    }
    static int Asked() {
        return fake::Now().calls["TaloCgiGetRemoteIP"];
    }
};

struct SchemeRow {
    const char* name;
    const char* environ;
    const char* scheme;
};

TEST(URLScheme, IsReadFromTheEnvironment) {
    const SchemeRow rows[] = {
        {"lower", R"({"HTTPS": "on"})", "https"},
        {"upper", R"({"HTTPS": "ON"})", "https"},
        {"mixed", R"({"HTTPS": "oN"})", "https"},
        {"over the script", R"({"HTTPS": "on", "SCRIPT_URI": "http://nas/x"})", "https"},
        {"off", R"({"HTTPS": "off", "SCRIPT_URI": "http://nas/x"})", "http"},
        {"one is not on", R"({"HTTPS": "1", "SCRIPT_URI": "http://nas/x"})", "http"},
        {"longer is not on", R"({"HTTPS": "only", "SCRIPT_URI": "http://nas/x"})", "http"},
        {"forwarded", R"({"HTTP_X_FORWARDED_PROTO": "https"})", "https"},
        {"forwarded, upper", R"({"HTTP_X_FORWARDED_PROTO": "HTTPS"})", "https"},
        {"forwarded beside off", R"({"HTTPS": "off", "HTTP_X_FORWARDED_PROTO": "https"})", "https"},
        {"on beside forwarded", R"({"HTTPS": "on", "HTTP_X_FORWARDED_PROTO": "http"})", "https"},
        {"forwarded list", R"({"HTTP_X_FORWARDED_PROTO": "https, http"})", ""},
        {"forwarded plain", R"({"HTTP_X_FORWARDED_PROTO": "http"})", ""},
        {"script, secure", R"({"SCRIPT_URI": "https://nas:5001/x"})", "https"},
        {"script, first colon", R"({"SCRIPT_URI": "a:b:c"})", "a"},
        {"script, without colon", R"({"SCRIPT_URI": "plain"})", "plain"},
        {"script, only a colon", R"({"SCRIPT_URI": ":"})", ""},
        {"script, case kept", R"({"SCRIPT_URI": "HTTP://nas"})", "HTTP"},
        {"nothing", R"({})", ""},
    };
    for (const SchemeRow& row : rows) {
        EXPECT_EQ(Asking(row.environ).GetURLProto("argument"), row.scheme) << row.name;
    }
}

struct HostRow {
    const char* host;
    const char* scheme;
    const char* expectedHost;
    int expectedPort;
};

constexpr char kNoHost[] = "no host";
constexpr int kNoPort = -42;

TEST(URLHostAndPort, AreReadFromTheHostHeader) {
    const HostRow rows[] = {
        {"[::1]:5001", "http", "[::1]", 5001},
        {"[::1]", "https", "[::1]", 443},
        {"[::1]", "http", "[::1]", 80},
        {"[::1]", "", "[::1]", kNoPort},
        {"[::1]:", "https", "[::1]", 443},
        {"[fe80::1]x:99", "http", "[fe80::1]", 99},
        {"[a]b]:7", "http", "[a]b]", 7},
        {"[]:7", "http", "[]", 7},
        {"[::1", "https", kNoHost, kNoPort},
        {"[", "https", kNoHost, kNoPort},
        {"nas:5000", "https", "nas", 5000},
        {"nas.example:65535", "", "nas.example", 65535},
        {"nas:0080", "https", "nas", 80},
        {"a:b:5000", "http", "a:b", 5000},
        {"::1", "http", ":", 1},
        {"nas]:5", "http", "nas]", 5},
        {"nas", "http", "nas", 80},
        {"nas", "https", "nas", 443},
        {"nas", "ftp", "nas", kNoPort},
        {"nas", "HTTPS", "nas", kNoPort},
        {"nas", "", "nas", kNoPort},
        {"nas:", "http", "nas", 80},
        {"nas:", "", "nas", kNoPort},
        {":81", "http", "", 81},
        {":", "https", "", 443},
        {"", "https", kNoHost, kNoPort},
    };
    for (const HostRow& row : rows) {
        Json::Value environ(Json::objectValue);
        environ["HTTP_HOST"] = row.host;
        environ["SCRIPT_URI"] = std::string(row.scheme) + "://ignored:1/x";
        const APIRequest request = Request(environ);
        EXPECT_EQ(request.GetURLHost(kNoHost), row.expectedHost) << row.host << " " << row.scheme;
        EXPECT_EQ(request.GetURLPort(kNoPort), row.expectedPort) << row.host << " " << row.scheme;
    }
}

TEST(URLHostAndPort, AreTheArgumentsWithoutAHostHeader) {
    const APIRequest request = Asking(R"({"HTTPS": "on"})");
    EXPECT_EQ(request.GetURLHost("argument"), "argument");
    EXPECT_EQ(request.GetURLPort(7), 7);
}

TEST(URLHostAndPort, TakeTheirPortFromTheSecureSchemeOfAProxy) {
    const APIRequest request =
        Asking(R"({"HTTP_HOST": "nas", "HTTP_X_FORWARDED_PROTO": "https", "SCRIPT_URI": "http:"})");
    EXPECT_EQ(request.GetURLPort(7), 443);
}

TEST(URLParts, AreParsedOnEachUse) {
    APIRequest request = Asking(R"({"HTTP_HOST": "one:1", "SCRIPT_URI": "http:"})");
    EXPECT_EQ(request.GetURLPort(0), 1);
    request.InitEnv(Parse(R"({"HTTP_HOST": "two:2", "HTTPS": "on"})"));
    EXPECT_EQ(request.GetURLPort(0), 2);
    EXPECT_EQ(request.GetURLHost(""), "two");
    EXPECT_EQ(request.GetURLProto(""), "https");
}

TEST(URLParts, StayAsTheyWereWhenTheHostHeaderBecomesUnreadable) {
    APIRequest request = Asking(R"({"HTTP_HOST": "one:1"})");
    EXPECT_EQ(request.GetURLHost(""), "one");
    for (const char* host : {"[two:2", ""}) {
        Json::Value environ(Json::objectValue);
        environ["HTTP_HOST"] = host;
        request.InitEnv(environ);
        EXPECT_EQ(request.GetURLHost("argument"), "one") << host;
        EXPECT_EQ(request.GetURLPort(7), 1) << host;
    }
}

TEST(URLParts, LoseAPortThatNoLongerHolds) {
    APIRequest request = Asking(R"({"HTTP_HOST": "one:1"})");
    EXPECT_EQ(request.GetURLPort(7), 1);
    request.InitEnv(Parse(R"({"HTTP_HOST": "one"})"));
    EXPECT_EQ(request.GetURLPort(7), 7) << "the port text is stored empty";
}

TEST(URLNameAndPath, AlwaysReturnTheirArgument) {
    for (const char* script : {"/webapi/entry.cgi", "entry.cgi", "/", ""}) {
        Json::Value environ(Json::objectValue);
        environ["SCRIPT_NAME"] = script;
        environ["HTTP_HOST"] = "nas";
        const APIRequest request = Request(environ);
        EXPECT_EQ(request.GetURLName("name"), "name") << script;
        EXPECT_EQ(request.GetURLPath("path"), "path") << script;
        EXPECT_EQ(request.GetURLName(""), "") << script;
    }
}

TEST_F(RemoteAddress, IsAskedForOncePerRequest) {
    fake::Now().remoteAddress = "192.0.2.7";
    const APIRequest request = Asking("{}");
    EXPECT_EQ(request.GetRemoteIP(), "192.0.2.7");
    fake::Now().remoteAddress = "192.0.2.8";
    EXPECT_EQ(request.GetRemoteIP(), "192.0.2.7");
    EXPECT_EQ(Asked(), 1);
    EXPECT_EQ(request.GetEnv("talo_remoteIP", "none"), Json::Value("192.0.2.7"));
}

TEST_F(RemoteAddress, IsWrittenIntoAZeroedBufferOf65Bytes) {
    fake::Now().remoteAddress = std::string(64, 'a');
    EXPECT_EQ(Asking("{}").GetRemoteIP(), std::string(64, 'a'));
    ASSERT_EQ(fake::Now().remoteCalls.size(), 1u);
    EXPECT_EQ(fake::Now().remoteCalls[0].size, 65u);
    EXPECT_TRUE(fake::Now().remoteCalls[0].bufferWasZero);
}

TEST_F(RemoteAddress, IsEmptyAndAskedForAgainAfterAFailure) {
    const APIRequest request = Asking("{}");
    EXPECT_EQ(request.GetRemoteIP(), "");
    EXPECT_FALSE(request.HasEnv("talo_remoteIP"));
    fake::Now().remoteAddress = "192.0.2.7";
    EXPECT_EQ(request.GetRemoteIP(), "192.0.2.7");
    EXPECT_EQ(Asked(), 2);
}

TEST_F(RemoteAddress, IsNotAskedForWhenTheEnvironmentHasIt) {
    fake::Now().remoteAddress = "192.0.2.7";
    EXPECT_EQ(Asking(R"({"talo_remoteIP": "198.51.100.1"})").GetRemoteIP(), "198.51.100.1");
    EXPECT_EQ(Asking(R"({"talo_remoteIP": ""})").GetRemoteIP(), "");
    EXPECT_EQ(Asked(), 0);
}

}  // namespace
