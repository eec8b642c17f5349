#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <set>

#include "hosts/linux/cipher/KeyRing.h"
#include "tests/host/cipher/Vectors.h"
#include "tests/support/Child.h"
#include "tests/support/TempFolder.h"

namespace {

namespace fs = std::filesystem;

constexpr long long kNow = 1800000000;

class KeyFile : public ::testing::Test {
  protected:
    bool Open(host::KeyRing* ring, long long now = kNow) const {
        return host::OpenKeyRing(taloCipherModule, Dir(), now, ring);
    }
    bool Rotate(long long now) const {
        return host::RotateKeyRing(taloCipherModule, Dir(), now);
    }
    host::KeyRing Opened(long long now = kNow) const {
        host::KeyRing ring;
        EXPECT_TRUE(Open(&ring, now));
        return ring;
    }
    void ExpectRefused() const {
        host::KeyRing ring;
        ring.since = 77;
        EXPECT_FALSE(Open(&ring));
        EXPECT_FALSE(Rotate(kNow));
        EXPECT_EQ(ring.since, 77);
    }

    std::string Dir() const {
        return folder_.Path("lib/cipher");
    }
    std::string Keys() const {
        return Dir() + "/keys";
    }
    std::string Content() const {
        std::ifstream file(Keys(), std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(file), {});
    }
    void Overwrite(const std::string& content) const {
        std::ofstream(Keys(), std::ios::binary) << content;
    }
    std::set<std::string> Names() const {
        std::set<std::string> names;
        for (const auto& entry : fs::directory_iterator(Dir())) {
            names.insert(entry.path().filename());
        }
        return names;
    }
    static unsigned ModeOf(const std::string& path) {
        struct stat facts = {};
        EXPECT_EQ(stat(path.c_str(), &facts), 0);
        return facts.st_mode & 07777;
    }

