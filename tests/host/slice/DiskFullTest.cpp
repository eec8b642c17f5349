#include <sched.h>
#include <sys/mount.h>
#include <unistd.h>

#include <filesystem>
#include <functional>

#include "tests/host/slice/SliceFixture.h"
#include "tests/support/Child.h"

namespace fs = std::filesystem;
using talo::SliceResult;

namespace {

// A disk of one MiB, in a child's own view of the file system.
class DiskFull : public SliceTest {
  protected:
    void OnASmallDisk(const std::function<void()>& body) {
        const support::ChildResult result = support::InChild([&] {
            Mount();
            if (!HasFailure()) {
                body();
            }
            return 0;
        });
        EXPECT_EQ(result.status, 0) << result.output;
    }

    std::string Disk() const {
        return fs::path(FolderPath()).parent_path();
    }

    // Fills it until that many bytes are free.
    void FillUpTo(size_t bytes) const {
        const fs::space_info space = fs::space(Disk());
        ASSERT_GT(space.available, bytes);
        Write(Disk() + "/filler", std::string(space.available - bytes, 'x'));
        ASSERT_LE(fs::space(Disk()).available, bytes);
    }

  private:
    void Mount() const {
        const int uid = static_cast<int>(getuid());
        ASSERT_EQ(unshare(uid == 0 ? CLONE_NEWNS : CLONE_NEWNS | CLONE_NEWUSER), 0);
        if (uid != 0) {
            Write("/proc/self/uid_map", "0 " + std::to_string(uid) + " 1");
        }
        ASSERT_EQ(mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr), 0);
        fs::create_directories(Disk());
        ASSERT_EQ(mount("none", Disk().c_str(), "tmpfs", 0, "size=1m,mode=0700"), 0);
    }
};

TEST_F(DiskFull, InTheMiddleOfASliceKeepsWhatFoundRoom) {
    OnASmallDisk([&] {
        const std::string content = Content(600000);
        const std::string id = Begin(content.size());
        ASSERT_EQ(Send(id, 0, content.substr(0, 1000)), SliceResult::kDone);
        FillUpTo(100000);
        EXPECT_EQ(Send(id, 1000, content.substr(1000)), SliceResult::kNoSpace);
        const size_t offset = static_cast<size_t>(OffsetOf(id));
        ASSERT_GT(offset, 1000);
        ASSERT_LT(offset, 200000);
        EXPECT_TRUE(Read(DataPathOf(id)) == content.substr(0, offset));
        EXPECT_EQ(Send(id, offset, content.substr(offset)), SliceResult::kNoSpace);
        EXPECT_EQ(OffsetOf(id), offset);
        fs::remove(Disk() + "/filler");
        EXPECT_EQ(Send(id, offset, content.substr(offset)), SliceResult::kDone);
        EXPECT_TRUE(Read(DataPathOf(id)) == content);
    });
}

TEST_F(DiskFull, RefusesANewUploadAndLeavesNothing) {
    OnASmallDisk([&] {
        (void)Begin(1);
        FillUpTo(0);
        const std::vector<std::string> before = Names();
        EXPECT_EQ(Create("mia", 1), SliceResult::kNoSpace);
        EXPECT_EQ(Create("mia", 0), SliceResult::kNoSpace);
        EXPECT_EQ(Names(), before);
    });
}

TEST_F(DiskFull, RefusesANewUploadThatIsLargerThanTheRoom) {
    OnASmallDisk([&] {
        EXPECT_EQ(Create("mia", 2000000), SliceResult::kNoSpace);
        EXPECT_EQ(Create("mia", 900000), SliceResult::kDone);
    });
}

TEST_F(DiskFull, DoesNotKeepAnUploadFromBeingComplete) {
    OnASmallDisk([&] {
        const std::string id = Begin(3);
        ASSERT_EQ(Send(id, 0, "abc"), SliceResult::kDone);
        FillUpTo(0);
        talo::SliceUpload upload;
        ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
        fs::rename(upload.DataPath(), Disk() + "/taken");
        EXPECT_TRUE(upload.Complete());
        EXPECT_EQ(OffsetOf(id), 3);
        EXPECT_EQ(Read(Disk() + "/taken"), "abc");
    });
}

}  // namespace
