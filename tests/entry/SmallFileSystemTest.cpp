#include <gtest/gtest.h>
#include <sched.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <fstream>
#include <string>

#include "platform/Paths.h"
#include "src/entry/UploadFolder.h"
#include "tests/fake/FakePlatform.h"
#include "tests/support/Child.h"
#include "tests/support/TempFolder.h"

namespace {

constexpr unsigned long long kMiB = 1ULL << 20;

void Mount(const std::string& place, unsigned long long bytes) {
    const std::string options = "size=" + std::to_string(bytes) + ",mode=777";
    ASSERT_EQ(mount("none", place.c_str(), "tmpfs", 0, options.c_str()), 0) << place;
}

unsigned long long Free(const char* path) {
    struct statvfs facts = {};
    EXPECT_EQ(statvfs(path, &facts), 0);
    return static_cast<unsigned long long>(facts.f_bfree) * facts.f_frsize;
}

// A world of two small file systems, "/" and "/tmp", that only this process sees.
void Enter(const std::string& folder, unsigned long long root, unsigned long long tmp) {
    const int uid = static_cast<int>(getuid());
    ASSERT_EQ(unshare(uid == 0 ? CLONE_NEWNS : CLONE_NEWNS | CLONE_NEWUSER), 0);
    if (uid != 0) {
        std::ofstream("/proc/self/uid_map") << "0 " << uid << " 1";
    }
    ASSERT_EQ(mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr), 0);
    ASSERT_NO_FATAL_FAILURE(Mount(folder, root));
    ASSERT_EQ(mkdir((folder + "/tmp").c_str(), 0777), 0);
    ASSERT_NO_FATAL_FAILURE(Mount(folder + "/tmp", tmp));
    ASSERT_EQ(chroot(folder.c_str()), 0);
    ASSERT_EQ(chdir("/"), 0);
}

std::string Find(unsigned long long needed) {
    std::string dir;
    return TALO::FindUploadTmpDir(&dir, needed) ? dir : std::string();
}

void InSmallWorld(unsigned long long root, unsigned long long tmp, void (*body)()) {
    const support::TempFolder folder;
    const std::string top = folder.Path("top");
    ASSERT_EQ(mkdir(top.c_str(), 0777), 0);
    const support::ChildResult child = support::InChild([&] {
        fake::Reset();
        Enter(top, root, tmp);
        if (!::testing::Test::HasFailure()) {
            body();
        }
        return 0;
    });
    EXPECT_EQ(child.status, 0) << child.output;
}

TEST(SmallFileSystem, TakesInTmpWhatJustFits) {
    InSmallWorld(512 * kMiB, 24 * kMiB, [] {
        const unsigned long long room = Free("/tmp");
        EXPECT_EQ(Find(room), "/tmp");
        EXPECT_EQ(Find(room + 1), TALO_UPLOAD_FALLBACK_DIR);
    });
}

TEST(SmallFileSystem, CountsWhatOthersHaveWrittenToTmp) {
    InSmallWorld(512 * kMiB, 24 * kMiB, [] {
        const unsigned long long room = Free("/tmp");
        std::ofstream("/tmp/other") << std::string(4 * kMiB, 'x');
        EXPECT_EQ(Find(room), TALO_UPLOAD_FALLBACK_DIR);
        EXPECT_EQ(Find(room - 4 * kMiB), "/tmp");
    });
}

TEST(SmallFileSystem, KeepsTwoHundredMebibytesOfTheRootFree) {
    InSmallWorld(256 * kMiB, kMiB, [] {
        const unsigned long long room = Free("/") - 200 * kMiB;
        EXPECT_EQ(Find(room), TALO_UPLOAD_FALLBACK_DIR);
        EXPECT_EQ(Find(room + 1), "");
    });
}

}  // namespace
