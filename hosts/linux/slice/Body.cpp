#include "hosts/linux/slice/Body.h"

#include <errno.h>
#include <string.h>
#include <unistd.h>

#include <algorithm>
#include <optional>
#include <vector>

#include "hosts/linux/sdk/Digest.h"
#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {

using talo::SliceResult;

constexpr char kSource[] = "Body.cpp";
constexpr size_t kBlockBytes = size_t{256} * 1024;

// Once more when a signal came in between.
template <typename Call>
ssize_t Retried(Call call) {
    ssize_t done = 0;
    do {
        done = call();
    } while (done < 0 && errno == EINTR);
    return done;
}

// Writes what can be written; answers how much, with errno when it is not all.
size_t WriteBlock(int file, const char* block, size_t size, unsigned long long offset) {
    size_t written = 0;
    while (written < size) {
        const ssize_t put = Retried([&] {
            return pwrite(file, block + written, size - written,
                          static_cast<off_t>(offset + written));
        });
        if (put <= 0) {
            errno = put == 0 ? ENOSPC : errno;
            return written;
        }
        written += static_cast<size_t>(put);
    }
    return written;
}

// A digest that has its library. The library is loaded here, when it is needed.
class Digesting {
  public:
    explicit Digesting(bool wanted) {
        if (wanted) {
            digest_.emplace();
        }
    }
    bool Add(const char* bytes, size_t size) {
        return !digest_.has_value() || digest_->Update(bytes, size);
    }
    bool End(std::string* hex) {
        return !digest_.has_value() || digest_->Final(hex);
    }

  private:
    std::optional<talo::Sha256> digest_;
};

SliceResult Copy(int from, int to, unsigned long long offset, unsigned long long bytes,
                 Digesting* digest, unsigned long long* copied) {
    std::vector<char> block(kBlockBytes);
    while (*copied < bytes) {
        const size_t wanted =
            static_cast<size_t>(std::min<unsigned long long>(bytes - *copied, block.size()));
        const ssize_t got = Retried([&] { return read(from, block.data(), wanted); });
        if (got <= 0) {
            return SliceResult::kCut;
        }
        const size_t size = static_cast<size_t>(got);
        const size_t written = WriteBlock(to, block.data(), size, offset + *copied);
        const int error = errno;
        *copied += written;
        if (written < size) {
            return ResultOf(error);
        }
        if (!digest->Add(block.data(), size)) {
            return SliceResult::kFailed;
        }
    }
    return SliceResult::kDone;
}

}  // namespace

SliceResult ResultOf(int error) {
    if (error == ENOSPC || error == EDQUOT || error == EFBIG) {
        return SliceResult::kNoSpace;
    }
    HOST_LOG("an upload fails: %s", strerror(error));
    return SliceResult::kFailed;
}

SliceResult CopyBody(int from, int to, unsigned long long offset, unsigned long long bytes,
                     std::string* digest, unsigned long long* copied) {
    Digesting digesting(digest != nullptr);
    *copied = 0;
    if (!digesting.Add("", 0)) {
        return SliceResult::kNoDigest;
    }
    const SliceResult result = Copy(from, to, offset, bytes, &digesting, copied);
    if (result == SliceResult::kDone && !digesting.End(digest)) {
        return SliceResult::kFailed;
    }
    return result;
}

SliceResult DigestFile(int file, unsigned long long bytes, std::string* digest) {
    Digesting digesting(true);
    if (!digesting.Add("", 0)) {
        return SliceResult::kNoDigest;
    }
    std::vector<char> block(kBlockBytes);
    for (unsigned long long done = 0; done < bytes;) {
        const size_t wanted =
            static_cast<size_t>(std::min<unsigned long long>(bytes - done, block.size()));
        const ssize_t got =
            Retried([&] { return pread(file, block.data(), wanted, static_cast<off_t>(done)); });
        if (got <= 0) {
            return ResultOf(got == 0 ? EIO : errno);
        }
        if (!digesting.Add(block.data(), static_cast<size_t>(got))) {
            return SliceResult::kFailed;
        }
        done += static_cast<size_t>(got);
    }
    return digesting.End(digest) ? SliceResult::kDone : SliceResult::kFailed;
}

}  // namespace host
