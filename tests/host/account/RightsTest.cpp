#include <gtest/gtest.h>

#include <filesystem>

#include "AccountRoot.h"
#include "hosts/linux/sdk/Sessions.h"
#include "platform/Cgi.h"
#include "platform/Paths.h"
#include "platform/System.h"

namespace fs = std::filesystem;

namespace {

constexpr char kAdmin[] = "\"groups\":[\"staff\",\"administrators\"]";

class Rights : public AccountRoot {
  public:
    static int IsAdmin(const char* user) {
        return TLIBGroupIsAdminGroupMem(user, 0);
    }

    static bool Has(const char* user, const char* privilege, const char* address) {
        return TLIBAppPrivUserHas(user, privilege, address) != 0;
    }
};

TEST_F(Rights, AdministratorsAreTheMembersOfOneGroup) {
    WriteAccounts(Line("anna", 1024, kAdmin) + Line("bob", 1025, "\"groups\":[\"staff\"]") +
                  Line("carl", 1026, "\"groups\":[\"Administrators\",\"administrator\"]"));
    EXPECT_EQ(1, IsAdmin("anna"));
    EXPECT_EQ(0, IsAdmin("bob"));
    EXPECT_EQ(0, IsAdmin("carl"));
    EXPECT_EQ(0, IsAdmin("nobody"));
    EXPECT_EQ(0, IsAdmin("Anna"));
}

TEST_F(Rights, NobodyIsNoAdministrator) {
    EXPECT_EQ(0, IsAdmin(nullptr));
    EXPECT_EQ(0, IsAdmin(""));
    EXPECT_EQ(0, IsAdmin("a/b"));
    EXPECT_EQ(0, IsAdmin(std::string(65, 'x').c_str()));
}

TEST_F(Rights, SuperuserIsAnAdministratorUnlessAnAccountHasHisName) {
    EXPECT_EQ(1, IsAdmin("root"));
    WriteAccounts(Line("anna", 1024));
    EXPECT_EQ(1, IsAdmin("root"));
    WriteAccounts(Line("root", 1024));
    EXPECT_EQ(0, IsAdmin("root"));
    WriteAccounts(Line("root", 1024, kAdmin));
    EXPECT_EQ(1, IsAdmin("root"));
}

TEST_F(Rights, OtherUsersOfTheMachineAreNobody) {
    EXPECT_EQ(0, IsAdmin("daemon"));
    EXPECT_FALSE(Has("daemon", "Acme.Light", "10.0.0.1"));
}

TEST_F(Rights, CannotBeToldFromAFileThatIsNotBelieved) {
    WriteAccounts(Line("anna", 1024, kAdmin));
    fs::permissions(TALO_ACCOUNTS_FILE, fs::perms(0666));
    EXPECT_GT(0, IsAdmin("anna"));
    EXPECT_GT(0, IsAdmin("root"));
    EXPECT_FALSE(Has("anna", "Acme.Light", "10.0.0.1"));
    EXPECT_FALSE(Has("root", "Acme.Light", "10.0.0.1"));
}

TEST_F(Rights, AdministratorsHoldEveryPrivilegeFromEverywhere) {
    WriteAccounts(Line("anna", 1024, kAdmin));
    EXPECT_TRUE(Has("anna", "Acme.Light", "10.0.0.1"));
    EXPECT_TRUE(Has("anna", "Never.Granted", "no address"));
    EXPECT_TRUE(Has("anna", "Never.Granted", nullptr));
    EXPECT_TRUE(Has("root", "Acme.Light", "10.0.0.1"));
}

struct PrivilegeRow {
    const char* name;
    const char* networks;  // of the grant
    const char* address;
    bool held;
};

TEST_F(Rights, PrivilegesHoldFromTheirNetworks) {
    const PrivilegeRow rows[] = {
        {"everywhere", "[]", "203.0.113.1", true},
        {"everywhere for a text that is no address", "[]", "nowhere", true},
        {"everywhere for no address", "[]", "", true},
        {"inside", "[\"10.0.0.0/8\"]", "10.255.0.1", true},
        {"outside", "[\"10.0.0.0/8\"]", "11.0.0.1", false},
        {"in the second network", "[\"10.0.0.0/8\",\"192.168.0.0/16\"]", "192.168.1.1", true},
        {"IPv6 inside", "[\"fd00::/8\"]", "fd12::1", true},
        {"IPv6 outside", "[\"fd00::/8\"]", "fe80::1", false},
        {"IPv4 written as IPv6", "[\"10.0.0.0/8\"]", "::ffff:10.0.0.1", true},
        {"no address", "[\"0.0.0.0/0\",\"::/0\"]", "", false},
        {"a text that is no address", "[\"0.0.0.0/0\",\"::/0\"]", "10.0.0.1, 10.0.0.2", false},
        {"a scope", "[\"::/0\"]", "fe80::1%eth0", false},
    };
    for (const PrivilegeRow& row : rows) {
        WriteAccounts(
            Line("bob", 1024, std::string("\"privileges\":{\"Acme.Light\":") + row.networks + "}"));
        EXPECT_EQ(row.held, Has("bob", "Acme.Light", row.address)) << row.name;
    }
}

TEST_F(Rights, PrivilegesAreComparedWhole) {
    WriteAccounts(Line("bob", 1024, "\"privileges\":{\"Acme.Light\":[]}"));
    EXPECT_TRUE(Has("bob", "Acme.Light", "10.0.0.1"));
    EXPECT_TRUE(Has("bob", "Acme.Light", nullptr));
    for (const char* privilege : {"Acme", "Acme.Light2", "acme.light", "*", ""}) {
        EXPECT_FALSE(Has("bob", privilege, "10.0.0.1")) << privilege;
    }
    EXPECT_FALSE(Has("bob", nullptr, "10.0.0.1"));
    EXPECT_FALSE(Has(nullptr, "Acme.Light", "10.0.0.1"));
    EXPECT_FALSE(Has("", "Acme.Light", "10.0.0.1"));
    EXPECT_FALSE(Has("carl", "Acme.Light", "10.0.0.1"));
}

TEST_F(Rights, PrivilegesOfABrokenLineAreNone) {
    WriteAccounts(Line("bob", 1024, "\"privileges\":{\"Acme.Light\":[\"10.0.0.0/99\"]}"));
    EXPECT_FALSE(Has("bob", "Acme.Light", "10.0.0.1"));
}

TEST_F(Rights, UserIdBelongsToTheSessionsOwner) {
    WriteAccounts(Line("anna", 1024) + Line("bob", 1025));
    talo::Session session;
    session.user = "anna";
    std::string id;
    ASSERT_TRUE(talo::CreateSession(session, &id));
    EXPECT_EQ(1024, TaloCgiUIDGet(id.c_str(), "anna"));
    EXPECT_EQ(-1, TaloCgiUIDGet(id.c_str(), "bob"));
    EXPECT_EQ(-1, TaloCgiUIDGet(id.c_str(), ""));
    EXPECT_EQ(-1, TaloCgiUIDGet(id.c_str(), nullptr));
    EXPECT_EQ(-1, TaloCgiUIDGet(nullptr, "anna"));
    EXPECT_EQ(-1, TaloCgiUIDGet("", "anna"));
    EXPECT_EQ(-1, TaloCgiUIDGet("../../etc/talo/accounts", "anna"));
    ASSERT_TRUE(talo::EndSession(id));
    EXPECT_EQ(-1, TaloCgiUIDGet(id.c_str(), "anna"));
}

TEST_F(Rights, UserIdEndsWithItsAccount) {
    WriteAccounts(Line("anna", 1024));
    talo::Session session;
    session.user = "anna";
    std::string id;
    ASSERT_TRUE(talo::CreateSession(session, &id));
    WriteAccounts(Line("bob", 1025));
    EXPECT_EQ(-1, TaloCgiUIDGet(id.c_str(), "anna"));
}

}  // namespace
