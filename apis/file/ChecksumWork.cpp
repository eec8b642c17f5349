#include <errno.h>
#include <unistd.h>

#include "Checksum.h"
#include "hosts/linux/sdk/Digest.h"

namespace {

using talo::FileError;

constexpr size_t kBlockBytes = 1u << 20;

class Summing {
  public:
    Summing(const SumProgress& progress, Sums* sums)
        : progress_(progress), sums_(sums), block_(kBlockBytes) {}

    // What is there when it is read: a file that grows or shrinks meanwhile has
    // the sum of that.
    FileError File(int file, FileSum* sum) {
        talo::Sha256 digest;
        for (;;) {
            const ssize_t got = read(file, block_.data(), block_.size());
            if (got < 0 && errno != EINTR) {
                return FileError::kFailed;
            }
            const size_t size = got > 0 ? static_cast<size_t>(got) : 0;
            if (!digest.Update(block_.data(), size)) {
                return FileError::kFailed;
            }
            sum->size += size;
            sums_->bytes += size;
            if (!progress_(sums_->bytes)) {
                return FileError::kStopped;
            }
            if (got == 0) {
                ++sums_->files;
                return digest.Final(&sum->sha256) ? FileError::kNone : FileError::kFailed;
            }
        }
    }

    FileError Tree(const talo::Place& place) {
        talo::Sha256 whole;
        FileError inner = FileError::kNone;
        const FileError result = place.Walk(true, [&](const talo::TreeEntry& entry) {
            FileSum sum;
            sum.path = entry.path;
            if (entry.facts.type != talo::FileType::kFile) {
                return progress_(sums_->bytes);
            }
            inner = File(entry.file, &sum);
            if (inner == FileError::kNone && !AddLine(sum, &whole)) {
                inner = FileError::kFailed;
            }
            if (inner == FileError::kNone && sums_->listed.size() < kMaxListed) {
                sums_->listed.push_back(sum);
            }
            return inner == FileError::kNone;
        });
        if (inner != FileError::kNone || result != FileError::kNone) {
            return inner != FileError::kNone ? inner : result;
        }
        return whole.Final(&sums_->sha256) ? FileError::kNone : FileError::kFailed;
    }

  private:
    static bool AddLine(const FileSum& sum, talo::Sha256* whole) {
        std::string line = sum.sha256 + "  " + sum.path;
        line += '\0';
        return whole->Update(line.data(), line.size());
    }

    const SumProgress& progress_;
    Sums* sums_;
    std::vector<char> block_;
};

}  // namespace

FileError CountBytes(const talo::Place& place, const talo::FileFacts& facts,
                     const std::function<bool()>& goesOn, unsigned long long* bytes) {
    if (facts.type != talo::FileType::kFolder) {
        *bytes = facts.size;
        return FileError::kNone;
    }
    *bytes = 0;
    return place.Walk(false, [&](const talo::TreeEntry& entry) {
        *bytes += entry.facts.size;
        return goesOn();
    });
}

FileError ComputeSums(const talo::Place& place, const talo::FileFacts& facts,
                      const SumProgress& progress, Sums* sums) {
    Summing summing(progress, sums);
    if (facts.type == talo::FileType::kFolder) {
        return summing.Tree(place);
    }
    int file = -1;
    const FileError opened = place.OpenFile(&file);
    if (opened != FileError::kNone) {
        return opened;
    }
    FileSum sum;
    const FileError result = summing.File(file, &sum);
    (void)close(file);
    sums->sha256 = sum.sha256;
    return result;
}
