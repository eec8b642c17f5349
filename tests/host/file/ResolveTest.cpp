#include <errno.h>
#include <fcntl.h>
#include <linux/audit.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <stddef.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include "PlaceFixture.h"
#include "tests/support/Child.h"

using talo::FileError;

namespace {

class Resolve : public BothResolvers {
  public:
    FileError Open(const std::string& path) const {
        talo::Place place;
        At(path, &place);
        int file = -1;
        const FileError result = place.OpenFile(&file);
        if (file >= 0) {
            (void)close(file);
        }
        return result;
    }
};

TEST_P(Resolve, ReadsAFile) {
    Write("a/b/c", "content");
    EXPECT_EQ("content", Read("a/b/c"));
}

TEST_P(Resolve, TellsWhatIsMissing) {
    Write("file", "x");
    MakeFolders("folder");
    EXPECT_EQ(FileError::kNotFound, Open("none"));
    EXPECT_EQ(FileError::kNotFound, Open("none/a"));
    EXPECT_EQ(FileError::kNotFolder, Open("file/a"));
    EXPECT_EQ(FileError::kNotFile, Open("folder"));
    EXPECT_EQ(FileError::kNotFile, Open(""));
}

TEST_P(Resolve, DoesNotHangAtAPipe) {
    ASSERT_EQ(0, mkfifo(InShare("pipe").c_str(), 0600));
    EXPECT_EQ(FileError::kNotFile, Open("pipe"));
}

TEST_P(Resolve, LeavesTheShareByNoLink) {
    const struct {
        const char* name;
        std::string target;
        const char* path;
    } rows[] = {
        {"absolute to a file", Outside("secret"), "link"},
        {"absolute to a folder", Outside(""), "link/secret"},
        {"relative to a file", "../outside/secret", "link"},
        {"relative to a folder", "../outside", "link/secret"},
        {"absolute into the share", InShare("inside"), "link"},
        {"to the root", "/", "link/etc/passwd"},
        {"to a process's root", "/proc/self/root", "link/etc/passwd"},
        {"to a process's folder", "/proc/self/cwd", "link"},
        {"out and in again", "../share/inside", "link"},
        {"to itself", "link", "link"},
    };
    Write("inside", "x");
    for (const auto& row : rows) {
        Link("link", row.target);
        EXPECT_EQ(FileError::kLink, Open(row.path)) << row.name;
        ASSERT_EQ(0, unlink(InShare("link").c_str()));
    }
    ExpectOutsideUntouched();
}

// Without the kernel's help no link is followed at all.
TEST_P(Resolve, FollowsALinkThatStaysInTheShare) {
    Write("folder/file", "content");
    Link("link", "folder");
    Link("folder/up", "../folder/file");
    EXPECT_EQ(Walks() ? FileError::kLink : FileError::kNone, Open("link/file"));
    EXPECT_EQ(Walks() ? FileError::kLink : FileError::kNone, Open("folder/up"));
}

TEST_P(Resolve, DescriptorsAreCloseOnExec) {
    Write("file", "x");
    talo::Place file;
    talo::Place folder;
    At("file", &file);
    At("", &folder);
    int opened[2] = {-1, -1};
    ASSERT_EQ(FileError::kNone, file.OpenFile(&opened[0]));
    ASSERT_EQ(FileError::kNone, folder.OpenFolder(&opened[1]));
    for (const int descriptor : opened) {
        EXPECT_EQ(FD_CLOEXEC, fcntl(descriptor, F_GETFD));
        (void)close(descriptor);
    }
}

TEST_P(Resolve, ChangesNothingThroughALink) {
    Link("out", Outside(""));
    talo::Place place;
    talo::Place other;
    Write("file", "x");
    At("out/new", &place);
    At("file", &other);
    EXPECT_EQ(FileError::kLink, place.MakeFolder());
    EXPECT_EQ(FileError::kLink, other.Rename(place, true));
    At("out/secret", &place);
    EXPECT_EQ(FileError::kLink, place.Remove());
    EXPECT_EQ(FileError::kLink, place.Rename(other, true));
    EXPECT_EQ(FileError::kLink, place.TakeIn(InShare("file"), true, -1));
    EXPECT_EQ("x", ContentOf(InShare("file")));
    ExpectOutsideUntouched();
}

INSTANTIATE_TEST_SUITE_P(Kernel, Resolve, ::testing::Values(false));
INSTANTIATE_TEST_SUITE_P(Walk, Resolve, ::testing::Values(true));

// From now on the kernel answers openat2 with an error.
bool RefuseOpenat2(unsigned error) {
    struct sock_filter filter[] = {
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(struct seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_openat2, 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | error),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    };
    struct sock_fprog program = {sizeof filter / sizeof *filter, filter};
    return prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 &&
           prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) == 0;
}

class OldKernel : public PlaceFixture {};

TEST_F(OldKernel, IsWalkedOn) {
    Write("a/b", "content");
    Link("link", "a");
    for (const int error : {ENOSYS, EPERM}) {
        const support::ChildResult child = support::InChild([&] {
            EXPECT_TRUE(RefuseOpenat2(static_cast<unsigned>(error)));
            EXPECT_EQ("content", Read("a/b"));
            EXPECT_EQ("error " + std::to_string(static_cast<int>(FileError::kLink)),
                      Read("link/b"));
            return 0;
        });
        EXPECT_EQ(0, child.status) << error;
    }
}

}  // namespace
