#include "hosts/linux/cgi/SessionRecord.h"

#include <gtest/gtest.h>

#include <string>

namespace {

talo::Session Parsed(const std::string& text) {
    talo::Session session;
    EXPECT_TRUE(host::ParseSessionRecord(text, &session)) << text;
    return session;
}

// A record with one more member.
std::string With(const std::string& member) {
    return R"({"user":"u","handle":"h",)" + member + "}";
}

TEST(SessionRecord, ComesBackAsItWas) {
    talo::Session session;
    session.user = "u";
    session.address = "192.0.2.1";
    session.language = "fre";
    session.application = "a\"\\/\n\t b";
    session.privilege = "\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80";
    session.timeout = 90;
    session.skipAddress = true;
    session.handle = "h1";
    session.created = 1700000000;
    const std::string text = host::FormatSessionRecord(session);
    const talo::Session read = Parsed(text);
    EXPECT_EQ(read.user, session.user);
    EXPECT_EQ(read.address, session.address);
    EXPECT_EQ(read.language, session.language);
    EXPECT_EQ(read.application, session.application);
    EXPECT_EQ(read.privilege, session.privilege);
    EXPECT_EQ(read.timeout, session.timeout);
    EXPECT_TRUE(read.skipAddress);
    EXPECT_EQ(read.handle, session.handle);
    EXPECT_EQ(read.created, session.created);
    EXPECT_EQ(host::FormatSessionRecord(read), text);
    EXPECT_EQ(text.find('\n'), std::string::npos);
}

TEST(SessionRecord, NeedsUserAndHandleOnly) {
    const talo::Session session = Parsed(R"({"user":"u","handle":"h"})");
    EXPECT_EQ(session.user, "u");
    EXPECT_EQ(session.handle, "h");
    EXPECT_EQ(session.address + session.language + session.application + session.privilege, "");
    EXPECT_EQ(session.timeout, 0);
    EXPECT_FALSE(session.skipAddress);
    EXPECT_EQ(session.created, 0);
}

TEST(SessionRecord, IsRefusedWithoutThem) {
    for (const char* text : {"",
                             "{}",
                             "[]",
                             "null",
                             "\"u\"",
                             R"({"user":"u"})",
                             R"({"handle":"h"})",
                             R"({"user":"","handle":"h"})",
                             R"({"user":"u","handle":""})",
                             R"({"user":1,"handle":"h"})",
                             R"({"user":"u","handle":1})",
                             R"({"user":null,"handle":"h"})",
                             R"({"user":["u"],"handle":"h"})",
                             R"({"user":{"u":1},"handle":"h"})",
                             R"({"user":"u","handle":"h")",
                             R"({"user":"u","handle":"h"}})",
                             R"({"user":"u","handle":"h",})",
                             R"({'user':'u','handle':'h'})",
                             R"({"User":"u","handle":"h"})",
                             R"({"user":"u","handle":"h","x":[[1]]})"}) {
        talo::Session session;
        session.user = "untouched";
        EXPECT_FALSE(host::ParseSessionRecord(text, &session)) << text;
        EXPECT_EQ(session.user, "untouched") << text;
    }
}

TEST(SessionRecord, ReadsTextsOfAnotherTypeAsEmpty) {
    for (const char* value : {"1", "true", "null", "[]", "{}", "1.5"}) {
        for (const char* name : {"address", "language", "application", "privilege"}) {
            const talo::Session session = Parsed(With("\"" + std::string(name) + "\":" + value));
            EXPECT_EQ(session.address + session.language + session.application + session.privilege,
                      "")
                << name << value;
        }
    }
}

TEST(SessionRecord, BelievesATimeoutOfAMinuteToAYear) {
    const struct {
        const char* value;
        int minutes;
    } rows[] = {
        {"1", 1},
        {"30", 30},
        {"527040", 527040},
        {"527041", 0},
        {"0", 0},
        {"-1", 0},
        {"2147483647", 0},
        {"2147483648", 0},
        {"1e300", 0},
        {"0.5", 0},
        {"\"30\"", 0},
        {"true", 0},
        {"null", 0},
        {"[30]", 0},
        {"{}", 0},
        {"-9223372036854775808", 0},
        {"18446744073709551615", 0},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(Parsed(With("\"timeout\":" + std::string(row.value))).timeout, row.minutes)
            << row.value;
    }
}

TEST(SessionRecord, KeepsTheApplianceThatActs) {
    talo::Session session;
    session.user = "u";
    session.handle = "h";
    EXPECT_EQ(host::FormatSessionRecord(session).find("node"), std::string::npos);
    for (const long long node : {1LL, 2LL, 9223372036854775807LL}) {
        session.node = node;
        EXPECT_EQ(Parsed(host::FormatSessionRecord(session)).node, node);
    }
    EXPECT_EQ(Parsed(R"({"user":"u","handle":"h"})").node, 0);
}

// Read as none it would be an ordinary session.
TEST(SessionRecord, IsRefusedWithAnApplianceThatIsNone) {
    for (const char* value :
         {"0", "-1", "1.0", "1.5", "1e2", "\"1\"", "\"\"", "true", "null", "[1]", "{}",
          "9223372036854775808", "18446744073709551615", "-9223372036854775808", "1e300"}) {
        talo::Session session;
        session.user = "untouched";
        EXPECT_FALSE(host::ParseSessionRecord(With("\"node\":" + std::string(value)), &session))
            << value;
        EXPECT_EQ(session.user, "untouched") << value;
    }
}

// A right that is half understood is none.
TEST(SessionRecord, IsExemptFromTheAddressOnlyByABoolean) {
    EXPECT_TRUE(Parsed(With(R"("skipAddress":true)")).skipAddress);
    for (const char* value : {"false", "1", "\"true\"", "\"1\"", "null", "[true]", "{}"}) {
        EXPECT_FALSE(Parsed(With("\"skipAddress\":" + std::string(value))).skipAddress) << value;
    }
}

TEST(SessionRecord, ReadsAnAgeThatIsNoneAsTheBeginning) {
    EXPECT_EQ(Parsed(With(R"("created":1700000000)")).created, 1700000000);
    for (const char* value : {"\"1\"", "null", "1e300", "18446744073709551615", "[]"}) {
        EXPECT_EQ(Parsed(With("\"created\":" + std::string(value))).created, 0) << value;
    }
}

}  // namespace
