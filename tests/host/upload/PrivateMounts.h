#ifndef TESTS_HOST_UPLOAD_PRIVATEMOUNTS_H
#define TESTS_HOST_UPLOAD_PRIVATEMOUNTS_H

#include <gtest/gtest.h>
#include <sched.h>
#include <sys/mount.h>
#include <unistd.h>

#include <string>

// Mounts that only this process and its children see: for use in a child, as the
// superuser or where the kernel lends everybody a namespace.
inline bool EnterPrivateMounts() {
    const int flags = CLONE_NEWNS | (geteuid() == 0 ? 0 : CLONE_NEWUSER);
    return unshare(flags) == 0 && mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0;
}

inline void MountMemory(const std::string& path, const std::string& size, unsigned long flags = 0) {
    ASSERT_EQ(mount("none", path.c_str(), "tmpfs", flags, ("size=" + size).c_str()), 0) << path;
}

#endif
