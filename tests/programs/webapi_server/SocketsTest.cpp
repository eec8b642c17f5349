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

// Three sockets, in the places of one another.
void Make(Sockets* sockets) {
    const int first = socket(AF_UNIX, SOCK_STREAM, 0);
    const int second = socket(AF_UNIX, SOCK_STREAM, 0);
    const int third = socket(AF_UNIX, SOCK_STREAM, 0);
    sockets->taken = dup2(first, kControlSocket) >= 0 ? kControlSocket : -1;
    sockets->control = dup2(second, kListenerSocket) >= 0 ? kListenerSocket : -1;
    sockets->listener = fcntl(third, F_DUPFD, 20);
}

TEST(Sockets, GetTheirNumbersAndAreAllThatIsKept) {
    const support::ChildResult result = support::InChild([] {
        Sockets sockets = {};
        Make(&sockets);
        const struct stat control = FactsOf(sockets.control);
        const struct stat listener = FactsOf(sockets.listener);
        const struct stat taken = FactsOf(sockets.taken);
        KeepOnly(sockets);
        EXPECT_TRUE(IsSame(control, kControlSocket));
        EXPECT_TRUE(IsSame(listener, kListenerSocket));
        EXPECT_TRUE(IsSame(taken, kTakenSocket));
        for (int number = kControlSocket; number < 64; ++number) {
            EXPECT_EQ(number <= kTakenSocket, fcntl(number, F_GETFD) == FD_CLOEXEC) << number;
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
        EXPECT_LT(kTakenSocket, next);
        return 0;
    });
    EXPECT_EQ(0, result.status);
}

}  // namespace
