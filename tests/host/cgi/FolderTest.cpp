#include <errno.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <string>

#include "platform/System.h"
#include "tests/host/cgi/SessionFixture.h"

namespace {

class Folder : public SessionTest {
  protected:
    Folder() : umask_(umask(022)) {}
    ~Folder() override {
        (void)umask(umask_);
    }

    int Make(const std::string& name, mode_t mode = 0700, int parents = 1, int uid = -1,
             int gid = -1) {
        errno = 0;
        return TALOFSMkdirP(PathOf(name).c_str(), 0, parents, uid, gid, mode);
    }

    // The mode of a folder, -1 for what is none.
    int Mode(const std::string& name) {
        struct stat facts = {};
        return stat(PathOf(name).c_str(), &facts) == 0 && S_ISDIR(facts.st_mode)
                   ? static_cast<int>(facts.st_mode & 07777)
                   : -1;
    }

  private:
    const mode_t umask_;
};

TEST_F(Folder, IsMadeWithTheModeWhateverTheUmask) {
    for (const mode_t mode : {mode_t(0700), mode_t(0755), mode_t(0777), mode_t(01777)}) {
        const std::string name = "mode" + std::to_string(mode);
        EXPECT_EQ(Make(name, mode), 0);
        EXPECT_EQ(Mode(name), static_cast<int>(mode));
    }
}

TEST_F(Folder, IsMadeWithItsParents) {
    EXPECT_EQ(Make("a/b/c", 0700), 0);
    EXPECT_EQ(Mode("a/b/c"), 0700);
    EXPECT_EQ(Mode("a/b"), 0755);
    EXPECT_EQ(Mode("a"), 0755);
}

TEST_F(Folder, IsTheSameWithSlashesInExcess) {
    EXPECT_EQ(Make("a/b/", 0700), 0);
    EXPECT_EQ(Mode("a/b"), 0700);
    EXPECT_EQ(Make("c//d///", 0700), 0);
    EXPECT_EQ(Mode("c/d"), 0700);
    EXPECT_EQ(Mode("c"), 0755);
}

TEST_F(Folder, IsMadeWithoutParentsOnlyWhereTheyAre) {
    EXPECT_LT(Make("a/b", 0700, 0), 0);
    EXPECT_EQ(errno, ENOENT);
    EXPECT_EQ(Mode("a"), -1);
    EXPECT_EQ(Make("a", 0700, 0), 0);
    EXPECT_EQ(Make("a/b", 0700, 0), 0);
}

TEST_F(Folder, ThatIsThereIsLeftAsItIs) {
    EXPECT_EQ(Make("a", 0750), 0);
    EXPECT_EQ(Make("a", 0700), 0);
    EXPECT_EQ(Mode("a"), 0750);
    EXPECT_EQ(TALOFSMkdirP("/", 0, 1, -1, -1, 0700), 0);
}

TEST_F(Folder, CannotBeWhereAFileIs) {
    Write("file", "");
    EXPECT_LT(Make("file"), 0);
    EXPECT_LT(Make("file/below"), 0);
    EXPECT_EQ(errno, ENOTDIR);
    EXPECT_LT(TALOFSMkdirP("", 0, 1, -1, -1, 0700), 0);
    EXPECT_LT(TALOFSMkdirP(nullptr, 0, 1, -1, -1, 0700), 0);
}

TEST_F(Folder, IsGivenAwayWhenThatIsAsked) {
    const int uid = static_cast<int>(geteuid());
    const int gid = static_cast<int>(getegid());
    EXPECT_EQ(Make("own", 0700, 1, uid, gid), 0);
    if (geteuid() == 0) {
        EXPECT_EQ(Make("given/away", 0700, 1, 12345, 54321), 0);
        struct stat facts = {};
        ASSERT_EQ(stat(PathOf("given/away").c_str(), &facts), 0);
        EXPECT_EQ(facts.st_uid, 12345u);
        EXPECT_EQ(facts.st_gid, 54321u);
        ASSERT_EQ(stat(PathOf("given").c_str(), &facts), 0);
        EXPECT_EQ(facts.st_uid, geteuid());
    }
}

TEST_F(Folder, HasTimesThatCanBeSet) {
    Write("file", "content");
    const std::string path = PathOf("file");
    struct stat facts = {};
    EXPECT_GE(TLIBCFileUTime(path.c_str(), 0, 1000000000), 0);
    ASSERT_EQ(stat(path.c_str(), &facts), 0);
    EXPECT_EQ(facts.st_mtime, 1000000000);
    EXPECT_EQ(facts.st_atime, 1000000000);
    EXPECT_EQ(facts.st_mtim.tv_nsec, 0);
    const time_t before = time(nullptr);
    EXPECT_GE(TLIBCFileUTime(path.c_str(), 1, 5), 0);
    ASSERT_EQ(stat(path.c_str(), &facts), 0);
    EXPECT_GE(facts.st_mtime, before - 1);
    EXPECT_LE(facts.st_mtime, time(nullptr) + 1);
    EXPECT_EQ(Read("file"), "content");
}

TEST_F(Folder, HasNoTimesOfWhatIsMissing) {
    EXPECT_LT(TLIBCFileUTime(PathOf("missing").c_str(), 1, 0), 0);
    EXPECT_LT(TLIBCFileUTime("", 1, 0), 0);
    EXPECT_LT(TLIBCFileUTime(nullptr, 1, 0), 0);
    EXPECT_TRUE(Names().empty());
}

}  // namespace
