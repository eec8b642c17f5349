#include <filesystem>
#include <string>

#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/sdk/Nodes.h"
#include "platform/Paths.h"
#include "tests/host/cgi/Authorization.h"

namespace fs = std::filesystem;

namespace {

// Sessions of appliance 7 that acts for a user.
class NodeSession : public AuthorizationTest {
  protected:
    NodeSession() {
        fs::remove(TALO_NODES_FILE);
    }
    ~NodeSession() override {
        fs::remove(TALO_NODES_FILE);
        fs::remove(TALO_NODES_FILE ".lock");
    }

    static void Accept(const std::vector<std::string>& classes) {
        talo::Node node;
        std::string problem;
        node.id = 7;
        node.secretHash = std::string(64, 'a');
        node.classes = classes;
        ASSERT_TRUE(talo::SetNode(node, &problem)) << problem;
    }

    std::string OpenFor(const std::string& user, long long node = 7) {
        talo::Session session;
        session.user = user;
        session.address = "192.0.2.1";
        session.node = node;
        return Open(session);
    }

    static void SetGroups(const std::vector<std::string>& groups) {
        std::string problem;
        ASSERT_TRUE(talo::SetGroups("normal", groups, &problem)) << problem;
    }

    // Whether the session counts: for the check, and for the number of its user.
    bool Counts(const std::string& id, const char* user = "normal") {
        const bool accepted = Ask(id, kAll) > 0;
        EXPECT_EQ(accepted, TaloCgiUIDGet(id.c_str(), user) > 0);
        return accepted;
    }
};

TEST_F(NodeSession, CountsForTheUsersOfItsClasses) {
    Accept({"normal.local"});
    const std::string id = OpenFor("normal");
    EXPECT_EQ(Ask(id, kAll), 1);
    EXPECT_STREQ(name, "normal");
    const std::string boss = OpenFor("boss");
    EXPECT_EQ(Ask(boss, kAll), -6);
    Accept({"normal.local", "admin.local"});
    EXPECT_EQ(Ask(boss, kAll), 2);
}

TEST_F(NodeSession, DoesNotCountWithoutItsAppliance) {
    EXPECT_FALSE(Counts(OpenFor("normal")));
    Accept({"normal.local"});
    const std::string id = OpenFor("normal");
    EXPECT_TRUE(Counts(id));
    EXPECT_FALSE(Counts(OpenFor("normal", 8)));
    fs::remove(TALO_NODES_FILE);
    EXPECT_EQ(Ask(id, kAll), -6);
    EXPECT_FALSE(Counts(id));
}

TEST_F(NodeSession, DoesNotCountForAPromotedAccount) {
    Accept({"normal.local"});
    const std::string id = OpenFor("normal");
    EXPECT_TRUE(Counts(id));
    SetGroups({"administrators"});
    EXPECT_FALSE(Counts(id));
    SetGroups({});
    EXPECT_TRUE(Counts(id));
}

TEST_F(NodeSession, DoesNotCountForADemotedAdministratorOfAnApplianceForAdministratorsOnly) {
    Accept({"admin.local"});
    SetGroups({"administrators"});
    const std::string id = OpenFor("normal");
    EXPECT_EQ(Ask(id, kAll), 2);
    SetGroups({});
    EXPECT_FALSE(Counts(id));
}

TEST_F(NodeSession, DoesNotCountAfterTheGrantWasNarrowed) {
    Accept({"normal.local", "normal.ldap"});
    const std::string id = OpenFor("normal");
    EXPECT_TRUE(Counts(id));
    Accept({"normal.ldap"});
    EXPECT_FALSE(Counts(id));
    Accept({});
    EXPECT_FALSE(Counts(id));
}

TEST_F(NodeSession, DoesNotCountForALockedAccount) {
    Accept({"normal.local"});
    const std::string id = OpenFor("normal");
    ASSERT_TRUE(talo::SetLocked("normal", true, nullptr));
    EXPECT_FALSE(Counts(id));
}

TEST_F(NodeSession, DoesNotCountWhereTheAppliancesCannotBeRead) {
    Accept({"normal.local"});
    const std::string id = OpenFor("normal");
    fs::permissions(TALO_NODES_FILE, fs::perms(0644));
    EXPECT_FALSE(Counts(id));
}

TEST_F(NodeSession, IsCheckedForItsAddressFirst) {
    const std::string id = OpenFor("normal");
    MoveAway();
    EXPECT_EQ(Ask(id, kAll), -3);
}

TEST_F(NodeSession, LeavesOrdinarySessionsAlone) {
    fs::create_directory(TALO_NODES_FILE);  // nothing that could be read
    EXPECT_TRUE(Counts(Open("normal")));
}

TEST_F(NodeSession, EndsWithTheSecretThatOpenedIt) {
    Accept({"normal.local"});
    const std::string own = Open("normal");
    const std::string other = OpenFor("normal", 8);
    const std::string id = OpenFor("normal");
    talo::Node node;
    ASSERT_TRUE(talo::FindNode(7, &node));
    node.url = "https://nas7.local/";
    node.self = 1;
    node.secret = "shown";
    ASSERT_TRUE(talo::SetNode(node, nullptr));
    EXPECT_TRUE(Exists(id));
    node.secretHash = std::string(64, 'b');
    ASSERT_TRUE(talo::SetNode(node, nullptr));
    EXPECT_FALSE(Exists(id));
    EXPECT_TRUE(Exists(own));
    EXPECT_TRUE(Exists(other));
}

TEST_F(NodeSession, EndsWithItsAppliance) {
    Accept({"normal.local"});
    const std::string own = Open("normal");
    const std::string id = OpenFor("normal");
    ASSERT_FALSE(talo::RemoveNode(8, nullptr));
    EXPECT_TRUE(Exists(id));
    ASSERT_TRUE(talo::RemoveNode(7, nullptr));
    EXPECT_FALSE(Exists(id));
    EXPECT_TRUE(Exists(own));
}

TEST_F(NodeSession, IsListedWithItsAppliance) {
    Accept({"normal.local"});
    (void)OpenFor("normal");
    const std::vector<talo::Session> sessions = talo::ListSessions();
    ASSERT_EQ(sessions.size(), 1u);
    EXPECT_EQ(sessions[0].node, 7);
}

}  // namespace
