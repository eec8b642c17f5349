#include "src/entry/UploadFolder.h"

#include <gtest/gtest.h>
#include <sys/statvfs.h>

#include <cstdint>
#include <string>
#include <vector>

#include "platform/Paths.h"
#include "tests/fake/FakePlatform.h"

namespace {

constexpr unsigned long long kMiB = 1ULL << 20;
constexpr unsigned long long kGiB = 1ULL << 30;
constexpr unsigned long long kMost = UINT64_MAX;

constexpr int kNoSpace = 10496;
constexpr int kNoFolder = 3072;

const char kUntouched[] = "untouched";
const char kVolumeFolder[] = "/volume1/@tmp";

// An appliance without a data volume, whose two file systems are full until a test
// gives them room.
class UploadFolder : public ::testing::Test {
  protected:
    UploadFolder() {
        fake::Reset();
        SetFree("/tmp", 0);
        SetFree("/", 0);
    }
    ~UploadFolder() override {
        fake::Reset();
    }

    // Room in blocks of one byte, so that every number of bytes can be said.
    static void SetFree(const std::string& path, unsigned long long bytes) {
        SetBlocks(path, bytes, 1);
    }

    // What is left to an ordinary process, and the size of a block, are others:
    // neither counts.
    static void SetBlocks(const std::string& path, unsigned long long blocks, unsigned long size) {
        fake::FileSystem& system = fake::Now().fileSystems[path];
        system.freeBlocks = blocks;
        system.availableBlocks = blocks / 2;
        system.fragmentSize = size;
        system.blockSize = size * 8;
    }

    static void AddVolume(unsigned long long bytes) {
        fake::Now().volume = "/volume1";
        fake::Now().volumeFree = bytes;
    }

    static void Configure(const std::string& lines) {
        fake::Now().files[TALO_INFO_CONF] = lines;
    }

    // The folder found, "" for none; a search that fails leaves its output alone.
    static std::string Find(unsigned long long needed) {
        std::string dir = kUntouched;
        if (TALO::FindUploadTmpDir(&dir, needed)) {
            return dir;
        }
        EXPECT_EQ(dir, kUntouched);
        return "";
    }

