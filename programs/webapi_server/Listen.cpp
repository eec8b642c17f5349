#include "programs/webapi_server/Listen.h"

#include <errno.h>
#include <fcntl.h>
#include <signal.h>
#include <string.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

namespace {

bool Fail(std::string* problem, const std::string& path, const char* what) {
    *problem = path + ": " + what;
    return false;
}

int NewSocket() {
    return socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
}

const struct sockaddr* Generic(const struct sockaddr_un* address) {
    return reinterpret_cast<const struct sockaddr*>(address);
}

// The workers of a server that was killed may keep its socket open for a moment; the
// system knows who listened first.
bool HasListenerGone(int connection) {
    struct ucred peer = {};
    socklen_t size = sizeof peer;
    return getsockopt(connection, SOL_SOCKET, SO_PEERCRED, &peer, &size) == 0 && peer.pid > 0 &&
           kill(peer.pid, 0) != 0 && errno == ESRCH;
}

// Removes a socket that was left behind. False when what is there must stay.
bool MakeRoom(const struct sockaddr_un& address, std::string* problem) {
    struct stat facts = {};
    if (lstat(address.sun_path, &facts) != 0) {
        return errno == ENOENT || Fail(problem, address.sun_path, strerror(errno));
    }
    if (!S_ISSOCK(facts.st_mode)) {
        return Fail(problem, address.sun_path, "is there, and is no socket");
    }
    const int probe = NewSocket();
    bool isStale = false;
    if (probe >= 0) {
        isStale = connect(probe, Generic(&address), sizeof address) == 0 ? HasListenerGone(probe)
                                                                         : errno == ECONNREFUSED;
        (void)close(probe);
    }
    if (!isStale) {
        return Fail(problem, address.sun_path, "is in use");
    }
    return unlink(address.sun_path) == 0 || Fail(problem, address.sun_path, strerror(errno));
}

int Option(int descriptor, int name) {
    int value = -1;
    socklen_t size = sizeof value;
    return getsockopt(descriptor, SOL_SOCKET, name, &value, &size) == 0 ? value : -1;
}

}  // namespace

Listener::~Listener() {
    Unlink();
    Close();
}

bool Listener::Make(const std::string& path, int backlog, std::string* problem) {
    struct sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    if (path.size() >= sizeof address.sun_path) {
        return Fail(problem, path, "is too long for a socket");
    }
    memcpy(address.sun_path, path.c_str(), path.size());
    if (!MakeRoom(address, problem)) {
        return false;
    }
    const int descriptor = NewSocket();
    const mode_t before = umask(0117);
    const bool isBound =
        descriptor >= 0 && bind(descriptor, Generic(&address), sizeof address) == 0;
    const int reason = errno;
    (void)umask(before);
    struct stat facts = {};
    if (!isBound || listen(descriptor, backlog) != 0 || lstat(path.c_str(), &facts) != 0) {
        (void)Fail(problem, path, strerror(isBound ? errno : reason));
        if (isBound) {
            (void)unlink(path.c_str());
        }
        if (descriptor >= 0) {
            (void)close(descriptor);
        }
        return false;
    }
    descriptor_ = descriptor;
    path_ = path;
    device_ = facts.st_dev;
    number_ = facts.st_ino;
    return true;
}

bool Listener::Adopt(int descriptor, std::string* problem) {
    if (Option(descriptor, SO_DOMAIN) != AF_UNIX || Option(descriptor, SO_TYPE) != SOCK_STREAM ||
        Option(descriptor, SO_ACCEPTCONN) != 1) {
        return Fail(problem, "descriptor " + std::to_string(descriptor),
                    "is no UNIX stream socket that listens");
    }
    const int flags = fcntl(descriptor, F_GETFL);
    if (fcntl(descriptor, F_SETFD, FD_CLOEXEC) != 0 ||
        fcntl(descriptor, F_SETFL, flags | O_NONBLOCK) != 0) {
        return Fail(problem, "descriptor " + std::to_string(descriptor), strerror(errno));
    }
    descriptor_ = descriptor;
    return true;
}

void Listener::Unlink() {
    struct stat facts = {};
    if (!path_.empty() && lstat(path_.c_str(), &facts) == 0 && facts.st_dev == device_ &&
        facts.st_ino == number_) {
        (void)unlink(path_.c_str());
    }
    path_.clear();
}

void Listener::Close() {
    if (descriptor_ >= 0) {
        (void)close(descriptor_);
        descriptor_ = -1;
    }
}
