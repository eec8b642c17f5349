#include "hosts/linux/slice/Sweep.h"

#include <unistd.h>

#include <filesystem>

#include "tests/host/slice/SliceFixture.h"

namespace fs = std::filesystem;
using talo::SliceResult;

namespace {

constexpr long long kDay = 86400;
constexpr long long kMargin = 100;

class Sweep : public SliceTest {
  protected:
    void SweepNow() {
        MakeSweepDue();
        talo::SweepSliceUploads();
    }
};

TEST(SliceExpiry, ComesWhenTheTimeIsOver) {
    EXPECT_FALSE(host::HasExpired(1000, 10, 1000));
    EXPECT_FALSE(host::HasExpired(1000, 10, 1010));
    EXPECT_TRUE(host::HasExpired(1000, 10, 1011));
    EXPECT_FALSE(host::HasExpired(2000, 10, 1000));
    EXPECT_TRUE(host::HasExpired(-9000000000000000000, 10, 1000));
    EXPECT_FALSE(host::HasExpired(9000000000000000000, 10, 1000));
}

TEST_F(Sweep, RemovesWhatHasGoneUnusedForTwoDays) {
    const std::string old = Begin(10);
    const std::string young = Begin(10);
    ASSERT_EQ(Send(old, 0, "abc"), SliceResult::kDone);
    LeaveUnused(old, 2 * kDay + kMargin);
    LeaveUnused(young, 2 * kDay - kMargin);
    SweepNow();
    EXPECT_EQ(Names(), (std::vector<std::string>{young, young + ".data"}));
    EXPECT_TRUE(Exists(young));
}

TEST_F(Sweep, KeepsForAsLongAsItIsConfigured) {
    Configure("slice_keep=1000\n");
    const std::string old = Begin(10);
    const std::string young = Begin(10);
    LeaveUnused(old, 1000 + kMargin);
    LeaveUnused(young, 1000 - kMargin);
    SweepNow();
    EXPECT_EQ(Names(), (std::vector<std::string>{young, young + ".data"}));
}

TEST_F(Sweep, CountsTheLaterUseOfRecordAndData) {
    const std::string byRecord = Begin(10);
    const std::string byData = Begin(10);
    Age(DataPathOf(byRecord), 5 * kDay);
    Age(PathOf(byData), 5 * kDay);
    SweepNow();
    EXPECT_TRUE(Exists(byRecord));
    EXPECT_TRUE(Exists(byData));
}

TEST_F(Sweep, TakesAUseInTheFutureForOneNow) {
    const std::string id = Begin(10);
    LeaveUnused(id, -5 * kDay);
    SweepNow();
    EXPECT_EQ(Send(id, 0, "abc"), SliceResult::kDone);
}

TEST_F(Sweep, IsAnsweredLikeAnUploadThatHasExpired) {
    const std::string id = Begin(10);
    LeaveUnused(id, 2 * kDay + kMargin);
    EXPECT_FALSE(Exists(id));
    EXPECT_EQ(Send(id, 0, "abc"), SliceResult::kNotFound);
}

TEST_F(Sweep, IsPutOffByEverySlice) {
    const std::string id = Begin(10);
    LeaveUnused(id, 2 * kDay - kMargin);
    EXPECT_EQ(Send(id, 5, "abc"), SliceResult::kWrongOffset);
    Age(DataPathOf(id), 5 * kDay);
    SweepNow();
    EXPECT_TRUE(Exists(id));
    LeaveUnused(id, 2 * kDay - kMargin);
    EXPECT_EQ(Send(id, 0, "abc"), SliceResult::kDone);
    Age(PathOf(id), 5 * kDay);
    SweepNow();
    EXPECT_TRUE(Exists(id));
}

TEST_F(Sweep, ForgetsWhatWasComplete) {
    const std::string id = Begin(0);
    {
        talo::SliceUpload upload;
        ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
        ASSERT_TRUE(upload.Complete());
    }
    Age(PathOf(id + ".done"), 2 * kDay - kMargin);
    SweepNow();
    EXPECT_TRUE(Exists(id));
    Age(PathOf(id + ".done"), 2 * kDay + kMargin);
    EXPECT_FALSE(Exists(id));
    SweepNow();
    EXPECT_TRUE(Names().empty());
}

TEST_F(Sweep, RemovesWhatADyingProcessLeft) {
    (void)Begin(1);
    const std::string id = UnusedSliceId();
    const std::string younger = "u" + std::string(40, '1');
    Write(DataPathOf(id), "data without a record");
    Write(DataPathOf(younger), "data whose record is being written");
    Write(PathOf(id + ".a1b2c3"), "a record that was being written");
    Write(PathOf(younger + ".a1b2c3"), "a record that is being written");
    Age(DataPathOf(id), 3600 + kMargin);
    Age(PathOf(id + ".a1b2c3"), 3600 + kMargin);
    Age(DataPathOf(younger), 3600 - kMargin);
    Age(PathOf(younger + ".a1b2c3"), 3600 - kMargin);
    SweepNow();
    EXPECT_FALSE(fs::exists(DataPathOf(id)));
    EXPECT_FALSE(fs::exists(PathOf(id + ".a1b2c3")));
    EXPECT_TRUE(fs::exists(DataPathOf(younger)));
    EXPECT_TRUE(fs::exists(PathOf(younger + ".a1b2c3")));
}

TEST_F(Sweep, LeavesAloneWhatIsNotOurs) {
    (void)Begin(1);
    for (const std::string name : {"notes.txt", "u123", "u123.data", ".hidden"}) {
        Write(PathOf(name), "somebody's");
        Age(PathOf(name), 100 * kDay);
    }
    SweepNow();
    EXPECT_EQ(Names().size(), 6u);
}

TEST_F(Sweep, RemovesALinkAndNotWhatItLeadsTo) {
    (void)Begin(1);
    const std::string victim = FolderPath() + "/../victim";
    Write(victim, "precious");
    const std::string id = UnusedSliceId();
    fs::create_symlink(victim, PathOf(id));
    fs::create_symlink(victim, DataPathOf(id));
    Age(PathOf(id), 5 * kDay);
    Age(DataPathOf(id), 5 * kDay);
    Age(victim, 5 * kDay);
    SweepNow();
    EXPECT_EQ(Names().size(), 2u);
    EXPECT_EQ(Read(victim), "precious");
}

TEST_F(Sweep, HappensOnceAnHourForAllOwners) {
    std::string toms;
    ASSERT_EQ(Create("tom", 1, &toms), SliceResult::kDone);
    const std::string record = FolderPath() + "/../746f6d/" + toms;
    const std::string mine = Begin(1);
    Age(record, 5 * kDay);
    Age(record + ".data", 5 * kDay);
    // The last sweep is too young, whoever comes.
    EXPECT_EQ(Send(mine, 0, ""), SliceResult::kDone);
    EXPECT_EQ(Create("mia", 1), SliceResult::kDone);
    talo::SweepSliceUploads();
    EXPECT_TRUE(fs::exists(record));
    MakeSweepDue();
    EXPECT_EQ(Send(mine, 0, ""), SliceResult::kDone);
    EXPECT_FALSE(fs::exists(record));
    EXPECT_FALSE(fs::exists(record + ".data"));
    // And now it is young again.
    ASSERT_EQ(Create("tom", 1, &toms), SliceResult::kDone);
    const std::string next = FolderPath() + "/../746f6d/" + toms;
    Age(next, 5 * kDay);
    Age(next + ".data", 5 * kDay);
    talo::SweepSliceUploads();
    EXPECT_TRUE(fs::exists(next));
}

TEST_F(Sweep, DoesNotWaitForAClockThatWasSetBack) {
    (void)Begin(1);
    std::string toms;
    ASSERT_EQ(Create("tom", 1, &toms), SliceResult::kDone);
    const std::string record = FolderPath() + "/../746f6d/" + toms;
    Age(record, 5 * kDay);
    Age(record + ".data", 5 * kDay);
    Age(FolderPath() + "/../.swept", -365 * kDay);
    talo::SweepSliceUploads();
    EXPECT_FALSE(fs::exists(record));
}

TEST_F(Sweep, DoesNothingWhereThereIsNothing) {
    const size_t before = OpenDescriptors();
    talo::SweepSliceUploads();
    EXPECT_FALSE(fs::exists(FolderPath()));
    EXPECT_EQ(OpenDescriptors(), before);
}

}  // namespace
