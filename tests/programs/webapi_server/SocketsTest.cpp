#include "programs/webapi_server/Sockets.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <unistd.h>

#include "tests/support/Child.h"

namespace {

bool IsSame(const struct stat& one, int descriptor) {
    struct stat other = {};
    return fstat(descriptor, &other) == 0 && one.st_dev == other.st_dev &&
           one.st_ino == other.st_ino;
}

struct stat FactsOf(int descriptor) {
    struct stat facts = {};
    EXPECT_EQ(0, fstat(descriptor, &facts));
    return facts;
}

// Two sockets, each in the place of the other, and one more.
void Make(Sockets* sockets) {
    const int first = socket(AF_UNIX, SOCK_STREAM, 0);
    const int second = socket(AF_UNIX, SOCK_STREAM, 0);
    (void)fcntl(second, F_DUPFD, 20);
    sockets->control = fcntl(second, F_DUPFD, 30);
    sockets->listener = dup2(first, kControlSocket);
    sockets->control = dup2(sockets->control, kListenerSocket);
}

TEST(Sockets, GetTheirNumbersAndAreAllThatIsKept) {
    const support::ChildResult result = support::InChild([] {
        Sockets sockets = {};
        Make(&sockets);
        const struct stat control = FactsOf(sockets.control);
        const struct stat listener = FactsOf(sockets.listener);
        KeepOnly(sockets);
        EXPECT_TRUE(IsSame(control, kControlSocket));
        EXPECT_TRUE(IsSame(listener, kListenerSocket));
        for (int number = kControlSocket; number < 64; ++number) {
            EXPECT_EQ(number <= kListenerSocket, fcntl(number, F_GETFD) == FD_CLOEXEC) << number;
        }
        return 0;
    });
    EXPECT_EQ(0, result.status);
}

TEST(Sockets, LeaveNoPlaceForOthersWhereThereIsNoListenerAnyMore) {
    const support::ChildResult result = support::InChild([] {
        Sockets sockets = {};
        Make(&sockets);
        sockets.listener = -1;
        KeepOnly(sockets);
        EXPECT_EQ(-1, accept(kListenerSocket, nullptr, nullptr));
        const int next = open("/dev/null", O_RDONLY);
        EXPECT_LT(kListenerSocket, next);
        return 0;
    });
    EXPECT_EQ(0, result.status);
}

}  // namespace
