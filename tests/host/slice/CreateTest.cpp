#include <sys/stat.h>
#include <sys/statvfs.h>
#include <time.h>
#include <unistd.h>

#include <filesystem>
#include <set>

#include "platform/Paths.h"
#include "tests/host/slice/SliceFixture.h"

namespace fs = std::filesystem;
using talo::SliceResult;

namespace {

class Create : public SliceTest {};

mode_t ModeOf(const std::string& path) {
    struct stat facts = {};
    EXPECT_EQ(stat(path.c_str(), &facts), 0) << path;
    return facts.st_mode & 07777;
}

TEST_F(Create, HoldsAnEmptyUploadAsItWasAskedFor) {
    talo::SliceFile file;
    file.owner = "mia";
    file.length = 12;
    file.digest = std::string(64, 'a');
    file.target = "{\"path\":\"/photos/\xc3\xa4 \\\"\"}";
    const long long before = time(nullptr);
    talo::SliceUpload upload;
    ASSERT_EQ(upload.Create(file), SliceResult::kDone);
    EXPECT_EQ(upload.Offset(), 0u);
    talo::SliceFile found;
    unsigned long long offset = 99;
    ASSERT_EQ(talo::FindSliceUpload(upload.Id(), "mia", &found, &offset), SliceResult::kDone);
    EXPECT_EQ(offset, 0u);
    EXPECT_EQ(found.owner, file.owner);
    EXPECT_EQ(found.length, file.length);
    EXPECT_EQ(found.digest, file.digest);
    EXPECT_EQ(found.target, file.target);
    EXPECT_FALSE(found.complete);
    EXPECT_GE(found.created, before);
    EXPECT_LE(found.created, time(nullptr));
}

TEST_F(Create, CanBeFollowedByTheFirstSliceAtOnce) {
    talo::SliceFile file;
    file.owner = "mia";
    file.length = 5;
    const Input input("hello");
    talo::SliceUpload upload;
    ASSERT_EQ(upload.Create(file), SliceResult::kDone);
    EXPECT_EQ(Send(upload.Id(), 0, "hello"), SliceResult::kBusy);
    EXPECT_EQ(upload.Append(0, 5, ""), SliceResult::kDone);
    EXPECT_EQ(Read(upload.DataPath()), "hello");
}

TEST_F(Create, MakesFilesForTheirOwnerAloneWhateverTheUmask) {
    const mode_t before = umask(0);
    const std::string id = Begin(1);
    (void)umask(before);
    EXPECT_EQ(ModeOf(fs::path(FolderPath()).parent_path()), 0700u);
    EXPECT_EQ(ModeOf(FolderPath()), 0700u);
    EXPECT_EQ(ModeOf(PathOf(id)), 0600u);
    EXPECT_EQ(ModeOf(DataPathOf(id)), 0600u);
}

TEST_F(Create, GivesEveryUploadAnotherId) {
    std::set<std::string> ids;
    for (int round = 0; round < 50; ++round) {
        const std::string id = Begin(1);
        EXPECT_TRUE(talo::IsSliceId(id)) << id;
        EXPECT_TRUE(ids.insert(id).second);
    }
}

TEST_F(Create, KeepsAnUploadFromEverybodyElse) {
    const std::string id = Begin(10);
    for (const std::string other :
         {"tom", "mi", "miaa", "Mia", "mia ", "", "../6d6961", "6d6961", ".", "mia/"}) {
        EXPECT_FALSE(Exists(id, other)) << other;
        EXPECT_EQ(Send(id, 0, "x", "", other), SliceResult::kNotFound) << other;
    }
    EXPECT_FALSE(Exists(id, std::string("mia\0", 4)));
    EXPECT_EQ(OffsetOf(id), 0);
}

TEST_F(Create, TakesOwnersOfAnyNameThatIsNotTooLong) {
    for (const std::string& owner : {std::string("DOMAIN\\mia"), std::string("mia@example.net"),
                                     std::string("a/../../b"), std::string(100, 'x')}) {
        std::string id;
        EXPECT_EQ(SliceTest::Create(owner, 3, &id), SliceResult::kDone) << owner;
        EXPECT_EQ(Send(id, 0, "abc", "", owner), SliceResult::kDone) << owner;
    }
    EXPECT_EQ(SliceTest::Create("", 3), SliceResult::kFailed);
    EXPECT_EQ(SliceTest::Create(std::string(101, 'x'), 3), SliceResult::kFailed);
    EXPECT_EQ(SliceTest::Create(std::string(100000, 'x'), 3), SliceResult::kFailed);
}

TEST_F(Create, TakesATargetUpToItsLimit) {
    talo::SliceFile file;
    file.owner = "mia";
    // Every byte of it takes six in the record.
    file.target = std::string(16384, '\x01');
    talo::SliceUpload upload;
    ASSERT_EQ(upload.Create(file), SliceResult::kDone);
    talo::SliceFile found;
    unsigned long long offset = 0;
    ASSERT_EQ(talo::FindSliceUpload(upload.Id(), "mia", &found, &offset), SliceResult::kDone);
    EXPECT_EQ(found.target, file.target);
    file.target += 'x';
    EXPECT_EQ(upload.Create(file), SliceResult::kFailed);
}

TEST_F(Create, RefusesWhatIsNoDigest) {
    EXPECT_EQ(Begin(1, "abc"), "");
    EXPECT_EQ(Begin(1, std::string(64, 'g')), "");
    EXPECT_NE(Begin(1, std::string(64, 'F')), "");
}

TEST_F(Create, RefusesAFileBeyondTheLimit) {
    Configure("slice_max_bytes=1000\n");
    EXPECT_EQ(SliceTest::Create("mia", 1000), SliceResult::kDone);
    EXPECT_EQ(SliceTest::Create("mia", 1001), SliceResult::kTooLong);
    EXPECT_EQ(SliceTest::Create("mia", ~0ull), SliceResult::kTooLong);
}

TEST_F(Create, RefusesAFileThatNotEvenNowHasRoom) {
    Configure("slice_max_bytes=9223372036854775807\n");
    EXPECT_EQ(SliceTest::Create("mia", 1ull << 62), SliceResult::kNoSpace);
    EXPECT_TRUE(Names().empty());
}

TEST_F(Create, RefusesMoreThanAUserMayHave) {
    Configure("slice_per_user=3\n");
    std::string id;
    for (int round = 0; round < 3; ++round) {
        ASSERT_EQ(SliceTest::Create("mia", 1, &id), SliceResult::kDone);
    }
    EXPECT_EQ(SliceTest::Create("mia", 1), SliceResult::kTooMany);
    EXPECT_EQ(SliceTest::Create("tom", 1), SliceResult::kDone);
    talo::SliceUpload upload;
    ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
    ASSERT_TRUE(upload.Abandon());
    EXPECT_EQ(SliceTest::Create("mia", 1), SliceResult::kDone);
    EXPECT_EQ(SliceTest::Create("mia", 1), SliceResult::kTooMany);
}

TEST_F(Create, CountsNoneThatHasExpired) {
    Configure("slice_per_user=2\n");
    const std::string old = Begin(1);
    ASSERT_NE(Begin(1), "");
    EXPECT_EQ(SliceTest::Create("mia", 1), SliceResult::kTooMany);
    LeaveUnused(old, 2 * 86400 + 100);
    EXPECT_EQ(SliceTest::Create("mia", 1), SliceResult::kDone);
}

TEST_F(Create, FailsWhereTheFolderIsNotOurs) {
    fs::create_directories(fs::path(FolderPath()).parent_path());
    fs::permissions(fs::path(FolderPath()).parent_path(), fs::perms::all);
    EXPECT_EQ(SliceTest::Create("mia", 1), SliceResult::kFailed);
    fs::permissions(fs::path(FolderPath()).parent_path(), fs::perms::owner_all);
    if (geteuid() == 0) {
        ASSERT_EQ(chown(fs::path(FolderPath()).parent_path().c_str(), 12345, 12345), 0);
        EXPECT_EQ(SliceTest::Create("mia", 1), SliceResult::kFailed);
        ASSERT_EQ(chown(fs::path(FolderPath()).parent_path().c_str(), 0, 0), 0);
    }
    Write(FolderPath(), "a file");
    EXPECT_EQ(SliceTest::Create("mia", 1), SliceResult::kFailed);
    Place("/proc/nothing/here");
    EXPECT_EQ(SliceTest::Create("mia", 1), SliceResult::kFailed);
}

TEST_F(Create, UsesTheFixedPlaceWhereNoOtherIsConfigured) {
    fs::remove_all(TALO_SLICE_DIR);
    for (const char* place : {"", "relative/place", "."}) {
        Place(place);
        std::string id;
        EXPECT_EQ(SliceTest::Create("mia", 1, &id), SliceResult::kDone) << place;
        EXPECT_TRUE(fs::exists(TALO_SLICE_DIR "/6d6961/" + id)) << place;
        fs::remove_all(TALO_SLICE_DIR);
    }
}

TEST_F(Create, MayFollowALinkToAnotherDisk) {
    const fs::path place = fs::path(FolderPath()).parent_path();
    fs::create_directories(place.string() + "-there");
    fs::permissions(place.string() + "-there", fs::perms::owner_all);
    fs::create_directory_symlink(place.string() + "-there", place);
    EXPECT_EQ(Send(Begin(3), 0, "abc"), SliceResult::kDone);
}

}  // namespace
