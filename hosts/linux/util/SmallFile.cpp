#include "hosts/linux/util/SmallFile.h"

#include <errno.h>
#include <fcntl.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/stat.h>
#include <unistd.h>

#include "hosts/linux/util/Descriptor.h"

namespace host {

namespace {

bool Refuse(std::string* reason, const std::string& text) {
    *reason = text;
    return false;
}

std::string SizeText(size_t bytes) {
    return bytes % (1u << 20) == 0 ? std::to_string(bytes >> 20) + " MiB"
                                   : std::to_string(bytes) + " bytes";
}

bool WriteAll(int file, const std::string& content) {
    for (size_t written = 0; written < content.size();) {
        const ssize_t put = write(file, content.data() + written, content.size() - written);
        if (put < 0 && errno == EINTR) {
            continue;
        }
        if (put <= 0) {
            return false;
        }
        written += static_cast<size_t>(put);
    }
    return true;
}

}  // namespace

// O_NONBLOCK: a FIFO in the place of a file must not hang the request.
bool ReadSmallFile(const char* path, size_t maxBytes, std::string* content, std::string* reason) {
    const Descriptor file(open(path, O_RDONLY | O_CLOEXEC | O_NONBLOCK));
    if (file.Get() < 0) {
        return Refuse(reason, strerror(errno));
    }
    return ReadSmallFile(file.Get(), maxBytes, content, reason);
}

bool ReadSmallFile(int file, size_t maxBytes, std::string* content, std::string* reason) {
    struct stat facts = {};
    if (fstat(file, &facts) != 0) {
        return Refuse(reason, strerror(errno));
    }
    if (!S_ISREG(facts.st_mode)) {
        return Refuse(reason, "no regular file");
    }
    if (static_cast<unsigned long long>(facts.st_size) > maxBytes) {
        return Refuse(reason, "larger than " + SizeText(maxBytes));
    }
    // One byte more than the file has now tells one that grows meanwhile.
    std::string text(static_cast<size_t>(facts.st_size) + 1, '\0');
    size_t filled = 0;
    while (filled < text.size()) {
        const ssize_t got = read(file, &text[filled], text.size() - filled);
        if (got < 0 && errno == EINTR) {
            continue;
        }
        if (got < 0) {
            return Refuse(reason, strerror(errno));
        }
        if (got == 0) {
            break;
        }
        filled += static_cast<size_t>(got);
    }
    if (filled == text.size()) {
        return Refuse(reason, "changed while it was read");
    }
    text.resize(filled);
    content->swap(text);
    return true;
}

bool ReplaceFile(const std::string& path, const std::string& content) {
    std::string temporary = path + ".XXXXXX";
    const Descriptor file(mkostemp(&temporary[0], O_CLOEXEC));
    if (file.Get() < 0) {
        return false;
    }
    if (WriteAll(file.Get(), content) && fsync(file.Get()) == 0 &&
        rename(temporary.c_str(), path.c_str()) == 0) {
        return true;
    }
    (void)unlink(temporary.c_str());
    return false;
}

}  // namespace host
