#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <functional>

#include "tests/host/slice/SliceFixture.h"

namespace fs = std::filesystem;
using talo::SliceResult;

namespace {

class HostileFolder : public SliceTest {
  protected:
    // An upload with "abc" of 10 bytes, which `spoil` then spoils: it must not be
    // found any more, nothing may be read for it or written anywhere.
    void Spoilt(const char* name, const std::function<void(const std::string&)>& spoil) {
        const std::string id = Begin(10);
        ASSERT_EQ(Send(id, 0, "abc"), SliceResult::kDone) << name;
        spoil(id);
        const size_t before = OpenDescriptors();
        EXPECT_FALSE(Exists(id)) << name;
        {
            const Input input("defghij");
            talo::SliceUpload upload;
            EXPECT_EQ(upload.Open(id, "mia"), SliceResult::kNotFound) << name;
            EXPECT_EQ(upload.Append(3, 7, ""), SliceResult::kNotFound) << name;
            EXPECT_EQ(input.Taken(), 0u) << name;
        }
        EXPECT_EQ(OpenDescriptors(), before) << name;
        // And it does not stand in the way of others.
        EXPECT_NE(Begin(1), "") << name;
        fs::remove_all(FolderPath());
    }
};

TEST_F(HostileFolder, HoldsNoUploadWithABadRecord) {
    const std::string elsewhere = FolderPath() + "-elsewhere";
    Spoilt("no record", [&](const std::string& id) { fs::remove(PathOf(id)); });
    Spoilt("an empty one", [&](const std::string& id) { Write(PathOf(id), ""); });
    Spoilt("garbage", [&](const std::string& id) { Write(PathOf(id), Content(500)); });
    Spoilt("half of it", [&](const std::string& id) {
        const std::string text = Read(PathOf(id));
        Write(PathOf(id), text.substr(0, text.size() / 2));
    });
    Spoilt("a huge one", [&](const std::string& id) {
        Write(PathOf(id), Read(PathOf(id)) + std::string(200000, ' '));
    });
    Spoilt("a huge length", [&](const std::string& id) {
        std::string text = Read(PathOf(id));
        Write(PathOf(id), text.replace(text.find(":10"), 3, ":18446744073709551617"));
    });
    Spoilt("another owner's", [&](const std::string& id) {
        std::string text = Read(PathOf(id));
        Write(PathOf(id), text.replace(text.find("mia"), 3, "tom"));
    });
    Spoilt("a link to a good one", [&](const std::string& id) {
        fs::remove(elsewhere);
        fs::rename(PathOf(id), elsewhere);
        fs::create_symlink(elsewhere, PathOf(id));
    });
    Spoilt("a link to nowhere", [&](const std::string& id) {
        fs::remove(PathOf(id));
        fs::create_symlink("/nowhere", PathOf(id));
    });
    Spoilt("a folder", [&](const std::string& id) {
        fs::remove(PathOf(id));
        fs::create_directory(PathOf(id));
    });
    Spoilt("a pipe", [&](const std::string& id) {
        fs::remove(PathOf(id));
        ASSERT_EQ(mkfifo(PathOf(id).c_str(), 0600), 0);
    });
    if (geteuid() == 0) {
        Spoilt("somebody else's file", [&](const std::string& id) {
            ASSERT_EQ(chown(PathOf(id).c_str(), 12345, 12345), 0);
        });
    }
}

TEST_F(HostileFolder, HoldsNoUploadWithBadData) {
    const std::string victim = FolderPath() + "-victim";
    Spoilt("no data", [&](const std::string& id) { fs::remove(DataPathOf(id)); });
    Spoilt("a link to a file", [&](const std::string& id) {
        Write(victim, "abc");
        fs::remove(DataPathOf(id));
        fs::create_symlink(victim, DataPathOf(id));
    });
    EXPECT_EQ(Read(victim), "abc");
    Spoilt("a folder", [&](const std::string& id) {
        fs::remove(DataPathOf(id));
        fs::create_directory(DataPathOf(id));
    });
    Spoilt("a pipe", [&](const std::string& id) {
        fs::remove(DataPathOf(id));
        ASSERT_EQ(mkfifo(DataPathOf(id).c_str(), 0600), 0);
    });
    Spoilt("a device", [&](const std::string& id) {
        fs::remove(DataPathOf(id));
        fs::create_symlink("/dev/full", DataPathOf(id));
    });
    Spoilt("more than the whole",
           [&](const std::string& id) { Write(DataPathOf(id), std::string(11, 'x')); });
    if (geteuid() == 0) {
        Spoilt("somebody else's file", [&](const std::string& id) {
            ASSERT_EQ(chown(DataPathOf(id).c_str(), 12345, 12345), 0);
        });
    }
}

TEST_F(HostileFolder, IsNotLeftByAnId) {
    const std::string outside = FolderPath() + "/../" + UnusedSliceId();
    (void)Begin(1);
    Write(outside, "{}");
    const std::string good = UnusedSliceId();
    for (const std::string& id :
         {"../" + good, "./" + good, good + "/", "/" + good, std::string(), std::string("."),
          std::string(".."), std::string("../.swept"), std::string(1 << 20, 'u'),
          good + std::string(1, '\0'), good + ".data", std::string("/etc/passwd"),
          std::string("u") + std::string(37, '0') + "/..", good.substr(0, 40) + "\n"}) {
        EXPECT_FALSE(Exists(id)) << id.substr(0, 50);
        EXPECT_EQ(Send(id, 0, "x"), SliceResult::kNotFound) << id.substr(0, 50);
    }
    EXPECT_EQ(Read(outside), "{}");
    EXPECT_EQ(Names().size(), 2u);
}

TEST_F(HostileFolder, WithoutTheFolderNothingIsFoundOrMade) {
    EXPECT_FALSE(Exists(UnusedSliceId()));
    EXPECT_EQ(Send(UnusedSliceId(), 0, "x"), SliceResult::kNotFound);
    EXPECT_FALSE(fs::exists(fs::path(FolderPath()).parent_path()));
}

TEST_F(HostileFolder, KeepsADataFileFromBeingCutByAStaleName) {
    // A file that took the place of the data, after these were opened, is not it.
    const std::string id = Begin(10);
    talo::SliceUpload upload;
    ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
    fs::remove(DataPathOf(id));
    Write(DataPathOf(id), "another");
    const Input input("abc");
    EXPECT_EQ(upload.Append(0, 3, ""), SliceResult::kDone);
    EXPECT_EQ(Read(DataPathOf(id)), "another");
}

}  // namespace