    support::TempFolder folder_;
};

TEST_F(KeyFile, IsMadeOnFirstUseForNobodyElse) {
    const host::KeyRing ring = Opened();
    EXPECT_EQ(ModeOf(Keys()), 0600u);
    EXPECT_EQ(ModeOf(Dir()), 0700u);
    EXPECT_EQ(ring.since, kNow);
    EXPECT_FALSE(ring.previous);
    EXPECT_EQ(Names(), std::set<std::string>({"keys", "lock"}));
    host::Key half;
    ASSERT_EQ(taloCipherModule.publicHalf(ring.current.secret.bytes, half.bytes), 1);
    EXPECT_EQ(half.Text(), ring.current.half.Text());
}

TEST_F(KeyFile, StaysAsItIs) {
    const std::string first = Opened().current.secret.Text();
    const std::string content = Content();
    EXPECT_EQ(Opened(kNow + 1000000).current.secret.Text(), first);
    EXPECT_EQ(Content(), content);
}

TEST_F(KeyFile, IsAnotherInAnotherFolder) {
    const support::TempFolder other;
    host::KeyRing ring;
    ASSERT_TRUE(host::OpenKeyRing(taloCipherModule, other.Path("keys"), kNow, &ring));
    EXPECT_NE(Opened().current.secret.Text(), ring.current.secret.Text());
}

TEST_F(KeyFile, RotatesAndKeepsOnePrevious) {
    const std::string first = Opened().current.secret.Text();
    ASSERT_TRUE(Rotate(kNow + 10));
    const host::KeyRing second = Opened();
    EXPECT_NE(second.current.secret.Text(), first);
    EXPECT_EQ(second.since, kNow + 10);
    ASSERT_TRUE(second.previous);
    EXPECT_EQ(second.previous->secret.Text(), first);
    EXPECT_EQ(ModeOf(Keys()), 0600u);
    ASSERT_TRUE(Rotate(kNow + 20));
    const host::KeyRing third = Opened();
    ASSERT_TRUE(third.previous);
    EXPECT_EQ(third.previous->secret.Text(), second.current.secret.Text());
    EXPECT_EQ(Content().find("previous"), Content().rfind("previous"));
    EXPECT_EQ(Names(), std::set<std::string>({"keys", "lock"}));
}

TEST_F(KeyFile, RotatesBeforeItsFirstUse) {
    ASSERT_TRUE(Rotate(kNow));
    EXPECT_FALSE(Opened().previous);
}

TEST_F(KeyFile, PreviousKeyIsFoundForADayFromTheRotation) {
    const std::string id = host::KeyIdOf(Opened().current.half);
    ASSERT_TRUE(Rotate(kNow + 500000));
    const host::KeyRing ring = Opened();
    EXPECT_NE(host::FindKey(ring, id, kNow + 500000), nullptr);
    EXPECT_NE(host::FindKey(ring, id, kNow + 500000 + 86399), nullptr);
    EXPECT_EQ(host::FindKey(ring, id, kNow + 500000 + 86400), nullptr);
}

TEST_F(KeyFile, IsOneForProcessesThatMakeItAtOnce) {
    const support::ChildResult child = support::InChild([&] {
        constexpr int kProcesses = 16;
        for (int number = 0; number < kProcesses; ++number) {
            if (fork() == 0) {
                host::KeyRing ring;
                const bool made = Open(&ring);
                const std::string line =
                    (made ? Hex(ring.current.secret.Text()) : std::string("refused")) + "\n";
                (void)!write(STDOUT_FILENO, line.data(), line.size());
                _exit(0);
            }
        }
        return 0;
    });
    ASSERT_EQ(child.status, 0);
    const std::string expected = Hex(Opened().current.secret.Text()) + "\n";
    std::string all;
    for (int number = 0; number < 16; ++number) {
        all += expected;
    }
    EXPECT_EQ(child.output, all);
}

TEST_F(KeyFile, ThatOthersCanReachIsRefused) {
    const std::string content = (Opened(), Content());
    for (const unsigned mode : {0601u, 0604u, 0620u, 0640u, 0644u, 0666u, 0777u}) {
        ASSERT_EQ(chmod(Keys().c_str(), mode), 0);
        ExpectRefused();
        EXPECT_EQ(Content(), content) << std::oct << mode;
    }
    ASSERT_EQ(chmod(Keys().c_str(), 0600), 0);
    (void)Opened();
}

TEST_F(KeyFile, InAFolderThatOthersCanEnterIsRefused) {
    (void)Opened();
    for (const unsigned mode : {0701u, 0710u, 0755u, 0770u, 0777u}) {
        ASSERT_EQ(chmod(Dir().c_str(), mode), 0);
        ExpectRefused();
    }
    ASSERT_EQ(chmod(Dir().c_str(), 0700), 0);
    (void)Opened();
}

TEST_F(KeyFile, OfAnotherUserIsRefused) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only the superuser can give a file away";
    }
    (void)Opened();
    ASSERT_EQ(chown(Keys().c_str(), 12345, 12345), 0);
    ExpectRefused();
    ASSERT_EQ(chown(Keys().c_str(), 0, 0), 0);
    (void)Opened();
    ASSERT_EQ(chown(Dir().c_str(), 12345, 12345), 0);
    ExpectRefused();
}

TEST_F(KeyFile, WithGarbageIsRefusedAndKept) {
    const std::string good = (Opened(), Content());
    for (const std::string& garbage :
         {std::string(), std::string("garbage"), good.substr(0, good.size() - 1), good + good,
          std::string(200, '\0'), std::string(100000, 'x')}) {
        Overwrite(garbage);
        ExpectRefused();
        EXPECT_TRUE(Content() == garbage);
    }
    for (size_t size = 0; size < good.size(); ++size) {
        Overwrite(good.substr(0, size));
        ExpectRefused();
    }
}

TEST_F(KeyFile, ThatIsNoFileIsRefused) {
    const std::string good = (Opened(), Content());
    fs::remove(Keys());
    fs::create_directory(Keys());
    ExpectRefused();
    fs::remove(Keys());
    ASSERT_EQ(mkfifo(Keys().c_str(), 0600), 0);
    ExpectRefused();
    fs::remove(Keys());
    fs::create_symlink(folder_.Write("elsewhere", good), Keys());
    ASSERT_EQ(chmod(folder_.Path("elsewhere").c_str(), 0600), 0);
    ExpectRefused();
}

TEST_F(KeyFile, WithALockThatIsNoneIsNotMade) {
    fs::create_directories(Dir());
    ASSERT_EQ(chmod(Dir().c_str(), 0700), 0);
    fs::create_directory(Dir() + "/lock");
    ExpectRefused();
    EXPECT_FALSE(fs::exists(Keys()));
}

TEST_F(KeyFile, InAPlaceThatIsNoFolderIsNotMade) {
    fs::create_directories(fs::path(Dir()).parent_path());
    std::ofstream(Dir()) << "a file";
    ExpectRefused();
}

}  // namespace
