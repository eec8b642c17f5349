#include <filesystem>
#include <fstream>

#include "hosts/linux/cipher/KeyRing.h"
#include "hosts/linux/cipher/SeenLines.h"
#include "tests/host/cipher/Vectors.h"
#include "tests/host/upload/PrivateMounts.h"
#include "tests/support/Child.h"
#include "tests/support/TempFolder.h"

namespace {

namespace fs = std::filesystem;

constexpr long long kNow = 1800000000;

// A folder without space, in a process of its own.
class DiskFull : public ::testing::Test {
  protected:
    template <typename Body>
    void WithoutSpace(Body body) {
        const support::ChildResult child = support::InChild([&] {
            fs::create_directory(Dir());
            EXPECT_TRUE(EnterPrivateMounts());
            MountMemory(Dir(), "64k,mode=0700");
            std::ofstream(Filler()) << std::string(1u << 20, 'x');
            body();
            return 0;
        });
        EXPECT_EQ(child.status, 0) << child.output;
    }
    std::string Dir() const {
        return folder_.Path("small");
    }
    std::string Filler() const {
        return Dir() + "/filler";
    }

    support::TempFolder folder_;
};

TEST_F(DiskFull, ALineThatCannotBeNotedDoesNotCount) {
    WithoutSpace([&] {
        host::LineContent line;
        line.time = kNow;
        line.nonce = SecretOf<16>(1);
        EXPECT_EQ(host::NoteLine(Dir(), line, kNow, 0), host::Seen::kTrouble);
        EXPECT_EQ(host::NoteLine(Dir(), line, kNow, 0), host::Seen::kTrouble);
        fs::remove(Filler());
        EXPECT_EQ(host::NoteLine(Dir(), line, kNow, 0), host::Seen::kFirst);
        EXPECT_EQ(host::NoteLine(Dir(), line, kNow, 0), host::Seen::kBefore);
    });
}

TEST_F(DiskFull, AKeyThatCannotBeKeptIsNotUsed) {
    WithoutSpace([&] {
        host::KeyRing ring;
        EXPECT_FALSE(host::OpenKeyRing(taloCipherModule, Dir(), kNow, &ring));
        EXPECT_EQ(ring.since, 0);
        for (const auto& entry : fs::directory_iterator(Dir())) {
            const std::string name = entry.path().filename();
            EXPECT_TRUE(name == "filler" || name == "lock") << name;
        }
        fs::remove(Filler());
        EXPECT_TRUE(host::OpenKeyRing(taloCipherModule, Dir(), kNow, &ring));
    });
}

TEST_F(DiskFull, ARotationThatCannotBeKeptChangesNothing) {
    WithoutSpace([&] {
        fs::remove(Filler());
        host::KeyRing before;
        host::KeyRing after;
        ASSERT_TRUE(host::OpenKeyRing(taloCipherModule, Dir(), kNow, &before));
        std::ofstream(Filler()) << std::string(1u << 20, 'x');
        EXPECT_FALSE(host::RotateKeyRing(taloCipherModule, Dir(), kNow + 1));
        ASSERT_TRUE(host::OpenKeyRing(taloCipherModule, Dir(), kNow, &after));
        EXPECT_EQ(host::FormatKeyRing(after), host::FormatKeyRing(before));
    });
}

}  // namespace
