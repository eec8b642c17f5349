#include "hosts/linux/relay/NodeFile.h"

#include <gmock/gmock.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>

#include "hosts/linux/relay/NodeText.h"
#include "platform/Paths.h"
#include "tests/host/nodes/NodeRoot.h"
#include "tests/support/Child.h"

namespace fs = std::filesystem;

namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

class NodeFile : public NodeRoot {
  public:
    // The problem of a change that has to fail and to change nothing.
    static std::string Refused(const talo::Node& node) {
        const std::string before = ReadNodes();
        std::string problem;
        EXPECT_FALSE(talo::SetNode(node, &problem));
        EXPECT_NE("", problem);
        EXPECT_EQ(before, ReadNodes());
        return problem;
    }

    static bool Remove(long long id) {
        std::string problem;
        const bool removed = talo::RemoveNode(id, &problem);
        EXPECT_NE(removed, !problem.empty());
        return removed;
    }

    // What a file that is not believed looks like from everywhere.
    static void ExpectUnavailable() {
        const std::string content = ReadNodes();
        talo::Node node;
        node.secret = "untouched";
        std::vector<talo::Node> nodes(1);
        std::string problem;
        EXPECT_FALSE(talo::FindNode(2, &node));
        EXPECT_EQ("untouched", node.secret);
        EXPECT_FALSE(talo::ListNodes(&nodes));
        EXPECT_EQ(1u, nodes.size());
        EXPECT_FALSE(talo::SetNode(Called(2), &problem));
        EXPECT_THAT(problem, HasSubstr("cannot use"));
        EXPECT_FALSE(talo::RemoveNode(2, &problem));
        EXPECT_EQ(content, ReadNodes());
        EXPECT_TRUE(WasLogged("cannot use " TALO_NODES_FILE));
    }
};

TEST_F(NodeFile, HasNoAppliancesWhenItIsMissing) {
    EXPECT_FALSE(Knows(2));
    EXPECT_THAT(Ids(), IsEmpty());
    EXPECT_THAT(Logged(), IsEmpty());
}

TEST_F(NodeFile, FindsTheWholeIdOnly) {
    WriteNodes(CalledLine(12) + CalledLine(120) + CalledLine(9223372036854775807));
    EXPECT_TRUE(Knows(12));
    EXPECT_TRUE(Knows(120));
    EXPECT_TRUE(Knows(9223372036854775807));
    for (const long long id : {1LL, 2LL, 0LL, -12LL, 1200LL, 922337203685477580LL}) {
        EXPECT_FALSE(Knows(id)) << id;
    }
}

TEST_F(NodeFile, ListsInTheOrderOfTheIds) {
    WriteNodes(CalledLine(100) + CallingLine(9) + CalledLine(20));
    EXPECT_THAT(Ids(), ElementsAre(9, 20, 100));
}

TEST_F(NodeFile, ReadsBackWhatWasSet) {
    talo::Node node = Called(2);
    node.authority = "/etc/talo/nas2.pem";
    node.pin = "sha256//47DEQpj8HBSa+/TImW+5JCeuQeRkm5NMpJWZG3hSuFU=";
    node.secretHash = kSesameHash;
    node.classes = {"normal.ldap", "admin.local"};
    Set(node);
    talo::Node read;
    ASSERT_TRUE(talo::FindNode(2, &read));
    EXPECT_EQ(node.url, read.url);
    EXPECT_EQ(node.authority, read.authority);
    EXPECT_EQ(node.pin, read.pin);
    EXPECT_EQ(node.self, read.self);
    EXPECT_EQ(node.secret, read.secret);
    EXPECT_EQ(node.secretHash, read.secretHash);
    EXPECT_EQ(node.classes, read.classes);
}

TEST_F(NodeFile, SkipsCommentsAndBlankLinesSilently) {
    WriteNodes("# ours\n\n  \t\r\n   # {\"id\":\n" + CalledLine(2) + "#" + CalledLine(3));
    EXPECT_THAT(Ids(), ElementsAre(2));
    EXPECT_FALSE(Knows(3));
    EXPECT_THAT(Logged(), IsEmpty());
}

TEST_F(NodeFile, SkipsABrokenLineAndLogsItsNumberWithoutWhatItHolds) {
    WriteNodes(CalledLine(2) + "\n{\"id\":3,\"secret\":\"hush\n" + CalledLine(4));
    EXPECT_THAT(Ids(), ElementsAre(2, 4));
    EXPECT_TRUE(WasLogged("line 3 is skipped"));
    EXPECT_FALSE(WasLogged("hush"));
    EXPECT_FALSE(Knows(3));
}

