#include <signal.h>
#include <sys/resource.h>

#include <string>

#include "tests/host/upload/PrivateMounts.h"
#include "tests/host/upload/UploadFixture.h"

namespace {

class DiskFull : public UploadTest {
  protected:
    static std::string TwoFiles(size_t first, size_t second) {
        return Body()
            .Field("a", "1")
            .File("f", "one", std::string(first, '1'))
            .File("g", "two", std::string(second, '2'))
            .Whole();
    }
};

TEST_F(DiskFull, LeavesNothingBehind) {
    Serve(TwoFiles(300000, 900000), [&] {
        ASSERT_TRUE(EnterPrivateMounts());
        MountMemory(Dir(), "1m");
        TLIBCErrSet(0);
        const All all = LoadAll(Dir());
        EXPECT_EQ(all.result, TALO_UPLOAD_STORE);
        EXPECT_EQ(TLIBCErrGet(), 10496);
        EXPECT_TRUE(all.params.empty() && all.files.empty());
        EXPECT_TRUE(Left().empty());
    });
    Serve(TwoFiles(300000, 600000), [&] {
        ASSERT_TRUE(EnterPrivateMounts());
        MountMemory(Dir(), "1m");
        EXPECT_EQ(LoadAll(Dir()).result, TALO_UPLOAD_OK);
        EXPECT_EQ(Left().size(), 2u);
    });
}

TEST_F(DiskFull, LeavesTheFilesThatWereHandedOut) {
    Serve(TwoFiles(300000, 900000), [&] {
        ASSERT_TRUE(EnterPrivateMounts());
        MountMemory(Dir(), "1m");
        PartReader reader;
        EXPECT_EQ(reader.Params(), 1);
        EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_OK);
        EXPECT_EQ(reader.Params(), 0);
        const Texts before = reader.Hash();
        EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_STORE);
        EXPECT_EQ(reader.upload.status, TALO_UPLOAD_STORE);
        EXPECT_EQ(reader.Hash(), before);
        EXPECT_EQ(Left().size(), 1u);
        EXPECT_TRUE(Content(before.at("f")) == std::string(300000, '1'));
    });
}

TEST_F(DiskFull, IsAnyLimitThatAWriteMeets) {
    Serve(TwoFiles(1000, 200000), [&] {
        (void)signal(SIGXFSZ, SIG_IGN);
        const struct rlimit limit = {100000, 100000};
        ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &limit), 0);
        EXPECT_EQ(LoadAll(Dir()).result, TALO_UPLOAD_STORE);
    });
    EXPECT_TRUE(Left().empty());
}

TEST_F(DiskFull, IsNotMetByABodyWithoutFiles) {
    Serve(Body().Field("a", std::string(100000, 'x')).Whole(), [&] {
        ASSERT_TRUE(EnterPrivateMounts());
        MountMemory(Dir(), "4k");
        EXPECT_EQ(LoadAll(Dir()).result, TALO_UPLOAD_OK);
    });
}

}  // namespace
