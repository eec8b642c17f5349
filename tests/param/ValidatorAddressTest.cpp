#include <gtest/gtest.h>

#include <string>

#include "tests/fake/FakePlatform.h"
#include "webapi/APIValidator.h"

using TALO::APIValidator;

namespace {

class NameTest : public ::testing::Test {
  protected:
    NameTest() {
        fake::Reset();
    }
    ~NameTest() override {
        fake::Reset();
    }

    // What the platform says of a text.
    static void Answer(const char* operation, const std::string& text, int answer) {
        fake::Now().nameAnswers[{operation, text}] = answer;
    }
};

typedef NameTest AddressTests;

TEST_F(AddressTests, FollowTheFamilyThatThePlatformTells) {
    const struct {
        const char* name;
        int family;
        bool isIPv4;
        bool isIPv6;
        bool isIP;
    } rows[] = {
        {"neither", 0, false, false, false}, {"IPv4", 2, true, false, true},
        {"IPv6", 10, false, true, true},     {"a family unheard of", 17, false, false, true},
        {"one", 1, false, false, true},      {"negative", -1, false, false, true},
    };
    for (const auto& row : rows) {
        Answer("TALONetGetAddrType", "text", row.family);
        EXPECT_EQ(APIValidator::IsIPv4("text"), row.isIPv4) << row.name;
        EXPECT_EQ(APIValidator::IsIPv6("text"), row.isIPv6) << row.name;
        EXPECT_EQ(APIValidator::IsIP("text"), row.isIP) << row.name;
    }
}

TEST_F(AddressTests, HandOverTheTextAsItIs) {
    (void)APIValidator::IsIP(" 10.0.0.1 ");
    const std::vector<std::pair<std::string, std::string>> wanted = {
        {"TALONetGetAddrType", " 10.0.0.1 "}};
    EXPECT_EQ(fake::Now().nameCalls, wanted);
}

struct NameRow {
    const char* operation;
    bool (*test)(const std::string& value);
};

const NameRow kNameTests[] = {
    {"BlTLIBIsDomain", APIValidator::IsDomain},
    {"BlTLIBIsHostname", APIValidator::IsHostname},
};

TEST_F(NameTest, TakesAnyAnswerButZeroForYes) {
    for (const NameRow& row : kNameTests) {
        for (const int answer : {0, 1, 2, -1}) {
            Answer(row.operation, "a b", answer);
            EXPECT_EQ(row.test("a b"), answer != 0) << row.operation << answer;
        }
    }
}

TEST_F(NameTest, AsksItsOwnOperation) {
    for (const NameRow& row : kNameTests) {
        fake::Reset();
        EXPECT_TRUE(row.test("nas.example.org"));
        const std::vector<std::pair<std::string, std::string>> wanted = {
            {row.operation, "nas.example.org"}};
        EXPECT_EQ(fake::Now().nameCalls, wanted);
    }
}

TEST_F(NameTest, AsksNobodyAboutAnEmptyTextOrANul) {
    const std::string texts[] = {"", std::string(1, '\0'), std::string("10.0.0.1\0", 9),
                                 std::string("10.0.0.1\0;x", 11), std::string("\0::1", 4)};
    for (const std::string& text : texts) {
        // Whatever the platform would say of what it could read.
        Answer("TALONetGetAddrType", text.c_str(), 2);
        Answer("BlTLIBIsDomain", text.c_str(), 1);
        Answer("BlTLIBIsHostname", text.c_str(), 1);
        EXPECT_FALSE(APIValidator::IsIPv4(text));
        EXPECT_FALSE(APIValidator::IsIPv6(text));
        EXPECT_FALSE(APIValidator::IsIP(text));
        EXPECT_FALSE(APIValidator::IsDomain(text));
        EXPECT_FALSE(APIValidator::IsHostname(text));
    }
    EXPECT_TRUE(fake::Now().nameCalls.empty());
}

}  // namespace