    static std::vector<int> Errors() {
        return fake::Now().errors;
    }
};

TEST_F(UploadFolder, IsThatOfADataVolumeBeforeAllOthers) {
    AddVolume(10 * kMiB);
    SetFree("/tmp", kGiB);
    SetFree("/", kGiB);
    EXPECT_EQ(Find(10 * kMiB), kVolumeFolder);
    EXPECT_TRUE(fake::Now().fileSystemCalls.empty());
    EXPECT_TRUE(Errors().empty());
}

TEST_F(UploadFolder, AsksForAVolumeOnceWithAZeroedRecordAndNoStatusYet) {
    AddVolume(kMost);
    EXPECT_EQ(Find(123456789012345), kVolumeFolder);
    ASSERT_EQ(fake::Now().volumeCalls.size(), 1u);
    const fake::VolumeCall& call = fake::Now().volumeCalls[0];
    EXPECT_EQ(call.size, 123456789012345);
    EXPECT_EQ(call.status, -1);
    EXPECT_EQ(call.flags, 1);
    EXPECT_TRUE(call.recordWasZero);
}

TEST_F(UploadFolder, MakesTheFolderOfTheVolumeForEverybody) {
    AddVolume(kGiB);
    EXPECT_EQ(Find(1), kVolumeFolder);
    ASSERT_EQ(fake::Now().foldersMade.size(), 1u);
    const fake::FolderCall& call = fake::Now().foldersMade[0];
    EXPECT_EQ(call.path, kVolumeFolder);
    EXPECT_EQ(call.flags, 0);
    EXPECT_EQ(call.parents, 1);
    EXPECT_EQ(call.uid, -1);
    EXPECT_EQ(call.gid, -1);
    EXPECT_EQ(call.mode, 0777u);
}

TEST_F(UploadFolder, TakesTheVolumeAlsoWhenItsFolderCannotBeMade) {
    AddVolume(kGiB);
    SetFree("/tmp", kGiB);
    fake::Now().FailCall("TALOFSMkdirP", 1);
    EXPECT_EQ(Find(1), kVolumeFolder);
    EXPECT_TRUE(Errors().empty());
}

TEST_F(UploadFolder, TakesAVolumeForWhatTheOthersCannotCount) {
    AddVolume(kMost);
    EXPECT_EQ(Find(4 * kGiB), kVolumeFolder);
    EXPECT_EQ(Find(kMost), kVolumeFolder);
}

TEST_F(UploadFolder, LeavesAVolumeWithoutTheRoomFor) {
    AddVolume(kMiB);
    SetFree("/tmp", kGiB);
    EXPECT_EQ(Find(kMiB), kVolumeFolder);
    EXPECT_EQ(Find(kMiB + 1), "/tmp");
}

TEST_F(UploadFolder, TakesNoAnswerButOneForAVolume) {
    AddVolume(kGiB);
    SetFree("/tmp", kGiB);
    for (const int answer : {-1, 0, 2, 100, INT32_MIN, INT32_MAX}) {
        fake::Now().volumeAnswer = answer;
        EXPECT_EQ(Find(1), "/tmp") << answer;
    }
    EXPECT_TRUE(fake::Now().foldersMade.empty());
}

TEST_F(UploadFolder, ConsidersNoVolumeOnAMinibox) {
    Configure("minibox=\"yes\"\n");
    AddVolume(kMost);
    SetFree("/tmp", kMiB);
    SetFree("/", kGiB);
    EXPECT_EQ(Find(kMiB), "/tmp");
    EXPECT_EQ(Find(kMiB + 1), TALO_UPLOAD_FALLBACK_DIR);
    EXPECT_EQ(Find(2 * kGiB), "");
    EXPECT_TRUE(fake::Now().volumeCalls.empty());
}

TEST_F(UploadFolder, CountsOnlyYesForAMinibox) {
    AddVolume(kGiB);
    for (const char* lines : {"", "minibox=\"no\"\n", "minibox=\"YES\"\n", "minibox=\"\"\n",
                              "maxibox=\"yes\"\n", "other=\"minibox\"\n"}) {
        Configure(lines);
        EXPECT_EQ(Find(1), kVolumeFolder) << lines;
    }
}

TEST_F(UploadFolder, IsTmpUpToItsLastByte) {
    SetFree("/tmp", 105 * kMiB);
    EXPECT_EQ(Find(105 * kMiB), "/tmp");
    EXPECT_TRUE(Errors().empty());
    EXPECT_TRUE(fake::Now().foldersMade.empty());
    EXPECT_EQ(fake::Now().fileSystemCalls, std::vector<std::string>{"/tmp"});
    EXPECT_EQ(Find(105 * kMiB + 1), "");
}

TEST_F(UploadFolder, IsTheOneOnTheRootFileSystemWhenTmpIsTooSmall) {
    SetFree("/tmp", 104 * kMiB);
    SetFree("/", 305 * kMiB);
    EXPECT_EQ(Find(105 * kMiB), TALO_UPLOAD_FALLBACK_DIR);
    EXPECT_EQ(Errors(), std::vector<int>{kNoSpace});
    const std::vector<std::string> asked = {"/tmp", "/"};
    EXPECT_EQ(fake::Now().fileSystemCalls, asked);
}

TEST_F(UploadFolder, KeepsTwoHundredMebibytesOnTheRootFileSystem) {
    SetFree("/", 305 * kMiB);
    EXPECT_EQ(Find(105 * kMiB), TALO_UPLOAD_FALLBACK_DIR);
    EXPECT_EQ(Find(105 * kMiB + 1), "");
    SetFree("/", 305 * kMiB - 1);
    EXPECT_EQ(Find(105 * kMiB), "");
    SetFree("/", 200 * kMiB);
    EXPECT_EQ(Find(0), "/tmp");
    EXPECT_EQ(Find(1), "");
}

TEST_F(UploadFolder, OnTheRootFileSystemIsForItsOwnerAlone) {
    SetFree("/", kGiB);
    EXPECT_EQ(Find(1), TALO_UPLOAD_FALLBACK_DIR);
    ASSERT_EQ(fake::Now().foldersMade.size(), 1u);
    const fake::FolderCall& call = fake::Now().foldersMade[0];
    EXPECT_EQ(call.path, TALO_UPLOAD_FALLBACK_DIR);
    EXPECT_EQ(call.flags, 0);
    EXPECT_EQ(call.parents, 1);
    EXPECT_EQ(call.uid, -1);
    EXPECT_EQ(call.gid, -1);
    EXPECT_EQ(call.mode, 040700u);
}

TEST_F(UploadFolder, OnTheRootFileSystemMustBeMadeElse3072) {
    SetFree("/", kGiB);
    fake::Now().FailCall("TALOFSMkdirP", 1);
    EXPECT_EQ(Find(1), "");
    const std::vector<int> errors = {kNoSpace, kNoFolder};
    EXPECT_EQ(Errors(), errors);
}

TEST_F(UploadFolder, IsNoneWith10496ForEachFileSystemWithoutRoom) {
    EXPECT_EQ(Find(1), "");
    const std::vector<int> errors = {kNoSpace, kNoSpace};
    EXPECT_EQ(Errors(), errors);
    EXPECT_TRUE(fake::Now().foldersMade.empty());
}

TEST_F(UploadFolder, GoesPastAFileSystemThatDoesNotAnswerWithoutAnError) {
    SetFree("/tmp", kGiB);
    SetFree("/", kGiB);
    fake::Now().FailCall("statvfs", 1);
    EXPECT_EQ(Find(1), TALO_UPLOAD_FALLBACK_DIR);
    EXPECT_TRUE(Errors().empty());
}

TEST_F(UploadFolder, IsNoneWhenTheRootFileSystemDoesNotAnswerEither) {
    SetFree("/", kGiB);
    fake::Now().FailCall("statvfs", 2);
    EXPECT_EQ(Find(1), "");
    EXPECT_EQ(Errors(), std::vector<int>{kNoSpace});
    EXPECT_TRUE(fake::Now().foldersMade.empty());
}

TEST_F(UploadFolder, OfFourGibibytesIsNeitherTmpNorOnTheRootFileSystem) {
    SetFree("/tmp", UINT32_MAX);
    SetFree("/", UINT32_MAX);
    EXPECT_EQ(Find(UINT32_MAX), "/tmp");
    EXPECT_TRUE(Errors().empty());
    for (const unsigned long long needed :
         {4 * kGiB, 4 * kGiB + 1, 8 * kGiB, 8 * kGiB + 1, 1ULL << 63, kMost}) {
        fake::Now().errors.clear();
        EXPECT_EQ(Find(needed), "") << needed;
        const std::vector<int> errors = {kNoSpace, kNoSpace};
        EXPECT_EQ(Errors(), errors) << needed;
    }
}

TEST_F(UploadFolder, OnTheRootFileSystemEndsWhereTheReserveReachesFourGibibytes) {
    SetFree("/", UINT32_MAX);
    EXPECT_EQ(Find(UINT32_MAX - 200 * kMiB), TALO_UPLOAD_FALLBACK_DIR);
    EXPECT_EQ(Find(UINT32_MAX - 200 * kMiB + 1), "");
    EXPECT_EQ(Find(UINT32_MAX), "");
}

// The sum of the size and the reserve would be small again.
TEST_F(UploadFolder, DoesNotCountPastTheLargestNumber) {
    SetFree("/", UINT32_MAX);
    for (const unsigned long long below :
         {0ULL, 1ULL, 5 * kMiB, 200 * kMiB - 1, 200 * kMiB, 200 * kMiB + 1}) {
        EXPECT_EQ(Find(kMost - below), "") << below;
    }
    EXPECT_TRUE(fake::Now().foldersMade.empty());
}

struct Product {
    const char* name;
    unsigned long long blocks;
    unsigned long size;
    unsigned long long bytes;  // what counts as free
};

// Required: the product is one of 32 bits.
const Product kProducts[] = {
    {"Nothing", 0, 4096, 0},
    {"Small", 3, 4096, 12288},
    {"LastThatFits", (1 << 20) - 1, 4096, UINT32_MAX - 4095},
    {"JustWrapped", 1 << 20, 4096, 0},
    {"WrappedWithRest", (1 << 20) + 5, 4096, 20480},
    {"WrappedTwice", (2 << 20) + 7, 4096, 28672},
    {"ManyBlocks", (1ULL << 32) + 3, 4096, 12288},
    {"OneByteBlocks", 1ULL << 32, 1, 0},
    {"LargeFragments", 5, 1UL << 31, 1UL << 31},
    {"HugeFragments", 1, (1UL << 32) + 512, 512},
    {"Everything", UINT64_MAX, 4096, UINT32_MAX - 4095},
};

class UploadFolderProduct : public UploadFolder, public ::testing::WithParamInterface<Product> {};

TEST_P(UploadFolderProduct, IsThatOf32BitsForTmp) {
    SetBlocks("/tmp", GetParam().blocks, GetParam().size);
    EXPECT_EQ(Find(GetParam().bytes), "/tmp");
    EXPECT_EQ(Find(GetParam().bytes + 1), "");
}

TEST_P(UploadFolderProduct, IsThatOf32BitsForTheRootFileSystem) {
    SetBlocks("/", GetParam().blocks, GetParam().size);
    constexpr unsigned long long kReserve = 200 * kMiB;
    // "/tmp" is full, but takes what needs nothing.
    if (GetParam().bytes > kReserve) {
        EXPECT_EQ(Find(GetParam().bytes - kReserve), TALO_UPLOAD_FALLBACK_DIR);
        EXPECT_EQ(Find(GetParam().bytes - kReserve + 1), "");
    } else {
        EXPECT_EQ(Find(1), "");
    }
}

INSTANTIATE_TEST_SUITE_P(Products, UploadFolderProduct, ::testing::ValuesIn(kProducts),
                         [](const auto& info) { return std::string(info.param.name); });

TEST_F(UploadFolder, ReserveOfEveryUploadIsFiveMebibytes) {
    EXPECT_EQ(TALO::kUploadReserve, 0x500000u);
}

// The stand-in must not hide the machine from everything else.
TEST_F(UploadFolder, IsLookedForOnTheTrueMachineWhereNothingIsScripted) {
    struct statvfs facts = {};
    ASSERT_EQ(statvfs("/proc/self", &facts), 0);
    EXPECT_GT(facts.f_bsize, 0u);
    EXPECT_EQ(statvfs("/no such place", &facts), -1);
}

}  // namespace
