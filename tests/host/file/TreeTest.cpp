#include <errno.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <stdexcept>

#include "PlaceFixture.h"

using talo::FileError;
using talo::FileType;
using talo::TreeEntry;

namespace {

class Tree : public PlaceFixture {
  public:
    std::vector<std::string> Visited(const std::string& path, bool openFiles = false) const {
        std::vector<std::string> paths;
        talo::Place place;
        At(path, &place);
        EXPECT_EQ(FileError::kNone, place.Walk(openFiles, [&](const TreeEntry& entry) {
            paths.push_back(entry.path);
            EXPECT_EQ(openFiles && entry.facts.type == FileType::kFile, entry.file >= 0)
                << entry.path;
            return true;
        }));
        return paths;
    }

    FileError RemoveTree(const std::string& path) const {
        talo::Place place;
        At(path, &place);
        return place.RemoveTree([](const TreeEntry&) { return true; });
    }

    // Folders within each other, deeper than any path can name.
    void MakeDeep(const std::string& path, int depth) const {
        MakeFolders(path);
        int folder = open(InShare(path).c_str(), O_PATH | O_DIRECTORY);
        for (int level = 0; level < depth; ++level) {
            ASSERT_EQ(0, mkdirat(folder, "deep", 0755));
            const int next = openat(folder, "deep", O_PATH | O_DIRECTORY);
            (void)close(folder);
            folder = next;
        }
        (void)close(folder);
    }

    static long OpenDescriptors() {
        return std::distance(std::filesystem::directory_iterator("/proc/self/fd"),
                             std::filesystem::directory_iterator());
    }

    bool Exists(const std::string& path) const {
        return std::filesystem::exists(InShare(path));
    }
};

TEST_F(Tree, IsVisitedInByteOrderOfThePaths) {
    for (const char* path : {"t/a/z", "t/a/b/c", "t/a-b", "t/a.b", "t/a0", "t/A"}) {
        Write(path, path);
    }
    const std::vector<std::string> expected{"A", "a-b", "a.b", "a", "a/b", "a/b/c", "a/z", "a0"};
    EXPECT_EQ(expected, Visited("t"));
    EXPECT_EQ(expected, Visited("t", true));
}

TEST_F(Tree, IsEmptyInAnEmptyFolder) {
    MakeFolders("t");
    EXPECT_TRUE(Visited("t").empty());
    EXPECT_EQ(FileError::kNone, RemoveTree("t"));
    EXPECT_FALSE(Exists("t"));
}

TEST_F(Tree, ShowsLinksAndDoesNotFollowThem) {
    Write("t/file", "x");
    Link("t/inside", "file");
    Link("t/out", Outside(""));
    EXPECT_EQ((std::vector<std::string>{"file", "inside", "out"}), Visited("t", true));
}

TEST_F(Tree, ShowsNoUnfinishedFiles) {
    Write("t/.talo-new-0123456789abcdef", "x");
    EXPECT_TRUE(Visited("t").empty());
    EXPECT_EQ(FileError::kNone, RemoveTree("t"));
    EXPECT_FALSE(Exists("t"));
}

TEST_F(Tree, CarriesNamesThatAreNoText) {
    Write("t/\xFF\xFE", "x");
    Write("t/a\nb", "x");
    EXPECT_EQ((std::vector<std::string>{"a\nb", "\xFF\xFE"}), Visited("t"));
}

TEST_F(Tree, MayBeDeeperThanAnyPath) {
    constexpr int kDepth = 3000;
    MakeDeep("t", kDepth);
    const long before = OpenDescriptors();
    long most = 0;
    talo::Place place;
    int visited = 0;
    At("t", &place);
    EXPECT_EQ(FileError::kNone, place.Walk(false, [&](const TreeEntry&) {
        if (++visited % 1000 == 0) {
            most = std::max(most, OpenDescriptors());
        }
        return true;
    }));
    EXPECT_EQ(kDepth, visited);
    EXPECT_LE(most, before + 4);
    EXPECT_EQ(FileError::kNone, RemoveTree("t"));
    EXPECT_FALSE(Exists("t"));
}

TEST_F(Tree, IsRemovedWholeAndNothingElse) {
    Write("t/a/b/c", "x");
    Write("t/d", "x");
    Write("kept", "x");
    Link("t/out", Outside(""));
    Link("t/a/file", Outside("secret"));
    Link("t/beside", "../kept");
    ASSERT_EQ(0, mkfifo(InShare("t/pipe").c_str(), 0600));
    EXPECT_EQ(FileError::kNone, RemoveTree("t"));
    EXPECT_FALSE(Exists("t"));
    EXPECT_TRUE(Exists("kept"));
    ExpectOutsideUntouched();
}

TEST_F(Tree, IsRemovedInPortionsWhateverItsSize) {
    constexpr int kFiles = 10001;
    MakeFolders("t/inner");
    for (int number = 0; number < kFiles; ++number) {
        const std::string path = InShare("t/inner/" + std::to_string(number));
        (void)close(open(path.c_str(), O_CREAT | O_WRONLY, 0600));
    }
    int visited = 0;
    talo::Place place;
    At("t", &place);
    EXPECT_EQ(FileError::kNone, place.RemoveTree([&](const TreeEntry&) {
        ++visited;
        return true;
    }));
    EXPECT_EQ(kFiles + 1, visited);
    EXPECT_FALSE(Exists("t"));
}

TEST_F(Tree, IsNotRemovedThroughALink) {
    Write("t/x", "x");
    Link("inside", "t");
    Link("outside", Outside(""));
    EXPECT_EQ(FileError::kNotFolder, RemoveTree("inside"));
    EXPECT_EQ(FileError::kNotFolder, RemoveTree("outside"));
    EXPECT_TRUE(Exists("t/x"));
    ExpectOutsideUntouched();
}

TEST_F(Tree, StopsWhenItIsTold) {
    Write("t/a", "x");
    Write("t/b", "x");
    talo::Place place;
    At("t", &place);
    int left = 1;
    const auto visit = [&](const TreeEntry&) { return left-- > 0; };
    EXPECT_EQ(FileError::kStopped, place.RemoveTree(visit));
    EXPECT_EQ(1, Visited("t").size());
    left = 0;
    EXPECT_EQ(FileError::kStopped, place.Walk(false, visit));
}

TEST_F(Tree, IsLeftWhenAFolderIsMovedAwayMeanwhile) {
    Write("t/a/file", "x");
    Write("t/b", "x");
    MakeFolders("elsewhere");
    talo::Place place;
    At("t", &place);
    const FileError result = place.RemoveTree([&](const TreeEntry& entry) {
        if (entry.path == "a/file") {
            EXPECT_EQ(0, rename(InShare("t/a").c_str(), InShare("elsewhere/a").c_str()));
        }
        return true;
    });
    EXPECT_TRUE(result == FileError::kNotFound || !Exists("t")) << static_cast<int>(result);
    EXPECT_TRUE(Exists("elsewhere/a"));
}

TEST_F(Tree, SurvivesAVisitorThatThrows) {
    Write("t/a", "x");
    const long before = OpenDescriptors();
    talo::Place place;
    At("t", &place);
    EXPECT_EQ(FileError::kFailed, place.Walk(true, [](const TreeEntry&) -> bool {
        throw std::runtime_error("visitor");
    }));
    EXPECT_EQ(before + 1, OpenDescriptors());
}

}  // namespace
