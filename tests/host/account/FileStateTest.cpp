#include "hosts/linux/util/FileState.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstdio>
#include <string>
#include <thread>

#include "tests/support/TempFolder.h"

namespace {

using host::FileState;

class FileStateTest : public testing::Test {
  protected:
    void Write(const std::string& content) const {
        FILE* const out = std::fopen(path.c_str(), "w");
        ASSERT_NE(out, nullptr);
        (void)std::fputs(content.c_str(), out);
        (void)std::fclose(out);
    }

    // Until times that are written then are others.
    static void LetTimePass() {
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }

    support::TempFolder folder;
    const std::string path = folder.Path("file");
};

TEST_F(FileStateTest, IsKnownOfARegularFileOnly) {
    errno = EDOM;
    EXPECT_FALSE(FileState().IsKnown());
    EXPECT_FALSE(FileState(path).IsKnown());
    EXPECT_FALSE(FileState(folder.Path(".")).IsKnown());
    ASSERT_EQ(mkfifo((path + ".pipe").c_str(), 0600), 0);
    EXPECT_FALSE(FileState(path + ".pipe").IsKnown());
    EXPECT_EQ(errno, EDOM);
    Write("");
    EXPECT_TRUE(FileState(path).IsKnown());
}

TEST_F(FileStateTest, StaysTheSameAsLongAsTheFileDoes) {
    Write("content");
    const FileState before(path);
    LetTimePass();
    EXPECT_TRUE(FileState(path) == before);
}

TEST_F(FileStateTest, IsAnotherAfterEachKindOfChange) {
    Write("content");
    const FileState written(path);
    LetTimePass();
    Write("CONTENT");
    const FileState overwritten(path);
    EXPECT_FALSE(overwritten == written);
    LetTimePass();
    ASSERT_EQ(chmod(path.c_str(), 0600), 0);
    const FileState closed(path);
    EXPECT_FALSE(closed == overwritten);
    ASSERT_EQ(rename(path.c_str(), (path + ".old").c_str()), 0);
    Write("content");
    EXPECT_FALSE(FileState(path) == closed);
}

TEST_F(FileStateTest, IsSettledSomeTimeAfterTheLastChange) {
    Write("content");
    EXPECT_FALSE(FileState(path).IsSettled());
    // Whoever sets the one time back cannot set the other.
    const struct timespec longAgo[2] = {{1, 0}, {1, 0}};
    ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), longAgo, 0), 0);
    EXPECT_FALSE(FileState(path).IsSettled());
    std::this_thread::sleep_for(std::chrono::milliseconds(2050));
    EXPECT_TRUE(FileState(path).IsSettled());
}

TEST_F(FileStateTest, TellsWhatWasMadeOfTheFileAsLongAsItStaysAsItWas) {
    host::KeptFromFile<std::string, int> kept;
    EXPECT_EQ(kept.Find("", FileState()), nullptr);
    Write("content");
    const FileState written(path);
    kept.Keep("seven", written, 7);
    ASSERT_NE(kept.Find("seven", FileState(path)), nullptr);
    EXPECT_EQ(*kept.Find("seven", FileState(path)), 7);
    EXPECT_EQ(kept.Find("eight", FileState(path)), nullptr);
    LetTimePass();
    Write("other content");
    EXPECT_EQ(kept.Find("seven", FileState(path)), nullptr);
    ASSERT_EQ(unlink(path.c_str()), 0);
    kept.Keep("none", FileState(path), 1);
    EXPECT_EQ(kept.Find("none", FileState(path)), nullptr);
}

}  // namespace
