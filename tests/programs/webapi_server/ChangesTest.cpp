#include "programs/webapi_server/Changes.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "tests/support/TempFolder.h"

namespace {

class ChangesTest : public testing::Test {
  protected:
    ChangesTest() {
        folder.Write("A.lib", "{}");
        folder.Write("lib.def", "{}");
        folder.Write("a.so", "1");
    }

    // One look sees the change, the next that it stands still.
    static bool IsNoticed(Changes& changes) {
        EXPECT_FALSE(changes.Look());
        return changes.Look();
    }

    support::TempFolder folder;
};

TEST_F(ChangesTest, NoticesNothingWhereNothingChanges) {
    Changes changes(folder.Path(""));
    changes.AddLibrary("a.so");
    for (int look = 0; look < 20; ++look) {
        EXPECT_FALSE(changes.Look());
    }
}

TEST_F(ChangesTest, NoticesANewDescription) {
    Changes changes(folder.Path(""));
    folder.Write("B.lib", "{}");
    EXPECT_TRUE(IsNoticed(changes));
}

TEST_F(ChangesTest, NoticesADescriptionThatIsGone) {
    Changes changes(folder.Path(""));
    unlink(folder.Path("A.lib").c_str());
    EXPECT_TRUE(IsNoticed(changes));
}

TEST_F(ChangesTest, NoticesARenamedDescription) {
    Changes changes(folder.Path(""));
    rename(folder.Path("A.lib").c_str(), folder.Path("B.lib").c_str());
    EXPECT_TRUE(IsNoticed(changes));
}

TEST_F(ChangesTest, NoticesContentOfTheSameSize) {
    Changes changes(folder.Path(""));
    usleep(20000);
    folder.Write("A.lib", "[]");
    EXPECT_TRUE(IsNoticed(changes));
}

TEST_F(ChangesTest, NoticesReplacedDefaults) {
    Changes changes(folder.Path(""));
    folder.Write("new", "{}");
    rename(folder.Path("new").c_str(), folder.Path("lib.def").c_str());
    EXPECT_TRUE(IsNoticed(changes));
}

TEST_F(ChangesTest, NoticesAReplacedLibraryByRelativeAndAbsolutePath) {
    for (const std::string& path : {std::string("a.so"), folder.Path("a.so")}) {
        Changes changes(folder.Path(""));
        changes.AddLibrary(path);
        changes.AddLibrary(path);
        EXPECT_FALSE(changes.Look());
        folder.Write("new", "1");
        rename(folder.Path("new").c_str(), folder.Path("a.so").c_str());
        EXPECT_TRUE(IsNoticed(changes)) << path;
    }
}

TEST_F(ChangesTest, NoticesALibraryThatWasMissing) {
    Changes changes(folder.Path(""));
    changes.AddLibrary("late.so");
    EXPECT_FALSE(changes.Look());
    folder.Write("late.so", "1");
    EXPECT_TRUE(IsNoticed(changes));
}

TEST_F(ChangesTest, KeepsAChangeThatCameBetweenTheFolderAndALibrary) {
    Changes changes(folder.Path(""));
    folder.Write("B.lib", "{}");
    changes.AddLibrary("a.so");
    EXPECT_TRUE(IsNoticed(changes));
}

TEST_F(ChangesTest, LooksAtNothingElse) {
    Changes changes(folder.Path(""));
    folder.Write("readme.txt", "1");
    folder.Write("A.lib.new", "1");
    folder.Write(".B.lib", "1");
    folder.Write("a.so", "other");
    EXPECT_FALSE(IsNoticed(changes));
}

TEST_F(ChangesTest, WaitsForAnUpgradeToFinishButNotForEver) {
    Changes changes(folder.Path(""));
    int looks = 1;
    for (; looks < 100; ++looks) {
        folder.Write("N" + std::to_string(looks) + ".lib", "{}");
        if (changes.Look()) {
            break;
        }
    }
    EXPECT_GT(looks, 2);
    EXPECT_LT(looks, 30);
}

TEST_F(ChangesTest, IsQuietAgainWhenAllIsAsBefore) {
    Changes changes(folder.Path(""));
    folder.Write("B.lib", "{}");
    EXPECT_FALSE(changes.Look());
    unlink(folder.Path("B.lib").c_str());
    EXPECT_FALSE(changes.Look());
    EXPECT_FALSE(changes.Look());
}

TEST_F(ChangesTest, SurvivesAFolderThatIsGone) {
    Changes changes(folder.Path("nowhere"));
    changes.AddLibrary("a.so");
    EXPECT_FALSE(changes.Look());
    EXPECT_FALSE(changes.Look());
}

}  // namespace
