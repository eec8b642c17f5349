#include "programs/webapi_server/Listen.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstring>

#include "programs/webapi_server/Message.h"
#include "tests/support/TempFolder.h"

namespace {

class ListenTest : public testing::Test {
  protected:
    bool CanConnect() const {
        struct sockaddr_un address = {};
        address.sun_family = AF_UNIX;
        strcpy(address.sun_path, path.c_str());
        const int client = socket(AF_UNIX, SOCK_STREAM, 0);
        const bool connected =
            connect(client, reinterpret_cast<struct sockaddr*>(&address), sizeof address) == 0;
        close(client);
        return connected;
    }

    // A socket that a server left behind when it was killed.
    void LeaveBehind() const {
        struct sockaddr_un address = {};
        address.sun_family = AF_UNIX;
        strcpy(address.sun_path, path.c_str());
        const int server = socket(AF_UNIX, SOCK_STREAM, 0);
        ASSERT_EQ(bind(server, reinterpret_cast<struct sockaddr*>(&address), sizeof address), 0);
        close(server);
    }

    support::TempFolder folder;
    std::string path = folder.Path("socket");
    std::string problem;
};

TEST_F(ListenTest, MakesASocketForOwnerAndGroup) {
    Listener listener;
    const mode_t before = umask(0);
    const bool made = listener.Make(path, 5, &problem);
    EXPECT_EQ(umask(before), 0);
    ASSERT_TRUE(made) << problem;
    struct stat facts = {};
    ASSERT_EQ(stat(path.c_str(), &facts), 0);
    EXPECT_EQ(facts.st_mode & 07777, 0660);
    EXPECT_TRUE(CanConnect());
    EXPECT_TRUE(fcntl(listener.Get(), F_GETFD) & FD_CLOEXEC);
    EXPECT_TRUE(listener.IsOwn());
}

TEST_F(ListenTest, RemovesItsSocketAtTheEnd) {
    {
        Listener listener;
        ASSERT_TRUE(listener.Make(path, 5, &problem));
    }
    EXPECT_NE(access(path.c_str(), F_OK), 0);
}

TEST_F(ListenTest, LeavesAloneWhatTookItsPlace) {
    {
        Listener listener;
        ASSERT_TRUE(listener.Make(path, 5, &problem));
        ASSERT_EQ(unlink(path.c_str()), 0);
        folder.Write("socket", "of another");
    }
    EXPECT_EQ(access(path.c_str(), F_OK), 0);
}

TEST_F(ListenTest, ReplacesOneThatWasLeftBehind) {
    LeaveBehind();
    Listener listener;
    EXPECT_TRUE(listener.Make(path, 5, &problem)) << problem;
    EXPECT_TRUE(CanConnect());
}

// Workers that have a request keep the socket open when their server is killed.
TEST_F(ListenTest, ReplacesOneThatIsOpenStillButWhoListenedIsGone) {
    int ends[2] = {};
    ASSERT_EQ(socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, ends), 0);
    const pid_t server = fork();
    if (server == 0) {
        Listener listener;
        const bool listens = listener.Make(path, 5, &problem);
        (void)SendMessage(ends[1], "", 1, listener.Get(), 0);
        _exit(listens ? 0 : 1);
    }
    int kept = -1;
    char message = 0;
    ASSERT_EQ(ReceiveMessage(ends[0], &message, 1, &kept, 0), 1);
    ASSERT_GE(kept, 0);
    int status = 0;
    ASSERT_EQ(waitpid(server, &status, 0), server);
    ASSERT_TRUE(CanConnect());
    Listener listener;
    EXPECT_TRUE(listener.Make(path, 5, &problem)) << problem;
    EXPECT_TRUE(CanConnect());
    for (const int descriptor : {kept, ends[0], ends[1]}) {
        close(descriptor);
    }
}

TEST_F(ListenTest, RefusesOneThatIsInUse) {
    Listener first;
    ASSERT_TRUE(first.Make(path, 5, &problem));
    Listener second;
    EXPECT_FALSE(second.Make(path, 5, &problem));
    EXPECT_NE(problem.find("in use"), std::string::npos);
    EXPECT_TRUE(CanConnect());
}

TEST_F(ListenTest, RefusesOneThatIsInUseWithoutRoomForMore) {
    Listener first;
    ASSERT_TRUE(first.Make(path, 0, &problem));
    struct sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    strcpy(address.sun_path, path.c_str());
    int clients[4] = {};
    for (int& client : clients) {
        client = socket(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK, 0);
        (void)connect(client, reinterpret_cast<struct sockaddr*>(&address), sizeof address);
    }
    Listener second;
    EXPECT_FALSE(second.Make(path, 5, &problem));
    for (const int client : clients) {
        close(client);
    }
}

TEST_F(ListenTest, RefusesAFileThatIsNoSocket) {
    folder.Write("socket", "precious");
    Listener listener;
    EXPECT_FALSE(listener.Make(path, 5, &problem));
    EXPECT_EQ(access(path.c_str(), F_OK), 0);
    EXPECT_NE(problem, "");
}

TEST_F(ListenTest, RefusesAPathThatIsTooLongOrNowhere) {
    Listener listener;
    EXPECT_FALSE(listener.Make(folder.Path(std::string(200, 'x')), 5, &problem));
    EXPECT_FALSE(listener.Make(folder.Path("no/folder"), 5, &problem));
    EXPECT_EQ(listener.Get(), -1);
}

TEST_F(ListenTest, AdoptsASocketAndLeavesItsNameToItsMaker) {
    Listener maker;
    ASSERT_TRUE(maker.Make(path, 5, &problem));
    {
        Listener listener;
        ASSERT_TRUE(listener.Adopt(dup(maker.Get()), &problem)) << problem;
        EXPECT_TRUE(fcntl(listener.Get(), F_GETFD) & FD_CLOEXEC);
        EXPECT_TRUE(fcntl(listener.Get(), F_GETFL) & O_NONBLOCK);
        EXPECT_FALSE(listener.IsOwn());
    }
    EXPECT_TRUE(CanConnect());
}

TEST_F(ListenTest, AdoptsNothingElse) {
    Listener listener;
    int pair[2] = {};
    ASSERT_EQ(socketpair(AF_UNIX, SOCK_STREAM, 0, pair), 0);
    EXPECT_FALSE(listener.Adopt(pair[0], &problem));
    const int internet = socket(AF_INET, SOCK_STREAM, 0);
    EXPECT_FALSE(listener.Adopt(internet, &problem));
    EXPECT_FALSE(listener.Adopt(-1, &problem));
    for (const int descriptor : {pair[0], pair[1], internet}) {
        close(descriptor);
    }
}

}  // namespace
