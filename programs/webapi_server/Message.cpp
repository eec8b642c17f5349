#include "programs/webapi_server/Message.h"

#include <errno.h>
#include <string.h>
#include <sys/socket.h>
#include <sys/uio.h>

namespace {

union OneDescriptor {
    struct cmsghdr header;
    char bytes[CMSG_SPACE(sizeof(int))];
};

}  // namespace

bool SendMessage(int socket, const void* data, size_t size, int descriptor, int flags) {
    struct iovec part = {const_cast<void*>(data), size};
    struct msghdr message = {};
    message.msg_iov = &part;
    message.msg_iovlen = 1;
    OneDescriptor control = {};
    if (descriptor >= 0) {
        message.msg_control = control.bytes;
        message.msg_controllen = sizeof control.bytes;
        struct cmsghdr* const header = CMSG_FIRSTHDR(&message);
        header->cmsg_level = SOL_SOCKET;
        header->cmsg_type = SCM_RIGHTS;
        header->cmsg_len = CMSG_LEN(sizeof(int));
        memcpy(CMSG_DATA(header), &descriptor, sizeof descriptor);
    }
    ssize_t sent = -1;
    do {
        sent = sendmsg(socket, &message, flags | MSG_NOSIGNAL);
    } while (sent < 0 && errno == EINTR);
    return sent == static_cast<ssize_t>(size);
}

ssize_t ReceiveMessage(int socket, void* data, size_t size, int* descriptor, int flags) {
    *descriptor = -1;
    struct iovec part = {data, size};
    OneDescriptor control = {};
    struct msghdr message = {};
    message.msg_iov = &part;
    message.msg_iovlen = 1;
    message.msg_control = control.bytes;
    message.msg_controllen = sizeof control.bytes;
    ssize_t got = -1;
    do {
        got = recvmsg(socket, &message, flags | MSG_CMSG_CLOEXEC);
    } while (got < 0 && errno == EINTR);
    if (got < 0) {
        return -1;
    }
    const struct cmsghdr* const header = CMSG_FIRSTHDR(&message);
    if (header != nullptr && header->cmsg_level == SOL_SOCKET && header->cmsg_type == SCM_RIGHTS &&
        header->cmsg_len == CMSG_LEN(sizeof(int))) {
        memcpy(descriptor, CMSG_DATA(header), sizeof *descriptor);
    }
    return got;
}
