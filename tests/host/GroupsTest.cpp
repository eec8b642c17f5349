#include <gtest/gtest.h>

#include <string>

#include "platform/System.h"

namespace {

TEST(Administrators, AreTheSuperuserAtLeast) {
    EXPECT_EQ(TLIBGroupIsAdminGroupMem("root", 0), 1);
}

TEST(Administrators, AreNotUsersThatDoNotExist) {
    for (const std::string& user :
         {std::string(), std::string("no-such-user-anywhere"), std::string("root "),
          std::string("root\n"), std::string("root:x"), std::string("../root"),
          std::string(70000, 'a')}) {
        EXPECT_LE(TLIBGroupIsAdminGroupMem(user.c_str(), 0), 0) << user.substr(0, 40);
    }
    EXPECT_EQ(TLIBGroupIsAdminGroupMem(nullptr, 0), 0);
}

TEST(Administrators, AreNotOrdinarySystemUsers) {
    EXPECT_EQ(TLIBGroupIsAdminGroupMem("nobody", 0), 0);
}

}  // namespace
