#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <ctime>
#include <filesystem>

#include "PlaceFixture.h"

using talo::FileError;
using talo::FileFacts;
using talo::FileType;

namespace {

class PlaceOperations : public BothResolvers {
  public:
    FileFacts Facts(const std::string& path) const {
        talo::Place place;
        FileFacts facts;
        At(path, &place);
        EXPECT_EQ(FileError::kNone, place.Stat(&facts)) << path;
        return facts;
    }

    FileError Rename(const std::string& from, const std::string& to, bool overwrite) const {
        talo::Place source;
        talo::Place target;
        At(from, &source);
        At(to, &target);
        return source.Rename(target, overwrite);
    }

    FileError Remove(const std::string& path) const {
        talo::Place place;
        At(path, &place);
        return place.Remove();
    }

    FileError MakeFolder(const std::string& path) const {
        talo::Place place;
        At(path, &place);
        return place.MakeFolder();
    }

    bool Exists(const std::string& path) const {
        return std::filesystem::exists(std::filesystem::symlink_status(InShare(path)));
    }
};

TEST_P(PlaceOperations, TellTheFactsOfWhatIsThere) {
    Write("file", "12345");
    MakeFolders("folder");
    ASSERT_EQ(0, mkfifo(InShare("pipe").c_str(), 0600));
    EXPECT_EQ(FileType::kFile, Facts("file").type);
    EXPECT_EQ(5, Facts("file").size);
    EXPECT_LT(std::abs(time(nullptr) - Facts("file").mtime), 60);
    EXPECT_EQ(FileType::kFolder, Facts("folder").type);
    EXPECT_EQ(0, Facts("folder").size);
    EXPECT_EQ(FileType::kOther, Facts("pipe").type);
    EXPECT_EQ(FileType::kFolder, Facts("").type);
    talo::Place none;
    FileFacts facts;
    At("none", &none);
    EXPECT_EQ(FileError::kNotFound, none.Stat(&facts));
}

TEST_P(PlaceOperations, TellWhatALinkInsideLeadsTo) {
    Write("file", "12345");
    Link("inside", "file");
    Link("outside", Outside("secret"));
    Link("nowhere", "none");
    EXPECT_EQ(Walks() ? FileType::kLink : FileType::kFile, Facts("inside").type);
    EXPECT_EQ(FileType::kLink, Facts("outside").type);
    EXPECT_EQ(0, Facts("outside").size);
    EXPECT_EQ(FileType::kLink, Facts("nowhere").type);
    for (const char* path : {"inside", "outside", "nowhere"}) {
        EXPECT_TRUE(Facts(path).isLink) << path;
    }
}

TEST_P(PlaceOperations, ListNamesButNotUnfinishedOnes) {
    Write("folder/b", "1");
    Write("folder/.hidden", "12");
    Write("folder/.talo-new-0123456789abcdef", "x");
    MakeFolders("folder/a");
    talo::Place place;
    std::vector<std::string> names;
    std::vector<talo::NamedFacts> found;
    At("folder", &place);
    ASSERT_EQ(FileError::kNone, place.List(&names));
    std::sort(names.begin(), names.end());
    EXPECT_EQ((std::vector<std::string>{".hidden", "a", "b"}), names);
    names.insert(names.begin(), "gone");
    ASSERT_EQ(FileError::kNone, place.StatAll(names, &found));
    ASSERT_EQ(3, found.size());
    EXPECT_EQ(2, found[0].facts.size);
    EXPECT_EQ(FileType::kFolder, found[1].facts.type);
    EXPECT_EQ("b", found[2].name);
}

TEST_P(PlaceOperations, ListOnlyFolders) {
    Write("file", "x");
    talo::Place place;
    std::vector<std::string> names{"untouched"};
    At("file", &place);
    EXPECT_EQ(FileError::kNotFolder, place.List(&names));
    EXPECT_EQ(1, names.size());
}

TEST_P(PlaceOperations, MakeAFolder) {
    EXPECT_EQ(FileError::kNone, MakeFolder("a"));
    EXPECT_EQ(FileError::kNone, MakeFolder("a/b"));
    EXPECT_EQ(FileError::kExists, MakeFolder("a"));
    EXPECT_EQ(FileError::kNotFound, MakeFolder("c/d"));
    Write("file", "x");
    EXPECT_EQ(FileError::kNotFolder, MakeFolder("file/d"));
    EXPECT_TRUE(std::filesystem::is_directory(InShare("a/b")));
}

TEST_P(PlaceOperations, RenameButReplaceNothingUnasked) {
    Write("a", "A");
    Write("b", "B");
    MakeFolders("folder");
    EXPECT_EQ(FileError::kExists, Rename("a", "b", false));
    EXPECT_EQ(FileError::kExists, Rename("a", "folder", false));
    EXPECT_EQ("B", Read("b"));
    EXPECT_EQ(FileError::kNone, Rename("a", "folder/c", false));
    EXPECT_EQ("A", Read("folder/c"));
    EXPECT_FALSE(Exists("a"));
}

TEST_P(PlaceOperations, RenameOverWhatMayBeReplaced) {
    Write("a", "A");
    Write("b", "B");
    Write("full/x", "x");
    MakeFolders("folder");
    MakeFolders("empty");
    EXPECT_EQ(FileError::kNone, Rename("a", "b", true));
    EXPECT_EQ("A", Read("b"));
    EXPECT_EQ(FileError::kNotFile, Rename("b", "folder", true));
    EXPECT_EQ(FileError::kNotFolder, Rename("folder", "b", true));
    EXPECT_EQ(FileError::kNotEmpty, Rename("folder", "full", true));
    EXPECT_EQ(FileError::kNone, Rename("folder", "empty", true));
    EXPECT_FALSE(Exists("folder"));
}

TEST_P(PlaceOperations, DoNotPutAFolderIntoItself) {
    MakeFolders("folder/inner");
    EXPECT_EQ(FileError::kIntoItself, Rename("folder", "folder/inner/new", false));
    EXPECT_EQ(FileError::kIntoItself, Rename("folder", "folder/inner/new", true));
    EXPECT_FALSE(Exists("folder/inner/new"));
}

TEST_P(PlaceOperations, RemoveAFileALinkAndAnEmptyFolder) {
    Write("file", "x");
    MakeFolders("empty");
    Write("full/x", "x");
    Link("link", Outside(""));
    EXPECT_EQ(FileError::kNone, Remove("file"));
    EXPECT_EQ(FileError::kNone, Remove("empty"));
    EXPECT_EQ(FileError::kNone, Remove("link"));
    EXPECT_EQ(FileError::kNotEmpty, Remove("full"));
    EXPECT_EQ(FileError::kNotFound, Remove("none"));
    EXPECT_FALSE(Exists("file") || Exists("empty") || Exists("link"));
    ExpectOutsideUntouched();
}

TEST_P(PlaceOperations, RenameALinkItself) {
    Link("link", Outside("secret"));
    Write("file", "x");
    EXPECT_EQ(FileError::kNone, Rename("link", "renamed", false));
    EXPECT_EQ(FileError::kNone, Rename("file", "renamed", true));
    EXPECT_EQ("x", Read("renamed"));
    ExpectOutsideUntouched();
}

TEST_P(PlaceOperations, LeaveTheShareItselfAlone) {
    MakeFolders("folder");
    EXPECT_EQ(FileError::kRefused, Remove(""));
    EXPECT_EQ(FileError::kRefused, MakeFolder(""));
    EXPECT_EQ(FileError::kRefused, Rename("", "new", false));
    EXPECT_EQ(FileError::kRefused, Rename("folder", "", true));
    talo::Place share;
    At("", &share);
    EXPECT_EQ(FileError::kRefused, share.RemoveTree([](const talo::TreeEntry&) { return true; }));
    EXPECT_TRUE(Exists("folder"));
}

TEST_P(PlaceOperations, FailWhenTheShareHasNoFolder) {
    talo::Share share;
    share.name = "lost";
    share.folder = InShare("none");
    talo::Place place;
    EXPECT_EQ(FileError::kNotFound, place.Open(share, {}));
    int file = -1;
    EXPECT_EQ(FileError::kFailed, place.OpenFile(&file));
}

INSTANTIATE_TEST_SUITE_P(Kernel, PlaceOperations, ::testing::Values(false));
INSTANTIATE_TEST_SUITE_P(Walk, PlaceOperations, ::testing::Values(true));

}  // namespace
