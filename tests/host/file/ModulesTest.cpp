#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <functional>

#include "hosts/linux/sdk/Archive.h"
#include "hosts/linux/sdk/Digest.h"
#include "platform/Paths.h"
#include "tests/support/Child.h"
#include "tests/support/TempFolder.h"

namespace {

namespace fs = std::filesystem;

// The modules in their place in the private root, as an installation puts them.
class Modules : public ::testing::Test {
  public:
    void SetUp() override {
        fs::create_directories(TALO_MODULE_DIR);
        Offer("talo-digest.so", DIGEST_MODULE);
        Offer("talo-archive.so", ARCHIVE_MODULE);
    }

    void TearDown() override {
        SetUp();
    }

    static void Offer(const std::string& name, const char* built) {
        const std::string path = TALO_MODULE_DIR + name;
        fs::remove(path);
        fs::copy_file(built, path);
    }

    static std::string HexOf(const std::string& text) {
        talo::Sha256 digest;
        std::string hex;
        EXPECT_TRUE(digest.Update(text.data(), text.size()));
        EXPECT_TRUE(digest.Final(&hex));
        return hex;
    }

    // In a process of its own: a module that is loaded stays.
    static void Apart(const std::function<void()>& body) {
        const support::ChildResult child = support::InChild([&] {
            body();
            return 0;
        });
        EXPECT_EQ(0, child.status) << child.output;
        EXPECT_EQ("", child.output);
    }
};

TEST_F(Modules, DigestIsSha256) {
    Apart([] {
        EXPECT_EQ("e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855", HexOf(""));
        EXPECT_EQ("ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad", HexOf("abc"));
        talo::Sha256 parts;
        std::string hex;
        EXPECT_TRUE(parts.Update("a", 1));
        EXPECT_TRUE(parts.Update("", 0));
        EXPECT_TRUE(parts.Update("bc", 2));
        EXPECT_TRUE(parts.Final(&hex));
        EXPECT_EQ(HexOf("abc"), hex);
    });
}

TEST_F(Modules, DigestEndsOnce) {
    Apart([] {
        talo::Sha256 digest;
        std::string hex;
        EXPECT_TRUE(digest.Final(&hex));
        hex = "untouched";
        EXPECT_FALSE(digest.Update("a", 1));
        EXPECT_FALSE(digest.Final(&hex));
        EXPECT_EQ("untouched", hex);
    });
}

TEST_F(Modules, AreMissedWithoutHarm) {
    fs::remove(TALO_MODULE_DIR + std::string("talo-digest.so"));
    fs::remove(TALO_MODULE_DIR + std::string("talo-archive.so"));
    Apart([] {
        talo::Sha256 digest;
        std::string hex;
        EXPECT_FALSE(digest.Update("a", 1));
        EXPECT_FALSE(digest.Final(&hex));
        talo::ZipWriter zip(STDOUT_FILENO);
        EXPECT_FALSE(zip.IsOpen());
        EXPECT_FALSE(zip.AddFolder("a", 0));
        EXPECT_FALSE(zip.AddFile("a", 0, 0, STDIN_FILENO));
        EXPECT_FALSE(zip.Finish());
    });
}

constexpr char kEndOfDirectory[] = "PK\x05\x06";

TEST_F(Modules, ArchiveHoldsWhatWasPut) {
    const support::ChildResult child = support::InChild(
        [] {
            talo::ZipWriter zip(STDOUT_FILENO);
            EXPECT_TRUE(zip.IsOpen());
            EXPECT_TRUE(zip.AddFolder("folder", 1000000000));
            EXPECT_TRUE(zip.AddFile("folder/\xC3\xA4.txt", 1000000000, 7, STDIN_FILENO));
            EXPECT_TRUE(zip.Finish());
            EXPECT_FALSE(zip.Finish());
            return 0;
        },
        "content");
    EXPECT_EQ(0, child.status);
    EXPECT_EQ("PK", child.output.substr(0, 2));
    EXPECT_NE(std::string::npos, child.output.find("content"));
    EXPECT_NE(std::string::npos, child.output.find(kEndOfDirectory));
}

TEST_F(Modules, ArchiveLacksItsEndWhenAFileIsShorterThanItWas) {
    const support::ChildResult child = support::InChild(
        [] {
            talo::ZipWriter zip(STDOUT_FILENO);
            EXPECT_FALSE(zip.AddFile("file", 0, 8, STDIN_FILENO));
            EXPECT_FALSE(zip.IsOpen());
            EXPECT_FALSE(zip.Finish());
            return 0;
        },
        "content");
    EXPECT_EQ(0, child.status);
    EXPECT_EQ(std::string::npos, child.output.find(kEndOfDirectory));
}

TEST_F(Modules, ArchiveFailsWhenNobodyTakesIt) {
    const support::ChildResult child = support::InChild(
        [] {
            const int full = open("/dev/full", O_WRONLY | O_CLOEXEC);
            talo::ZipWriter zip(full);
            // What is written may wait in a block until the end.
            EXPECT_FALSE(zip.AddFile("file", 0, 7, STDIN_FILENO) && zip.Finish());
            EXPECT_FALSE(zip.IsOpen());
            (void)close(full);
            return 0;
        },
        "content");
    EXPECT_EQ(0, child.status) << child.output;
}

TEST_F(Modules, ArchiveLacksItsEndWhenItIsDropped) {
    const support::ChildResult child = support::InChild([] {
        talo::ZipWriter zip(STDOUT_FILENO);
        EXPECT_TRUE(zip.AddFolder("folder", 0));
        return 0;
    });
    EXPECT_EQ(0, child.status);
    EXPECT_EQ(std::string::npos, child.output.find(kEndOfDirectory));
}

}  // namespace
