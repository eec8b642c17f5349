#include <gmock/gmock.h>

#include "AccountRoot.h"
#include "hosts/linux/account/AccountFile.h"
#include "hosts/linux/account/Password.h"
#include "hosts/linux/sdk/Accounts.h"
#include "platform/Paths.h"

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

class Changes : public AccountRoot {
  public:
    static talo::Account Find(const std::string& name) {
        talo::Account account;
        EXPECT_TRUE(talo::FindAccount(name, &account)) << name;
        return account;
    }

    static std::string HashOf(const std::string& name) {
        host::StoredAccount stored;
        EXPECT_EQ(host::Lookup::kFound, host::FindInFile(TALO_ACCOUNTS_FILE, name, &stored));
        return stored.hash;
    }

    // Every change of an account, each with arguments that are in order.
    static std::vector<bool> TryAll(const std::string& name, std::string* problem) {
        return {talo::SetPassword(name, "secret", 0, problem),
                talo::RemoveAccount(name, problem),
                talo::SetLocked(name, true, problem),
                talo::SetGroups(name, {"staff"}, problem),
                talo::GrantPrivilege(name, "Acme.Light", "", problem),
                talo::RevokePrivilege(name, "Acme.Light", problem)};
    }

    std::string problem;
};

TEST_F(Changes, AddsAnAccountThatIsNobodySpecial) {
    ASSERT_TRUE(talo::AddAccount("anna", "secret", &problem)) << problem;
    const talo::Account account = Find("anna");
    EXPECT_EQ("anna", account.name);
    EXPECT_EQ(1024u, account.uid);
    EXPECT_FALSE(account.locked);
    EXPECT_EQ(0, account.passwordExpires);
    EXPECT_THAT(account.groups, IsEmpty());
    EXPECT_THAT(account.privileges, IsEmpty());
    EXPECT_FALSE(talo::IsAdministrator(account));
    EXPECT_EQ(host::Verdict::kMatches, host::VerifyPassword("secret", HashOf("anna")));
    EXPECT_EQ(std::string::npos, ReadAccounts().find("secret"));
}

TEST_F(Changes, AddsNoNameTwice) {
    ASSERT_TRUE(talo::AddAccount("anna", "secret", &problem));
    const std::string before = ReadAccounts();
    EXPECT_FALSE(talo::AddAccount("anna", "other", &problem));
    EXPECT_EQ("the account \"anna\" exists", problem);
    EXPECT_EQ(before, ReadAccounts());
}

TEST_F(Changes, RefusesHostileNames) {
    const std::string names[] = {"",     std::string(65, 'x'),
                                 "a/b",  "..",
                                 "a\nb", std::string("a\0b", 3),
                                 "a\"b", "-a",
                                 "a b",  "\xc3\xa4"};
    WriteAccounts(Line("anna", 1024));
    for (const std::string& name : names) {
        problem.clear();
        EXPECT_FALSE(talo::AddAccount(name, "secret", &problem)) << name;
        EXPECT_EQ("that is no account's name", problem) << name;
        EXPECT_THAT(TryAll(name, &problem), ::testing::Each(false)) << name;
        EXPECT_FALSE(talo::SetGroups("anna", {name}, &problem)) << name;
        talo::Account account;
        EXPECT_FALSE(talo::FindAccount(name, &account)) << name;
    }
    EXPECT_EQ(Line("anna", 1024), ReadAccounts());
}

TEST_F(Changes, RefusesPasswordsThatAreNone) {
    const std::string passwords[] = {"", std::string("a\0b", 3), std::string(512, 'x')};
    WriteAccounts(Line("anna", 1024));
    for (const std::string& password : passwords) {
        EXPECT_FALSE(talo::AddAccount("bob", password, &problem)) << password.size();
        EXPECT_FALSE(talo::SetPassword("anna", password, 0, &problem)) << password.size();
    }
    EXPECT_EQ(Line("anna", 1024), ReadAccounts());
}

TEST_F(Changes, ChangeNothingOfAnAccountThatIsNotThere) {
    WriteAccounts(Line("anna", 1024));
    EXPECT_THAT(TryAll("bob", &problem), ::testing::Each(false));
    EXPECT_EQ("there is no account \"bob\"", problem);
    EXPECT_EQ(Line("anna", 1024), ReadAccounts());
}

TEST_F(Changes, TellNobodyWhoDoesNotAsk) {
    EXPECT_FALSE(talo::RemoveAccount("anna", nullptr));
    EXPECT_FALSE(talo::AddAccount("anna", "", nullptr));
}

TEST_F(Changes, SetAPasswordAndItsEnd) {
    ASSERT_TRUE(talo::AddAccount("anna", "secret", &problem));
    ASSERT_TRUE(talo::SetPassword("anna", "other", 4102444800, &problem)) << problem;
    EXPECT_EQ(host::Verdict::kDiffers, host::VerifyPassword("secret", HashOf("anna")));
    EXPECT_EQ(host::Verdict::kMatches, host::VerifyPassword("other", HashOf("anna")));
    EXPECT_EQ(4102444800, Find("anna").passwordExpires);
    ASSERT_TRUE(talo::SetPassword("anna", "third", 0, &problem));
    EXPECT_EQ(0, Find("anna").passwordExpires);
    EXPECT_FALSE(talo::SetPassword("anna", "fourth", -1, &problem));
    EXPECT_EQ(host::Verdict::kMatches, host::VerifyPassword("third", HashOf("anna")));
}

