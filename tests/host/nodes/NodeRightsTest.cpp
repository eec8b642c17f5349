#include <gmock/gmock.h>
#include <sys/stat.h>

#include <set>

#include "hosts/linux/sdk/Digest.h"
#include "platform/Paths.h"
#include "tests/host/nodes/NodeRoot.h"

namespace {

using ::testing::IsEmpty;

const std::vector<std::string> kEveryClass = {"admin.local",  "admin.domain",  "admin.ldap",
                                              "normal.local", "normal.domain", "normal.ldap"};

std::string HashOf(const std::string& text) {
    talo::Sha256 digest;
    std::string hash;
    EXPECT_TRUE(digest.Update(text.data(), text.size()) && digest.Final(&hash));
    return hash;
}

talo::Account AccountOf(const std::string& name, bool isAdministrator) {
    talo::Account account;
    account.name = name;
    account.groups = {"staff"};
    if (isAdministrator) {
        account.groups.emplace_back("administrators");
    }
    return account;
}

class NodeRights : public NodeRoot {};

TEST_F(NodeRights, MakesSecretsThatNobodyGuesses) {
    std::set<std::string> secrets;
    for (int round = 0; round < 50; ++round) {
        std::string secret;
        std::string hash;
        ASSERT_TRUE(talo::NewNodeSecret(&secret, &hash));
        EXPECT_EQ(43u, secret.size());
        EXPECT_EQ(std::string::npos,
                  secret.find_first_not_of("ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz"
                                           "0123456789-_"));
        EXPECT_EQ(HashOf(secret), hash);
        secrets.insert(secret);
    }
    EXPECT_EQ(50u, secrets.size());
}

TEST_F(NodeRights, KnowsAnApplianceByItsSecret) {
    Set(Calling(2, {"normal.local"}));
    EXPECT_TRUE(talo::ProvesNode(2, "sesame"));
    for (const char* secret :
         {"", "Sesame", "sesam", "sesame ", "sesame\n", "sesames", " ", kSesameHash}) {
        EXPECT_FALSE(talo::ProvesNode(2, secret)) << secret;
    }
    EXPECT_FALSE(talo::ProvesNode(2, std::string("sesame\0", 7)));
    EXPECT_FALSE(talo::ProvesNode(2, std::string(1 << 20, 's')));
    for (const long long id : {0LL, -2LL, 1LL, 3LL, 22LL, 9223372036854775807LL}) {
        EXPECT_FALSE(talo::ProvesNode(id, "sesame")) << id;
    }
}

TEST_F(NodeRights, KnowsNobodyWhoMayNotCall) {
    talo::Node node = Called(2);
    node.secret = "sesame";
    Set(node);
    EXPECT_FALSE(talo::ProvesNode(2, "sesame"));
    EXPECT_FALSE(talo::ProvesNode(2, ""));
    EXPECT_FALSE(talo::MayActFor(2, AccountOf("anna", false)));
}

TEST_F(NodeRights, TellsOneAppliancesSecretFromAnothers) {
    std::string secret;
    std::string hash;
    ASSERT_TRUE(talo::NewNodeSecret(&secret, &hash));
    Set(Calling(2, {"normal.local"}));
    talo::Node other = Calling(3, {"normal.local"});
    other.secretHash = hash;
    Set(other);
    EXPECT_TRUE(talo::ProvesNode(3, secret));
    EXPECT_FALSE(talo::ProvesNode(2, secret));
    EXPECT_FALSE(talo::ProvesNode(3, "sesame"));
}

TEST_F(NodeRights, ForgetsASecretThatIsReplacedOrRemoved) {
    Set(Calling(2, {"normal.local"}));
    talo::Node node = Calling(2, {"normal.local"});
    node.secretHash = std::string(64, '0');
    Set(node);
    EXPECT_FALSE(talo::ProvesNode(2, "sesame"));
    Set(Calling(2, {"normal.local"}));
    ASSERT_TRUE(talo::ProvesNode(2, "sesame"));
    ASSERT_TRUE(talo::RemoveNode(2, nullptr));
    EXPECT_FALSE(talo::ProvesNode(2, "sesame"));
}

struct ClassRow {
    const char* name;
    const char* user;
    bool isAdministrator;
    const char* userClass;
};

constexpr ClassRow kClassRows[] = {
    {"a user", "anna", false, "normal.local"},
    {"an administrator", "boss", true, "admin.local"},
    {"a user of a domain", "NAS\\anna", false, "normal.domain"},
    {"an administrator of a domain", "NAS\\boss", true, "admin.domain"},
    {"a user of a directory", "anna@example.org", false, "normal.ldap"},
    {"an administrator of a directory", "boss@example.org", true, "admin.ldap"},
    {"a user with both signs", "NAS\\anna@example.org", false, "normal.domain"},
    {"an administrator with both signs", "NAS\\boss@example.org", true, "admin.domain"},
};

TEST_F(NodeRights, MayActForTheUsersOfTheClassesThatWereGranted) {
    for (const std::string& granted : kEveryClass) {
        Set(Calling(2, {granted}));
        for (const ClassRow& row : kClassRows) {
            EXPECT_EQ(granted == row.userClass,
                      talo::MayActFor(2, AccountOf(row.user, row.isAdministrator)))
                << granted << " " << row.name;
        }
    }
}

TEST_F(NodeRights, MayActForEveryClassThatWasGranted) {
    Set(Calling(2, kEveryClass));
    Set(Calling(3, {}));
    for (const ClassRow& row : kClassRows) {
        const talo::Account account = AccountOf(row.user, row.isAdministrator);
        EXPECT_TRUE(talo::MayActFor(2, account)) << row.name;
        EXPECT_FALSE(talo::MayActFor(3, account)) << row.name;
        EXPECT_FALSE(talo::MayActFor(4, account)) << row.name;
        EXPECT_FALSE(talo::MayActFor(0, account)) << row.name;
        EXPECT_FALSE(talo::MayActFor(-2, account)) << row.name;
    }
}

TEST_F(NodeRights, MayNotActForALockedAccount) {
    Set(Calling(2, kEveryClass));
    for (const ClassRow& row : kClassRows) {
        talo::Account account = AccountOf(row.user, row.isAdministrator);
        account.locked = true;
        EXPECT_FALSE(talo::MayActFor(2, account)) << row.name;
    }
}

TEST_F(NodeRights, FollowsTheFileAtOnce) {
    const talo::Account anna = AccountOf("anna", false);
    Set(Calling(2, {"normal.local"}));
    EXPECT_TRUE(talo::MayActFor(2, anna));
    EXPECT_FALSE(talo::MayActFor(2, AccountOf("anna", true)));
    Set(Calling(2, {"admin.local"}));
    EXPECT_FALSE(talo::MayActFor(2, anna));
    Set(Calling(2, {"normal.local"}));
    EXPECT_TRUE(talo::MayActFor(2, anna));
    ASSERT_TRUE(talo::RemoveNode(2, nullptr));
    EXPECT_FALSE(talo::MayActFor(2, anna));
}

TEST_F(NodeRights, AreNoneWhereTheFileIsNotBelieved) {
    Set(Calling(2, kEveryClass));
    ASSERT_TRUE(talo::ProvesNode(2, "sesame"));
    ASSERT_EQ(0, chmod(TALO_NODES_FILE, 0640));
    EXPECT_FALSE(talo::ProvesNode(2, "sesame"));
    EXPECT_FALSE(talo::MayActFor(2, AccountOf("anna", false)));
}

TEST_F(NodeRights, NeverLogASecret) {
    Set(Calling(2, {"normal.local"}));
    (void)talo::ProvesNode(2, "sesame-of-nobody");
    (void)talo::ProvesNode(3, "sesame-of-nobody");
    EXPECT_THAT(Logged(), IsEmpty());
}

}  // namespace
