#include "hosts/linux/account/AccountLine.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "hosts/linux/account/AccountName.h"
#include "hosts/linux/util/LineObject.h"

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

constexpr char kHash[] = "$y$j9T$abcdefgh$0123456789";

bool Parse(const std::string& line, host::StoredAccount* stored) {
    std::string reason;
    const bool understood =
        host::ParseAccountLine(line.data(), line.data() + line.size(), stored, nullptr, &reason);
    EXPECT_NE(understood, !reason.empty()) << line;
    return understood;
}

TEST(AccountName, IsOfLettersDigitsAndFiveSigns) {
    const std::string accepted[] = {"a",
                                    "Z",
                                    "0",
                                    "_",
                                    "_x",
                                    "a.b-c_d",
                                    "user@example.org",
                                    "DOMAIN\\user",
                                    std::string(64, 'x')};
    for (const std::string& name : accepted) {
        EXPECT_TRUE(host::IsAccountName(name)) << name;
    }
    const std::string refused[] = {"",
                                   std::string(65, 'x'),
                                   ".",
                                   "..",
                                   ".a",
                                   "-a",
                                   "@a",
                                   "\\a",
                                   "a/b",
                                   "../a",
                                   "a b",
                                   " a",
                                   "a ",
                                   "a\n",
                                   "a\tb",
                                   "a:b",
                                   "a\"b",
                                   "a*",
                                   "a%2f",
                                   "\xc3\xa4",
                                   std::string("a\0", 2),
                                   std::string("\0a", 2),
                                   std::string(1, '\0')};
    for (const std::string& name : refused) {
        EXPECT_FALSE(host::IsAccountName(name)) << name;
    }
}

TEST(AccountLine, ReadsEveryMember) {
    host::StoredAccount stored;
    ASSERT_TRUE(
        Parse(std::string("{\"name\":\"anna\",\"uid\":1024,\"password\":\"") + kHash +
                  "\",\"groups\":[\"administrators\",\"staff\"],\"locked\":true,"
                  "\"passwordExpires\":4102444800,"
                  "\"privileges\":{\"Acme.Light\":[\"10.0.0.0/8\",\"::1\"],\"Acme.Door\":[]}}",
              &stored));
    EXPECT_EQ("anna", stored.account.name);
    EXPECT_EQ(1024u, stored.account.uid);
    EXPECT_EQ(kHash, stored.hash);
    EXPECT_THAT(stored.account.groups, ElementsAre("administrators", "staff"));
    EXPECT_TRUE(stored.account.locked);
    EXPECT_EQ(4102444800, stored.account.passwordExpires);
    EXPECT_EQ(2u, stored.account.privileges.size());
    EXPECT_THAT(stored.account.privileges["Acme.Light"], ElementsAre("10.0.0.0/8", "::1"));
    EXPECT_THAT(stored.account.privileges["Acme.Door"], IsEmpty());
}

TEST(AccountLine, NeedsNoMoreThanNameAndUid) {
    host::StoredAccount stored;
    ASSERT_TRUE(Parse(" {\"uid\":1,\"name\":\"a\"}\r", &stored));
    EXPECT_EQ("", stored.hash);
    EXPECT_FALSE(stored.account.locked);
    EXPECT_EQ(0, stored.account.passwordExpires);
    EXPECT_THAT(stored.account.groups, IsEmpty());
    EXPECT_THAT(stored.account.privileges, IsEmpty());
}

TEST(AccountLine, RefusesOneWrongMemberWhole) {
    const std::string members[] = {
        "\"uid\":0",
        "\"uid\":-1",
        "\"uid\":2147483648",
        "\"uid\":1.0",
        "\"uid\":\"7\"",
        "\"uid\":null",
        "\"name\":\"\"",
        "\"name\":\"a/b\"",
        "\"name\":\"a\\u0000\"",
        "\"name\":7",
        "\"name\":[\"a\"]",
        "\"password\":7",
        "\"password\":\"plain\"",
        "\"password\":\"$6$salt$hash\"",
        "\"password\":\"$y$\"",
        "\"password\":\"$y$j9T$abc$\"",
        "\"password\":null",
        "\"groups\":\"administrators\"",
        "\"groups\":[1]",
        "\"groups\":[\"\"]",
        "\"groups\":{\"a\":1}",
        "\"locked\":\"true\"",
        "\"locked\":0",
        "\"locked\":null",
        "\"passwordExpires\":-1",
        "\"passwordExpires\":\"0\"",
        "\"passwordExpires\":1e30",
        "\"passwordExpires\":18446744073709551615",
        "\"privileges\":[]",
        "\"privileges\":{\"x\":\"10.0.0.0/8\"}",
        "\"privileges\":{\"x\":[\"10.0.0.0/33\"]}",
        "\"privileges\":{\"x\":[7]}",
        "\"privileges\":{\"\":[]}",
        "\"privileges\":{\"a b\":[]}",
    };
    for (const std::string& member : members) {
        host::StoredAccount stored;
        stored.account.name = "untouched";
        EXPECT_FALSE(Parse("{\"name\":\"a\",\"uid\":1," + member + "}", &stored)) << member;
        EXPECT_EQ("untouched", stored.account.name) << member;
    }
}

TEST(AccountLine, RefusesWhatIsNotOneStrictObject) {
    const std::string lines[] = {
        "x",
        "{",
        "{}",
        "[]",
        "null",
        "\"a\"",
        "{\"name\":\"a\"}",
        "{\"uid\":1}",
        "{\"name\":\"a\",\"uid\":1}}",
        "{\"name\":\"a\",\"uid\":1} x",
        "{\"name\":\"a\",\"uid\":1,}",
        "// comment",
        "{'name':'a','uid':1}",
        "{\"name\":\"a\",\"uid\":1}" + std::string(1, '\0'),
        std::string(100000, '['),
        "{\"name\":\"a\",\"uid\":1,\"x\":" + std::string(20, '[') + std::string(20, ']') + "}"};
    for (const std::string& line : lines) {
        host::StoredAccount stored;
        EXPECT_FALSE(Parse(line, &stored)) << line.substr(0, 60);
    }
}

TEST(AccountLine, RendersOneLineWithEveryMember) {
    const std::string line =
        "{\"future\":{\"a\":[1,2.5,\"\xc3\xa4\\n\"]},\"name\":\"a\",\"uid\":1}";
    host::StoredAccount stored;
    Json::Value members;
    std::string reason;
    ASSERT_TRUE(
        host::ParseAccountLine(line.data(), line.data() + line.size(), &stored, &members, &reason));
    EXPECT_EQ(line, host::RenderLineObject(members));
}

}  // namespace
