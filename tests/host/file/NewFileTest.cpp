#include <errno.h>
#include <fcntl.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <stddef.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <filesystem>

#include "PlaceFixture.h"
#include "tests/support/Child.h"

using talo::FileError;

namespace {

namespace fs = std::filesystem;

class NewFile : public PlaceFixture {
  public:
    static bool Put(const talo::NewFile& file, const std::string& content) {
        return write(file.Descriptor(), content.data(), content.size()) ==
               static_cast<ssize_t>(content.size());
    }

    long EntriesIn(const std::string& path) const {
        return std::distance(fs::directory_iterator(InShare(path)), fs::directory_iterator());
    }

    // A file beside the share, as an upload leaves it.
    std::string Uploaded(const std::string& content) const {
        const support::TempFolder& folder = uploads_;
        return folder.Write("upload", content);
    }

    FileError TakeIn(const std::string& from, const std::string& to, bool overwrite,
                     long long mtime = -1) const {
        talo::Place place;
        At(to, &place);
        return place.TakeIn(from, overwrite, mtime);
    }

    static struct stat StatOf(const std::string& path) {
        struct stat facts = {};
        EXPECT_EQ(0, lstat(path.c_str(), &facts));
        return facts;
    }

    support::TempFolder uploads_;
};

TEST_F(NewFile, AppearsWhole) {
    talo::Place place;
    talo::NewFile file;
    At("new", &place);
    ASSERT_EQ(FileError::kNone, file.Begin(place));
    ASSERT_TRUE(Put(file, "content"));
    EXPECT_FALSE(fs::exists(InShare("new")));
    ASSERT_EQ(FileError::kNone, file.Finish(place, false, 1000000000));
    EXPECT_EQ("content", Read("new"));
    EXPECT_EQ(1000000000, StatOf(InShare("new")).st_mtim.tv_sec);
    EXPECT_EQ(S_IFREG | 0644, StatOf(InShare("new")).st_mode);
    EXPECT_EQ(1, EntriesIn(""));
}

TEST_F(NewFile, IsGoneWhenItIsNotFinished) {
    {
        talo::Place place;
        talo::NewFile file;
        At("new", &place);
        ASSERT_EQ(FileError::kNone, file.Begin(place));
        ASSERT_TRUE(Put(file, "content"));
    }
    EXPECT_EQ(0, EntriesIn(""));
}

TEST_F(NewFile, ReplacesOnlyWhenAsked) {
    Write("old", "old");
    talo::Place place;
    At("old", &place);
    for (const bool overwrite : {false, true}) {
        talo::NewFile file;
        ASSERT_EQ(FileError::kNone, file.Begin(place));
        ASSERT_TRUE(Put(file, "new"));
        EXPECT_EQ(overwrite ? FileError::kNone : FileError::kExists,
                  file.Finish(place, overwrite, -1));
        EXPECT_EQ(overwrite ? "new" : "old", Read("old"));
    }
    EXPECT_EQ(1, EntriesIn(""));
}

TEST_F(NewFile, ReplacesALinkAndNotWhatItLeadsTo) {
    Link("link", Outside("secret"));
    talo::Place place;
    talo::NewFile file;
    At("link", &place);
    ASSERT_EQ(FileError::kNone, file.Begin(place));
    ASSERT_TRUE(Put(file, "new"));
    EXPECT_EQ(FileError::kNone, file.Finish(place, true, -1));
    EXPECT_EQ("new", Read("link"));
    ExpectOutsideUntouched();
}

TEST_F(NewFile, ReplacesNoFolder) {
    MakeFolders("folder");
    talo::Place place;
    talo::NewFile file;
    At("folder", &place);
    ASSERT_EQ(FileError::kNone, file.Begin(place));
    EXPECT_EQ(FileError::kNotFile, file.Finish(place, true, -1));
    EXPECT_EQ(1, EntriesIn(""));
}

TEST_F(NewFile, NeedsItsFolder) {
    talo::Place place;
    talo::NewFile file;
    At("none/new", &place);
    EXPECT_EQ(FileError::kNotFound, file.Begin(place));
    EXPECT_EQ(-1, file.Descriptor());
    EXPECT_EQ(FileError::kFailed, file.Finish(place, false, -1));
}

TEST_F(NewFile, TakesAnUploadIn) {
    const std::string upload = Uploaded("content");
    EXPECT_EQ(FileError::kNone, TakeIn(upload, "new", false, 1000000000));
    EXPECT_EQ("content", Read("new"));
    EXPECT_EQ(1000000000, StatOf(InShare("new")).st_mtim.tv_sec);
    EXPECT_EQ(S_IFREG | 0644, StatOf(InShare("new")).st_mode);
    EXPECT_FALSE(fs::exists(upload));
}

TEST_F(NewFile, TakesAnUploadInOverAnotherOnlyWhenAsked) {
    Write("old", "old");
    const std::string upload = Uploaded("new");
    EXPECT_EQ(FileError::kExists, TakeIn(upload, "old", false));
    EXPECT_EQ("old", Read("old"));
    EXPECT_EQ("new", ContentOf(upload));
    EXPECT_EQ(FileError::kNone, TakeIn(upload, "old", true));
    EXPECT_EQ("new", Read("old"));
}

// /dev/shm is a file system of its own.
TEST_F(NewFile, TakesAnUploadInFromAnotherFileSystem) {
    struct stat here = {};
    struct stat there = {};
    ASSERT_EQ(0, stat(InShare("").c_str(), &here));
    ASSERT_EQ(0, stat("/dev/shm", &there));
    ASSERT_NE(here.st_dev, there.st_dev) << "/dev/shm lies where the temporary folder does";
    char name[] = "/dev/shm/webapi-test-XXXXXX";
    const int file = mkstemp(name);
    const std::string content(300000, 'x');
    ASSERT_EQ(static_cast<ssize_t>(content.size()), write(file, content.data(), content.size()));
    (void)close(file);
    Write("old", "old");
    EXPECT_EQ(FileError::kExists, TakeIn(name, "old", false));
    EXPECT_TRUE(fs::exists(name));
    EXPECT_EQ(FileError::kNotFound, TakeIn(name, "none/new", false));
    EXPECT_EQ(FileError::kNone, TakeIn(name, "old", true, 1000000000));
    EXPECT_EQ(content, Read("old"));
    EXPECT_EQ(1000000000, StatOf(InShare("old")).st_mtim.tv_sec);
    EXPECT_FALSE(fs::exists(name));
    EXPECT_EQ(1, EntriesIn(""));
}

TEST_F(NewFile, TakesNoLinkIn) {
    const std::string link = uploads_.Path("link");
    ASSERT_EQ(0, symlink(Outside("secret").c_str(), link.c_str()));
    EXPECT_EQ(FileError::kLink, TakeIn(link, "new", false));
    EXPECT_FALSE(fs::exists(InShare("new")));
    ExpectOutsideUntouched();
}

// A file system that has no nameless files, or cannot rename without replacing.
bool RefuseFlags(int call, unsigned argument, unsigned flag, unsigned error) {
    struct sock_filter filter[] = {
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(struct seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<unsigned>(call), 0, 3),
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS,
                 static_cast<unsigned>(offsetof(struct seccomp_data, args) + 8 * argument)),
        BPF_JUMP(BPF_JMP | BPF_JSET | BPF_K, flag, 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | error),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    };
    struct sock_fprog program = {sizeof filter / sizeof *filter, filter};
    return prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 &&
           prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) == 0;
}

