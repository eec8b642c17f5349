#include "src/base/FileIdentity.h"

#include <errno.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include "tests/support/TempFolder.h"

namespace {

using TALO::FileIdentity;

// As it is in life, whatever the other tests' files are.
class FileIdentityTest : public ::testing::Test {
  protected:
    FileIdentityTest() : before_(TALO::SetFileIdentifier(nullptr)) {}
    ~FileIdentityTest() override {
        TALO::SetFileIdentifier(before_);
    }

    FileIdentity Of(const std::string& path) {
        FileIdentity identity;
        EXPECT_TRUE(TALO::IdentifyFile(path.c_str(), &identity)) << path;
        return identity;
    }

    support::TempFolder folder;

  private:
    TALO::FileIdentifier before_;
};

TEST_F(FileIdentityTest, StaysTheSameAsLongAsTheFileDoes) {
    const std::string path = folder.Write("file", "content");
    EXPECT_TRUE(Of(path) == Of(path));
    EXPECT_EQ(Of(path).size, 7);
}

TEST_F(FileIdentityTest, TellsARewriteOfTheSameSizeWhoseTimeWasSetBack) {
    const std::string path = folder.Write("file", "content");
    const FileIdentity before = Of(path);
    struct stat facts = {};
    ASSERT_EQ(stat(path.c_str(), &facts), 0);
    (void)usleep(50000);
    (void)folder.Write("file", "CONTENT");
    const struct timespec times[] = {facts.st_atim, facts.st_mtim};
    ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), times, 0), 0);
    const FileIdentity after = Of(path);
    EXPECT_EQ(after.modified, before.modified);
    EXPECT_FALSE(after == before);
}

TEST_F(FileIdentityTest, TellsAFileThatTookAnothersPlace) {
    const std::string path = folder.Write("file", "content");
    const FileIdentity before = Of(path);
    const std::string other = folder.Write("other", "CONTENT");
    ASSERT_EQ(rename(other.c_str(), path.c_str()), 0);
    EXPECT_FALSE(Of(path) == before);
}

TEST_F(FileIdentityTest, IsUnknownOfEverythingElse) {
    ASSERT_EQ(mkdir(folder.Path("folder").c_str(), 0700), 0);
    ASSERT_EQ(mkfifo(folder.Path("fifo").c_str(), 0600), 0);
    ASSERT_EQ(symlink("nowhere", folder.Path("link").c_str()), 0);
    for (const char* name : {"folder", "fifo", "link", "missing", "missing/file"}) {
        FileIdentity identity;
        identity.size = 42;
        errno = 0;
        EXPECT_FALSE(TALO::IdentifyFile(folder.Path(name).c_str(), &identity)) << name;
        EXPECT_EQ(identity.size, 42) << name;
        EXPECT_EQ(errno, 0) << name;
    }
}

TEST_F(FileIdentityTest, IsSettledTwoSecondsAfterTheLastChange) {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_REALTIME, &now);
    const std::int64_t second = 1000000000;
    const std::int64_t time = now.tv_sec * second;
    EXPECT_TRUE(TALO::IsSettled({1, 1, 1, time - 3 * second, time - 3 * second}));
    EXPECT_FALSE(TALO::IsSettled({1, 1, 1, time - 3 * second, time}));
    EXPECT_FALSE(TALO::IsSettled({1, 1, 1, time, time - 3 * second}));
    EXPECT_FALSE(TALO::IsSettled({1, 1, 1, time + 9 * second, time - 3 * second}));
    EXPECT_FALSE(TALO::IsSettled(Of(folder.Write("fresh", ""))));
}

}  // namespace
