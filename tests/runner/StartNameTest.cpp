#include <errno.h>
#include <string.h>
#include <sys/syscall.h>

#include "src/runner/APIRunnerPrivate.h"
#include "tests/runner/RunnerFixture.h"
#include "tests/runner/SystemProbe.h"

namespace {

using TALO::APIRunnerPrivate;

// Overwrites this process's own first argument and answers the start name that
// a runner then takes. As long as it fits the real one.
std::string StartNameOf(const std::string& argument) {
    char* storage = probe::Arguments()[0];
    const size_t room = strlen(probe::Arguments()[0]);
    EXPECT_LE(argument.size(), room);
    memset(storage, 0, room);
    memcpy(storage, argument.data(), argument.size());
    APIRunnerPrivate d(nullptr);
    EXPECT_EQ(d.GetProcName(), d.GetOrigProcName());
    const std::string name = d.GetOrigProcName();
    memset(storage, 'x', room);
    return name;
}

TEST(StartName, IsTheBaseNameOfTheFirstArgument) {
    const std::string own = probe::Arguments()[0];
    const APIRunnerPrivate d(nullptr);
    EXPECT_EQ(d.origProcName, own.substr(own.rfind('/') + 1));
    EXPECT_EQ(d.procName, d.origProcName);
}

TEST(StartName, EndsAtTheFirstBlankAndTheFirstNul) {
    runner::InChild([] {
        EXPECT_EQ(StartNameOf("/a/bc"), "bc");
        EXPECT_EQ(StartNameOf("bc"), "bc");
        EXPECT_EQ(StartNameOf("/a/bc d"), "bc");
        EXPECT_EQ(StartNameOf("/a b/cd"), "a") << "the blank ends it, also inside a path";
        EXPECT_EQ(StartNameOf("a\nb c"), "a\nb") << "a line break does not";
        EXPECT_EQ(StartNameOf(std::string("/ab\0/c", 6)), "ab");
    });
}

TEST(StartName, IsTheCLibrarysWhenTheArgumentsCannotBeRead) {
    runner::InChild([] {
        char known[] = "known-to-libc";
        program_invocation_short_name = known;
        EXPECT_NE(APIRunnerPrivate(nullptr).origProcName, "known-to-libc");
        probe::RefuseSystemCall(SYS_openat, EACCES);
        probe::Arguments()[0][0] ^= 1;
        const APIRunnerPrivate d(nullptr);
        EXPECT_EQ(d.origProcName, "known-to-libc");
        EXPECT_EQ(d.procName, "known-to-libc");
    });
}

// A process with many requests asks the system for the first of them.
TEST(StartName, IsRememberedWhileTheArgumentShowsIt) {
    runner::InChild([] {
        char known[] = "known-to-libc";
        char* own = probe::Arguments()[0];
        ASSERT_EQ(own, program_invocation_name);
        APIRunnerPrivate first(nullptr);
        const std::string start = first.origProcName;
        first.SetArgs(1, &own);
        first.SetArgv0(start);
        first.LeaveArgv0();
        program_invocation_short_name = known;
        probe::RefuseSystemCall(SYS_openat, EACCES);
        EXPECT_EQ(APIRunnerPrivate(nullptr).origProcName, start);
        own[0] = own[0] == 'x' ? 'y' : 'x';
        EXPECT_EQ(APIRunnerPrivate(nullptr).origProcName, "known-to-libc");
    });
}

// Whoever serves on puts the first argument back behind a request.
TEST(StartName, IsRememberedForTheTextThatItWasReadFrom) {
    runner::InChild([] {
        char* const own = probe::Arguments()[0];
        const std::string text = own;
        const std::string start = APIRunnerPrivate(nullptr).origProcName;
        own[0] = own[0] == 'x' ? 'y' : 'x';
        (void)text.copy(own, text.size());
        probe::RefuseSystemCall(SYS_openat, EACCES);
        EXPECT_EQ(APIRunnerPrivate(nullptr).origProcName, start);
    });
}

}  // namespace