TEST_F(NewFile, DoesWithoutNamelessFiles) {
    Write("old", "old");
    const support::ChildResult child = support::InChild([&] {
        EXPECT_TRUE(RefuseFlags(SYS_openat, 2, O_TMPFILE & ~O_DIRECTORY, EOPNOTSUPP));
        talo::Place place;
        At("old", &place);
        {
            talo::NewFile file;
            EXPECT_EQ(FileError::kNone, file.Begin(place));
            EXPECT_EQ(2, EntriesIn(""));
        }
        EXPECT_EQ(1, EntriesIn(""));
        for (const bool overwrite : {false, true}) {
            talo::NewFile file;
            EXPECT_EQ(FileError::kNone, file.Begin(place));
            EXPECT_TRUE(Put(file, "new"));
            EXPECT_EQ(overwrite ? FileError::kNone : FileError::kExists,
                      file.Finish(place, overwrite, -1));
        }
        EXPECT_EQ("new", Read("old"));
        EXPECT_EQ(1, EntriesIn(""));
        return 0;
    });
    EXPECT_EQ(0, child.status) << child.output;
}

TEST_F(NewFile, DoesWithoutRenamesThatReplaceNothing) {
    Write("a", "A");
    Write("b", "B");
    MakeFolders("folder/inner");
    const support::ChildResult child = support::InChild([&] {
        EXPECT_TRUE(RefuseFlags(SYS_renameat2, 4, RENAME_NOREPLACE, EINVAL));
        talo::Place a;
        talo::Place b;
        talo::Place c;
        talo::Place folder;
        talo::Place inner;
        At("a", &a);
        At("b", &b);
        At("c", &c);
        At("folder", &folder);
        At("folder/inner/new", &inner);
        EXPECT_EQ(FileError::kExists, a.Rename(b, false));
        EXPECT_EQ(FileError::kNone, a.Rename(c, false));
        EXPECT_EQ("A", Read("c"));
        EXPECT_EQ(FileError::kExists, folder.Rename(c, false));
        EXPECT_EQ(FileError::kIntoItself, folder.Rename(inner, false));
        EXPECT_EQ(FileError::kNone, folder.Rename(a, false));
        EXPECT_TRUE(fs::is_directory(InShare("a/inner")));
        EXPECT_FALSE(fs::exists(InShare("a/inner/new")));
        return 0;
    });
    EXPECT_EQ(0, child.status) << child.output;
}

}  // namespace
