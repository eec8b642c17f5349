#include <sys/statvfs.h>

#include <filesystem>
#include <limits>
#include <string>

#include "tests/host/upload/PrivateMounts.h"
#include "tests/host/upload/UploadFixture.h"
#include "tests/support/Child.h"

namespace {

struct Answer {
    int result;
    int status;
    std::string path;
    unsigned long long bytes;
};

class Volumes : public UploadTest {
  protected:
    void SetUp() override {
        for (const char* name : {"small", "large", "plain", "locked"}) {
            std::filesystem::create_directory(PathOf(name));
        }
    }
    std::string PathOf(const std::string& name) const {
        return Dir() + "/" + name;
    }
    static Answer Ask(unsigned long long size) {
        TALOVOLUME volume = {"untouched", 7};
        int status = -1;
        const int result = VolumeAvailGet(size, &volume, &status, 1);
        return {result, status, volume.mountPath, volume.freeBytes};
    }
    static void ExpectNone(const Answer& answer, int result, int status) {
        EXPECT_EQ(answer.result, result);
        EXPECT_EQ(answer.status, status);
        EXPECT_EQ(answer.path, "untouched");
        EXPECT_EQ(answer.bytes, 7u);
    }
};

TEST_F(Volumes, AreNoneUnlessConfigured) {
    ExpectNone(Ask(0), -1, TALO_VOLUME_NONE);
    for (const std::string& list :
         {std::string("relative"), PathOf("absent"), std::string("/etc/passwd"),
          std::string(" , ,"), "/" + std::string(300, 'x'), PathOf("plain")}) {
        Configure("volumes=\"" + list + "\"\n");
        ExpectNone(Ask(0), -1, TALO_VOLUME_NONE);
    }
}

TEST_F(Volumes, MayBePlainFoldersWhereTheConfigurationSaysSo) {
    Configure("volumes=\"" + PathOf("absent") + ", " + PathOf("plain") +
              "// \"\nvolumes_folders=\"yes\"\n");
    const Answer answer = Ask(1);
    EXPECT_EQ(answer.result, 1);
    EXPECT_EQ(answer.status, 0);
    EXPECT_EQ(answer.path, PathOf("plain"));
    struct statvfs facts = {};
    ASSERT_EQ(statvfs(PathOf("plain").c_str(), &facts), 0);
    // Others write to this disk, too.
    EXPECT_NEAR(static_cast<double>(answer.bytes),
                static_cast<double>(facts.f_bavail) * static_cast<double>(facts.f_frsize), 2e9);
    ExpectNone(Ask(std::numeric_limits<unsigned long long>::max()), 0, TALO_VOLUME_FULL);
}

TEST_F(Volumes, AreChosenByFreeSpace) {
    const auto choose = [&] {
        EXPECT_TRUE(EnterPrivateMounts());
        MountMemory(PathOf("small"), "1m");
        MountMemory(PathOf("large"), "2m");
        MountMemory(PathOf("locked"), "8m", MS_RDONLY);
        Configure("volumes=\"" + PathOf("small") + "," + PathOf("large") + "/," + PathOf("locked") +
                  "," + PathOf("plain") + "\"\n");
        const Answer answer = Ask(1);
        EXPECT_EQ(answer.result, 1);
        EXPECT_EQ(answer.path, PathOf("large"));
        EXPECT_EQ(answer.bytes, 2u << 20);
        EXPECT_EQ(Ask(2u << 20).result, 1);
        ExpectNone(Ask((2u << 20) + 1), 0, TALO_VOLUME_FULL);
        Configure("volumes=\"" + PathOf("locked") + "\"\n");
        ExpectNone(Ask(0), 0, TALO_VOLUME_FULL);
        return 0;
    };
    EXPECT_EQ(support::InChild(choose).status, 0);
}

TEST_F(Volumes, NeedNoStatusButARecord) {
    Configure("volumes=\"" + PathOf("plain") + "\"\nvolumes_folders=\"yes\"\n");
    TALOVOLUME volume = {};
    EXPECT_EQ(VolumeAvailGet(0, &volume, nullptr, 1), 1);
    EXPECT_LT(VolumeAvailGet(0, nullptr, nullptr, 1), 0);
}

}  // namespace