TEST_F(Changes, RemoveLockAndUnlock) {
    WriteAccounts(Line("anna", 1024) + Line("bob", 1025));
    ASSERT_TRUE(talo::SetLocked("anna", true, &problem));
    EXPECT_TRUE(Find("anna").locked);
    EXPECT_FALSE(Find("bob").locked);
    ASSERT_TRUE(talo::SetLocked("anna", false, &problem));
    EXPECT_FALSE(Find("anna").locked);
    ASSERT_TRUE(talo::RemoveAccount("anna", &problem));
    talo::Account account;
    account.name = "untouched";
    EXPECT_FALSE(talo::FindAccount("anna", &account));
    EXPECT_EQ("untouched", account.name);
    EXPECT_EQ(Line("bob", 1025), ReadAccounts());
}

TEST_F(Changes, SetTheWholeListOfGroups) {
    WriteAccounts(Line("anna", 1024));
    ASSERT_TRUE(talo::SetGroups("anna", {"staff", "administrators", "staff"}, &problem));
    EXPECT_THAT(Find("anna").groups, ElementsAre("staff", "administrators"));
    EXPECT_TRUE(talo::IsAdministrator(Find("anna")));
    ASSERT_TRUE(talo::SetGroups("anna", {"Administrators"}, &problem));
    EXPECT_FALSE(talo::IsAdministrator(Find("anna")));
    ASSERT_TRUE(talo::SetGroups("anna", {}, &problem));
    EXPECT_THAT(Find("anna").groups, IsEmpty());
}

TEST_F(Changes, CollectTheNetworksOfAPrivilege) {
    WriteAccounts(Line("anna", 1024));
    ASSERT_TRUE(talo::GrantPrivilege("anna", "Acme.Light", "10.0.0.0/8", &problem));
    ASSERT_TRUE(talo::GrantPrivilege("anna", "Acme.Light", "fd00::/8", &problem));
    ASSERT_TRUE(talo::GrantPrivilege("anna", "Acme.Light", "10.0.0.0/8", &problem));
    EXPECT_THAT(Find("anna").privileges["Acme.Light"], ElementsAre("10.0.0.0/8", "fd00::/8"));
    ASSERT_TRUE(talo::GrantPrivilege("anna", "Acme.Light", "", &problem));
    EXPECT_THAT(Find("anna").privileges["Acme.Light"], IsEmpty());
}

TEST_F(Changes, NeverNarrowAPrivilegeByGranting) {
    WriteAccounts(Line("anna", 1024));
    ASSERT_TRUE(talo::GrantPrivilege("anna", "Acme.Light", "", &problem));
    ASSERT_TRUE(talo::GrantPrivilege("anna", "Acme.Light", "10.0.0.0/8", &problem));
    ASSERT_EQ(1u, Find("anna").privileges.count("Acme.Light"));
    EXPECT_THAT(Find("anna").privileges["Acme.Light"], IsEmpty());
}

TEST_F(Changes, RevokeAPrivilegeWhole) {
    WriteAccounts(Line("anna", 1024));
    ASSERT_TRUE(talo::GrantPrivilege("anna", "Acme.Light", "10.0.0.0/8", &problem));
    ASSERT_TRUE(talo::GrantPrivilege("anna", "Acme.Door", "", &problem));
    ASSERT_TRUE(talo::RevokePrivilege("anna", "Acme.Light", &problem));
    EXPECT_EQ(1u, Find("anna").privileges.size());
    EXPECT_FALSE(talo::RevokePrivilege("anna", "Acme.Light", &problem));
    EXPECT_EQ("\"anna\" does not hold that privilege", problem);
}

TEST_F(Changes, RefusePrivilegesAndNetworksThatAreNone) {
    WriteAccounts(Line("anna", 1024));
    const std::string privileges[] = {
        "", "a b", "a\n", std::string(129, 'x'), std::string("a\0", 2), "\xc3\xa4"};
    for (const std::string& privilege : privileges) {
        EXPECT_FALSE(talo::GrantPrivilege("anna", privilege, "", &problem)) << privilege;
    }
    const std::string networks[] = {"lan", "10.0.0.0/33", " ", "10.0.0.0/8,::1"};
    for (const std::string& network : networks) {
        EXPECT_FALSE(talo::GrantPrivilege("anna", "Acme.Light", network, &problem)) << network;
    }
    EXPECT_EQ(Line("anna", 1024), ReadAccounts());
}

TEST_F(Changes, AreRefusedWithTheSystemsAccounts) {
    WriteAccounts(Line("anna", 1024));
    Configure("accounts=\"system\"");
    EXPECT_THAT(TryAll("anna", &problem), ::testing::Each(false));
    EXPECT_FALSE(talo::AddAccount("bob", "secret", &problem));
    EXPECT_EQ("the accounts are the system's and read only here", problem);
    EXPECT_EQ(Line("anna", 1024), ReadAccounts());
}

}  // namespace