TEST_F(NodeFile, KeepsCommentsAndBrokenLinesByteForByte) {
    const std::string other = "# comment \r\n" + std::string("nul\0inside\n", 11) +
                              "{\"id\":2,\"url\":\"no\"}\n\n   \n\xff\xfe\n{\"id\":7,}\n";
    const std::string end = "# no end of line";
    WriteNodes(other + CalledLine(2) + other + end);
    talo::Node node = Called(2);
    node.self = 9;
    Set(node);
    EXPECT_EQ(other +
                  "{\"id\":2,\"secret\":\"shown\",\"self\":9,"
                  "\"url\":\"https://nas2.local/webapi/entry.cgi\"}\n" +
                  other + end,
              ReadNodes());
    Set(Calling(3, {"normal.local"}));
    ASSERT_TRUE(Remove(2));
    EXPECT_EQ(other + other + end + "\n" + CallingLine(3), ReadNodes());
}

TEST_F(NodeFile, KeepsUnknownMembersOfAChangedLine) {
    WriteNodes(CalledLine(2, ",\"room\":{\"floor\":9007199254740993}"));
    Set(Calling(2, {}));
    EXPECT_EQ("{\"accepts\":{\"classes\":[],\"secret_hash\":\"" + std::string(kSesameHash) +
                  "\"},\"id\":2,\"room\":{\"floor\":9007199254740993}}\n",
              ReadNodes());
}

TEST_F(NodeFile, CountsTheFirstLineOfAnIdAndRemovesAll) {
    WriteNodes(CallingLine(2) + CalledLine(3) + CalledLine(2));
    talo::Node node;
    ASSERT_TRUE(talo::FindNode(2, &node));
    EXPECT_EQ("", node.url);
    EXPECT_THAT(Ids(), ElementsAre(2, 3));
    EXPECT_TRUE(WasLogged("line 3 is skipped"));
    ASSERT_TRUE(Remove(2));
    EXPECT_EQ(CalledLine(3), ReadNodes());
    EXPECT_FALSE(Remove(2));
}

TEST_F(NodeFile, IsWrittenForItsOwnerOnly) {
    const mode_t before = umask(0);
    Set(Called(2));
    (void)umask(before);
    for (const char* path : {TALO_NODES_FILE, TALO_NODES_FILE ".lock"}) {
        struct stat facts = {};
        ASSERT_EQ(0, stat(path, &facts));
        EXPECT_EQ(0600u, facts.st_mode & 07777) << path;
    }
}

TEST_F(NodeFile, RefusesALineThatItWouldNotUnderstand) {
    WriteNodes(CalledLine(2));
    talo::Node node = Called(2);
    node.url = "http://nas2.local/";
    EXPECT_THAT(Refused(node), HasSubstr("https://"));
    node = Called(2);
    node.pin = "sha256//x";
    EXPECT_THAT(Refused(node), HasSubstr("sha256//"));
    node = Called(2);
    node.secret = "two words";
    EXPECT_THAT(Refused(node), HasSubstr("secret"));
    node = Called(2);
    node.secret = "";
    EXPECT_THAT(Refused(node), HasSubstr("secret"));
    node = Called(2);
    node.authority = "nas2.pem";
    EXPECT_THAT(Refused(node), HasSubstr("authority"));
    node = Called(2);
    node.authority = "/\xff";
    EXPECT_THAT(Refused(node), HasSubstr("authority"));
    node = Calling(2, {"everybody"});
    EXPECT_THAT(Refused(node), HasSubstr("class"));
    node = Calling(2, {"normal.local"});
    node.secretHash = "";
    (void)Refused(node);
    node.secretHash = "sesame";
    (void)Refused(node);
    for (const long long id : {0LL, -1LL}) {
        EXPECT_THAT(Refused(Called(id)), HasSubstr("id")) << id;
    }
    node = talo::Node();
    node.id = 2;
    (void)Refused(node);
}

TEST_F(NodeFile, SaysNothingWhereNobodyAsksForTheProblem) {
    EXPECT_FALSE(talo::SetNode(talo::Node(), nullptr));
    EXPECT_FALSE(talo::RemoveNode(2, nullptr));
    EXPECT_TRUE(talo::SetNode(Called(2), nullptr));
    EXPECT_TRUE(talo::RemoveNode(2, nullptr));
}

TEST_F(NodeFile, IsNotBelievedWhenOthersMayReadOrWriteIt) {
    for (const unsigned mode : {0620u, 0602u, 0640u, 0604u, 0644u, 0666u}) {
        SCOPED_TRACE(mode);
        WriteNodes(CalledLine(2), mode);
        ExpectUnavailable();
    }
    for (const unsigned mode : {0600u, 0400u, 0700u}) {
        WriteNodes(CalledLine(2), mode);
        EXPECT_TRUE(Knows(2)) << mode;
    }
}

TEST_F(NodeFile, IsNotBelievedWhenItBelongsToAnotherUser) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only the superuser can give a file away";
    }
    WriteNodes(CalledLine(2));
    ASSERT_EQ(0, chown(TALO_NODES_FILE, 12345, 0));
    ExpectUnavailable();
}

