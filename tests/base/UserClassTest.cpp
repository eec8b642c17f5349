#include "src/base/UserClass.h"

#include <gtest/gtest.h>

#include <string>

#include "tests/support/Json.h"

namespace {

using support::Parse;
using TALO::ListAdmits;
using TALO::UserClass;
using TALO::UserClassBit;

TEST(UserClassBit, IsThatOfTheExactName) {
    EXPECT_EQ(UserClassBit("admin.local"), 1);
    EXPECT_EQ(UserClassBit("admin.domain"), 2);
    EXPECT_EQ(UserClassBit("admin.ldap"), 4);
    EXPECT_EQ(UserClassBit("normal.local"), 8);
    EXPECT_EQ(UserClassBit("normal.domain"), 16);
    EXPECT_EQ(UserClassBit("normal.ldap"), 32);
    const std::string others[] = {
        "",       "admin",        "admin.",        "Admin.local",
        "guest.", "admin.local ", "current.users", std::string("admin.local\0", 12)};
    for (const std::string& other : others) {
        EXPECT_EQ(UserClassBit(other), 0) << other;
    }
}

struct NameRow {
    const char* user;
    const char* source;
};

TEST(UserClass, IsReadFromTheLoginName) {
    const NameRow rows[] = {
        {"ann", "local"},        {"", "local"},
        {"DOM\\ann", "domain"},  {"ann\\", "domain"},
        {"\\", "domain"},        {"ann@example", "ldap"},
        {"@", "ldap"},           {"DOM\\ann@x", "domain"},
        {"ann@x\\y", "domain"},  {"DOM/ann", "local"},
        {"ann.domain", "local"},
    };
    for (const NameRow& row : rows) {
        EXPECT_EQ(UserClass(row.user, true), std::string("admin.") + row.source) << row.user;
        EXPECT_EQ(UserClass(row.user, false), std::string("normal.") + row.source) << row.user;
    }
}

TEST(ListAdmits, ACallerWhoseClassIsInTheList) {
    const Json::Value list = Parse(R"([7, "admin.local", "normal.domain"])");
    EXPECT_TRUE(ListAdmits(list, "root", true));
    EXPECT_TRUE(ListAdmits(list, "DOM\\ann", false));
    EXPECT_FALSE(ListAdmits(list, "ann", false));
    EXPECT_FALSE(ListAdmits(list, "DOM\\root", true));
    EXPECT_FALSE(ListAdmits(list, "ann@example", false));
}

TEST(ListAdmits, NobodyWithoutAFilledList) {
    for (const char* list :
         {"null", "[]", "{}", "\"admin.local\"", R"({"admin.local": "admin.local"})", "true", "1",
          R"([["admin.local"]])", R"(["ADMIN.LOCAL"])", R"(["admin"])", R"([1, true, null])"}) {
        EXPECT_FALSE(ListAdmits(Parse(list), "root", true)) << list;
    }
}

TEST(ListAdmits, NoNullName) {
    EXPECT_FALSE(ListAdmits(Parse(R"(["admin.local", "normal.local"])"), nullptr, true));
    EXPECT_FALSE(ListAdmits(Parse(R"(["admin.local", "normal.local"])"), nullptr, false));
}

}  // namespace
