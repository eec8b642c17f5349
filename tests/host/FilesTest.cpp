#include <errno.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "platform/System.h"
#include "tests/support/TempFolder.h"

namespace {

TEST(Files, ExistWhenTheyAreRegularThroughLinksToo) {
    const support::TempFolder folder;
    const std::string file = folder.Write("file", "");
    const std::string link = folder.Path("link");
    const std::string dangling = folder.Path("dangling");
    const std::string pipe = folder.Path("pipe");
    ASSERT_EQ(symlink(file.c_str(), link.c_str()), 0);
    ASSERT_EQ(symlink("nowhere", dangling.c_str()), 0);
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    EXPECT_EQ(TLIBCFileExist(file.c_str()), 1);
    EXPECT_EQ(TLIBCFileExist(link.c_str()), 1);
    EXPECT_EQ(TLIBCFileExist(dangling.c_str()), 0);
    EXPECT_EQ(TLIBCFileExist(pipe.c_str()), 0);
    EXPECT_EQ(TLIBCFileExist(folder.Path(".").c_str()), 0);
    EXPECT_EQ(TLIBCFileExist(folder.Path("missing").c_str()), 0);
    EXPECT_EQ(TLIBCFileExist(""), 0);
    EXPECT_EQ(TLIBCFileExist(nullptr), 0);
}

TEST(Files, AreDeletedAndLinksAreNotFollowed) {
    const support::TempFolder folder;
    const std::string file = folder.Write("file", "");
    const std::string link = folder.Path("link");
    ASSERT_EQ(symlink(file.c_str(), link.c_str()), 0);
    EXPECT_EQ(TLIBCSysUnlink(link.c_str()), 0);
    EXPECT_EQ(TLIBCFileExist(file.c_str()), 1);
    EXPECT_EQ(TLIBCSysUnlink(folder.Path(".").c_str()), -1);
    EXPECT_EQ(TLIBCFileExist(file.c_str()), 1);
}

}  // namespace