TEST_F(NodeFile, IsNotReadThroughALinkOrFromSomethingElse) {
    const std::string elsewhere = TALO_NODES_FILE ".elsewhere";
    WriteNodes(CalledLine(2));
    fs::rename(TALO_NODES_FILE, elsewhere);
    fs::create_symlink(elsewhere, TALO_NODES_FILE);
    ExpectUnavailable();
    fs::remove(TALO_NODES_FILE);
    fs::remove(elsewhere);
    fs::create_directory(TALO_NODES_FILE);
    ASSERT_EQ(0, chmod(TALO_NODES_FILE, 0700));
    ExpectUnavailable();
}

TEST_F(NodeFile, MayHaveFourMebibytesAndNoByteMore) {
    const std::string line = CalledLine(2);
    const std::string full = line + std::string(host::kMaxNodesBytes - line.size(), '\n');
    WriteNodes(full);
    EXPECT_TRUE(Knows(2));
    EXPECT_EQ("the file of appliances is full", Refused(Called(3)));
    WriteNodes(full + "\n");
    ExpectUnavailable();
}

TEST_F(NodeFile, SkipsALineThatIsTooLong) {
    const std::string line = CalledLine(2);
    const std::string filler(host::kMaxNodeLineBytes + 1 - line.size(), ' ');
    WriteNodes(filler + line);
    EXPECT_TRUE(Knows(2));
    WriteNodes(filler + " " + line);
    EXPECT_FALSE(Knows(2));
    EXPECT_TRUE(WasLogged("line 1 is skipped: it is too long"));
}

TEST_F(NodeFile, DoesNotWriteALineThatIsTooLong) {
    const size_t room = host::kMaxNodeLineBytes - CalledLine(2, ",\"note\":\"\"").size() + 1;
    WriteNodes(CalledLine(2, ",\"note\":\"" + std::string(room, 'x') + "\""));
    ASSERT_TRUE(Knows(2));
    Set(Called(2));
    talo::Node node = Called(2);
    node.self = 10;
    EXPECT_THAT(Refused(node), HasSubstr("too long"));
}

TEST_F(NodeFile, HoldsAThousandAppliances) {
    std::string content;
    for (size_t id = 1; id < host::kMaxNodes; ++id) {
        content += "# comment\n\n" + CalledLine(static_cast<long long>(id));
    }
    WriteNodes(content);
    Set(Called(1000));
    EXPECT_TRUE(Knows(1000));
    EXPECT_EQ(1000u, Ids().size());
    EXPECT_THAT(Refused(Called(1001)), HasSubstr("1000"));
    Set(Calling(1000, {}));
    EXPECT_TRUE(Knows(1000));
    ASSERT_TRUE(Remove(7));
    Set(Called(1001));
    EXPECT_TRUE(Knows(1001));
}

TEST_F(NodeFile, LooksAtAThousandLinesAndNoMore) {
    std::string content;
    for (size_t id = 1; id <= host::kMaxNodes; ++id) {
        content += CalledLine(static_cast<long long>(id));
    }
    WriteNodes(content + "# comment\n" + CalledLine(1001));
    EXPECT_FALSE(Knows(1001));
    EXPECT_EQ(1000u, Ids().size());
    EXPECT_TRUE(WasLogged("line 1002 and what follows is skipped"));
}

TEST_F(NodeFile, DoesNotFollowALinkInThePlaceOfItsLock) {
    const std::string elsewhere = TALO_NODES_FILE ".elsewhere";
    WriteNodes(CalledLine(2));
    fs::create_symlink(elsewhere, TALO_NODES_FILE ".lock");
    EXPECT_THAT(Refused(Called(3)), HasSubstr("lock"));
    EXPECT_FALSE(fs::exists(elsewhere));
}

// A full disk, more or less.
TEST_F(NodeFile, StaysAsItWasWhenItCannotBeWritten) {
    WriteNodes(CalledLine(2));
    const support::ChildResult child = support::InChild([] {
        const struct rlimit most = {16, 16};
        (void)signal(SIGXFSZ, SIG_IGN);
        EXPECT_EQ(0, setrlimit(RLIMIT_FSIZE, &most));
        EXPECT_THAT(Refused(Called(3)), HasSubstr("cannot write"));
        return 0;
    });
    EXPECT_EQ(0, child.status);
    EXPECT_EQ(CalledLine(2), ReadNodes());
    for (const auto& entry : fs::directory_iterator(fs::path(TALO_NODES_FILE).parent_path())) {
        EXPECT_TRUE(entry.path() == TALO_NODES_FILE || entry.path().stem() != "nodes" ||
                    entry.path().extension() == ".lock")
            << entry.path();
    }
}

}  // namespace
