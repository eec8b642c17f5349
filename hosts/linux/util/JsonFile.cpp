#include "hosts/linux/util/JsonFile.h"

#include <errno.h>
#include <fcntl.h>
#include <string.h>
#include <sys/stat.h>
#include <unistd.h>

#include "hosts/linux/util/JsonGrammar.h"
#include "platform/WebAPIUtil.h"

namespace host {

namespace {

class Descriptor {
  public:
    explicit Descriptor(int number) : number_(number) {}
    ~Descriptor() {
        if (number_ >= 0) {
            (void)close(number_);
        }
    }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    int Get() const {
        return number_;
    }

  private:
    int number_;
};

bool Refuse(std::string* reason, const std::string& text) {
    *reason = text;
    return false;
}

// O_NONBLOCK: a FIFO in the place of a file must not hang the request.
bool ReadFile(const char* path, std::string* content, std::string* reason) {
    constexpr size_t kMaxBytes = TALO::WebAPIUtil::kMaxJsonFileBytes;
    const Descriptor file(open(path, O_RDONLY | O_CLOEXEC | O_NONBLOCK));
    struct stat facts = {};
    if (file.Get() < 0 || fstat(file.Get(), &facts) != 0) {
        return Refuse(reason, strerror(errno));
    }
    if (!S_ISREG(facts.st_mode)) {
        return Refuse(reason, "no regular file");
    }
    if (static_cast<unsigned long long>(facts.st_size) > kMaxBytes) {
        return Refuse(reason, "larger than 4 MiB");
    }
    // One byte more than the file has now tells one that grows meanwhile.
    content->resize(static_cast<size_t>(facts.st_size) + 1);
    size_t filled = 0;
    while (filled < content->size()) {
        const ssize_t got = read(file.Get(), &(*content)[filled], content->size() - filled);
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
    if (filled == content->size()) {
        return Refuse(reason, "changed while it was read");
    }
    content->resize(filled);
    return true;
}

}  // namespace

bool ReadJsonFile(Json::Value& out, const char* path, std::string* reason) {
    if (path == nullptr) {
        return Refuse(reason, "no path");
    }
    std::string content;
    if (!ReadFile(path, &content, reason)) {
        return false;
    }
    Json::Value value;
    JsonError error;
    if (!ParseJson(content.data(), content.data() + content.size(), TALO::WebAPIUtil::kMaxJsonDepth,
                   &value, &error)) {
        return Refuse(reason,
                      std::string(error.reason) + " at byte " + std::to_string(error.offset));
    }
    if (!value.isObject() && !value.isArray()) {
        return Refuse(reason, "neither an object nor an array");
    }
    out.swap(value);
    return true;
}

}  // namespace host
