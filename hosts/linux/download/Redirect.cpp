#include "hosts/linux/download/Redirect.h"

#include <limits.h>
#include <stdlib.h>
#include <strings.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>

#include "hosts/linux/util/Percent.h"
#include "hosts/linux/util/Utf8.h"

namespace host {

namespace {

// "" when the file has no name any more, or none that we can see.
std::string PathOf(int file) {
    char path[PATH_MAX];
    const std::string link = "/proc/self/fd/" + std::to_string(file);
    const ssize_t length = readlink(link.c_str(), path, sizeof path);
    if (length <= 0 || static_cast<size_t>(length) == sizeof path || path[0] != '/') {
        return std::string();
    }
    const std::string name(path, static_cast<size_t>(length));
    struct stat opened = {};
    struct stat named = {};
    const bool same = fstat(file, &opened) == 0 && lstat(name.c_str(), &named) == 0 &&
                      opened.st_dev == named.st_dev && opened.st_ino == named.st_ino;
    return same ? name : std::string();
}

// The servers undo percent escapes, and not all of them take what is no text
// afterwards. A file of /proc is another one in the server's eyes.
bool CanBeSaid(const std::string& path) {
    for (size_t at = 0; at < path.size();) {
        const size_t bytes = Utf8Character(path, at);
        if (bytes == 0 || static_cast<unsigned char>(path[at]) < ' ') {
            return false;
        }
        at += bytes;
    }
    return path.compare(0, 6, "/proc/") != 0;
}

std::string Encoded(const std::string& path) {
    std::string out;
    for (size_t start = 0; start < path.size();) {
        const size_t end = std::min(path.find('/', start), path.size());
        out += PercentEncode(path.substr(start, end - start));
        out += end < path.size() ? "/" : "";
        start = end + 1;
    }
    return out;
}

// A blank at the end would not count as a part of a header's value.
bool CanBeSaidPlainly(const std::string& path) {
    return path.back() != ' ' && path.find('\x7F') == std::string::npos;
}

bool IsYes(const char* variable) {
    const char* const value = getenv(variable);
    return value != nullptr && strcasecmp(value, "yes") == 0;
}

bool IsPrefix(const std::string& text) {
    return !text.empty() && text[0] == '/' && std::all_of(text.begin(), text.end(), [](char byte) {
        return byte > ' ' && byte < 127;
    });
}

}  // namespace

std::string ServerSends(int file) {
    if (!IsYes("MOD_X_SENDFILE_ENABLED")) {
        return std::string();
    }
    const std::string path = PathOf(file);
    if (path.empty() || !CanBeSaid(path)) {
        return std::string();
    }
    const char* const prefix = getenv("MOD_X_ACCEL_PREFIX");
    if (prefix == nullptr || *prefix == '\0') {
        if (IsYes("MOD_X_SENDFILE_PLAIN")) {
            return CanBeSaidPlainly(path) ? "X-Sendfile: " + path + "\r\n" : std::string();
        }
        return "X-Sendfile: " + Encoded(path) + "\r\n";
    }
    if (!IsPrefix(prefix)) {
        return std::string();
    }
    std::string inFront = prefix;
    while (!inFront.empty() && inFront.back() == '/') {
        inFront.pop_back();
    }
    return "X-Accel-Redirect: " + inFront + Encoded(path) + "\r\n";
}

}  // namespace host
