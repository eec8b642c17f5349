#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>

#include "tests/host/slice/SliceFixture.h"

namespace fs = std::filesystem;
using talo::SliceResult;

namespace {

class Complete : public SliceTest {
  protected:
    // Sends all of it and moves it away as its creator does.
    std::string Finish(const std::string& content) {
        const std::string id = Begin(content.size());
        const Input input(content);
        talo::SliceUpload upload;
        EXPECT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
        EXPECT_EQ(upload.Append(0, content.size(), ""), SliceResult::kDone);
        EXPECT_EQ(upload.Check(), SliceResult::kDone);
        EXPECT_EQ(Read(upload.DataPath()), content);
        fs::rename(upload.DataPath(), FolderPath() + "/../taken");
        EXPECT_TRUE(upload.Complete());
        return id;
    }
};

TEST_F(Complete, IsRememberedForAClientThatMissedTheAnswer) {
    const std::string id = Finish("content");
    EXPECT_EQ(Names(), std::vector<std::string>{id + ".done"});
    talo::SliceFile file;
    unsigned long long offset = 0;
    ASSERT_EQ(talo::FindSliceUpload(id, "mia", &file, &offset), SliceResult::kDone);
    EXPECT_TRUE(file.complete);
    EXPECT_EQ(file.length, 7u);
    EXPECT_EQ(offset, 7u);
    EXPECT_EQ(file.target, "/photos/a.jpg");
    EXPECT_EQ(Read(FolderPath() + "/../taken"), "content");
}

TEST_F(Complete, TakesNothingMore) {
    const std::string id = Finish("content");
    EXPECT_EQ(Send(id, 7, ""), SliceResult::kDone);
    EXPECT_EQ(Send(id, 7, "x"), SliceResult::kTooLong);
    EXPECT_EQ(Send(id, 0, "content"), SliceResult::kWrongOffset);
    EXPECT_EQ(Read(FolderPath() + "/../taken"), "content");
    EXPECT_EQ(Names(), std::vector<std::string>{id + ".done"});
}

TEST_F(Complete, IsStillOthersBusinessOnly) {
    const std::string id = Finish("content");
    EXPECT_FALSE(Exists(id, "tom"));
    EXPECT_EQ(Send(id, 7, "", "", "tom"), SliceResult::kNotFound);
}

TEST_F(Complete, NeedsTheWholeFile) {
    const std::string id = Begin(3);
    const Input input("abc");
    talo::SliceUpload upload;
    ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
    ASSERT_EQ(upload.Append(0, 2, ""), SliceResult::kDone);
    EXPECT_EQ(upload.Check(), SliceResult::kFailed);
    EXPECT_FALSE(upload.Complete());
    EXPECT_EQ(Read(DataPathOf(id)), "ab");
    EXPECT_EQ(upload.Append(2, 1, ""), SliceResult::kDone);
    EXPECT_EQ(upload.Check(), SliceResult::kDone);
    EXPECT_TRUE(upload.Complete());
    EXPECT_TRUE(upload.File().complete);
    EXPECT_FALSE(upload.Complete());
}

TEST_F(Complete, OfAnEmptyFileNeedsNoSlice) {
    const std::string id = Begin(0);
    talo::SliceUpload upload;
    ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
    EXPECT_EQ(upload.Check(), SliceResult::kDone);
    EXPECT_EQ(fs::file_size(upload.DataPath()), 0u);
    EXPECT_TRUE(upload.Complete());
    EXPECT_EQ(OffsetOf(id), 0);
}

TEST_F(Complete, LeavesNoDataWhereTheyWereCopiedAway) {
    const std::string id = Begin(1);
    ASSERT_EQ(Send(id, 0, "x"), SliceResult::kDone);
    talo::SliceUpload upload;
    ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
    EXPECT_TRUE(upload.Complete());
    EXPECT_EQ(Names(), std::vector<std::string>{id + ".done"});
}

TEST_F(Complete, IsUnknownWhenTheProcessDiedInBetween) {
    const std::string id = Begin(3);
    ASSERT_EQ(Send(id, 0, "abc"), SliceResult::kDone);
    fs::rename(DataPathOf(id), FolderPath() + "/../taken");
    EXPECT_FALSE(Exists(id));
    EXPECT_EQ(Send(id, 3, ""), SliceResult::kNotFound);
    EXPECT_EQ(Read(FolderPath() + "/../taken"), "abc");
}

TEST_F(Complete, DoesNotCountAsUnfinished) {
    Configure("slice_per_user=2\n");
    for (int round = 0; round < 5; ++round) {
        (void)Finish("content");
    }
    EXPECT_EQ(Create("mia", 1), SliceResult::kDone);
    EXPECT_EQ(Create("mia", 1), SliceResult::kDone);
    EXPECT_EQ(Create("mia", 1), SliceResult::kTooMany);
}

TEST_F(Complete, IsForgottenWhenNewerOnesAreTooMany) {
    Configure("slice_per_user=2\n");
    std::vector<std::string> ids;
    for (int age = 5; age > 0; --age) {
        ids.push_back(Finish("content"));
        Age(PathOf(ids.back() + ".done"), age * 10);
    }
    EXPECT_EQ(Create("mia", 1), SliceResult::kDone);
    EXPECT_FALSE(Exists(ids[0]));
    EXPECT_FALSE(Exists(ids[1]));
    EXPECT_FALSE(Exists(ids[2]));
    EXPECT_TRUE(Exists(ids[3]));
    EXPECT_TRUE(Exists(ids[4]));
}

TEST_F(Complete, IsSaidOnlyWhenItIs) {
    const std::string id = Begin(3);
    ASSERT_EQ(Send(id, 0, "abc"), SliceResult::kDone);
    talo::SliceUpload upload;
    ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
    fs::rename(upload.DataPath(), FolderPath() + "/../taken");
    // Not lost, and nobody else's turn.
    talo::SliceFile file;
    unsigned long long offset = 0;
    ASSERT_EQ(talo::FindSliceUpload(id, "mia", &file, &offset), SliceResult::kDone);
    EXPECT_FALSE(file.complete);
    EXPECT_EQ(offset, 3u);
    EXPECT_EQ(Send(id, 3, ""), SliceResult::kBusy);
    ASSERT_TRUE(upload.Complete());
    ASSERT_EQ(talo::FindSliceUpload(id, "mia", &file, &offset), SliceResult::kDone);
    EXPECT_TRUE(file.complete);
}

TEST_F(Complete, OrAbandonedItIsLetGo) {
    const size_t before = OpenDescriptors();
    const std::string id = Begin(3);
    {
        talo::SliceUpload upload;
        ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
        EXPECT_TRUE(upload.Abandon());
        EXPECT_FALSE(upload.Abandon());
        EXPECT_EQ(OpenDescriptors(), before);
    }
    EXPECT_TRUE(Names().empty());
    EXPECT_FALSE(Exists(id));
    (void)Finish("content");
    EXPECT_EQ(OpenDescriptors(), before);
}

}  // namespace
