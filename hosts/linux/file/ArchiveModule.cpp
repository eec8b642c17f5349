#include "hosts/linux/file/ArchiveModule.h"

#include <archive.h>
#include <archive_entry.h>
#include <errno.h>
#include <limits.h>
#include <locale.h>
#include <string.h>
#include <unistd.h>

#include <algorithm>
#include <memory>
#include <new>

#include "platform/Platform.h"

namespace {

constexpr size_t kBlockBytes = 256u << 10;
constexpr unsigned kFileMode = 0644;
constexpr unsigned kFolderMode = 0755;

struct Zip {
    struct archive* archive = nullptr;
    std::unique_ptr<char[]> block;
    int output = -1;
    bool silent = false;            // nothing more is written
    const char* problem = nullptr;  // of ours; else the library's
    locale_t utf8 = nullptr;
};

// The library marks names as UTF-8 when the process's language is: an unmarked
// one is read in the letters of the first personal computers.
class InUtf8 {
  public:
    explicit InUtf8(const Zip& zip)
        : before_(zip.utf8 != nullptr ? uselocale(zip.utf8) : nullptr) {}
    ~InUtf8() {
        if (before_ != nullptr) {
            (void)uselocale(before_);
        }
    }
    InUtf8(const InUtf8&) = delete;
    InUtf8& operator=(const InUtf8&) = delete;

  private:
    locale_t before_;
};

struct FreeEntry {
    void operator()(struct archive_entry* entry) const {
        archive_entry_free(entry);
    }
};
using Entry = std::unique_ptr<struct archive_entry, FreeEntry>;

Zip* ZipOf(void* state) {
    return static_cast<Zip*>(state);
}

bool WriteAll(int output, const char* bytes, size_t size) {
    while (size > 0) {
        const ssize_t put = write(output, bytes, size);
        if (put < 0 && errno == EINTR) {
            continue;
        }
        if (put <= 0) {
            return false;
        }
        bytes += put;
        size -= static_cast<size_t>(put);
    }
    return true;
}

// The library never hears of a failure: it would not free all that it has, and
// it ends every archive that it frees, also one that is to have no end.
la_ssize_t Write(struct archive*, void* state, const void* bytes, size_t size) {
    Zip* zip = ZipOf(state);
    if (!zip->silent && !WriteAll(zip->output, static_cast<const char*>(bytes), size)) {
        zip->silent = true;
        zip->problem = strerror(errno);
    }
    return static_cast<la_ssize_t>(size);
}

void Drop(void* state) {
    Zip* zip = ZipOf(state);
    zip->silent = true;
    (void)archive_write_free(zip->archive);
    if (zip->utf8 != nullptr) {
        freelocale(zip->utf8);
    }
    delete zip;
}

void* Begin(int output) {
    std::unique_ptr<Zip> zip(new (std::nothrow) Zip());
    if (zip == nullptr) {
        return nullptr;
    }
    zip->block.reset(new (std::nothrow) char[kBlockBytes]);
    zip->archive = zip->block != nullptr ? archive_write_new() : nullptr;
    if (zip->archive == nullptr) {
        return nullptr;
    }
    zip->output = output;
    zip->utf8 = newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr);
    if (archive_write_set_format_zip(zip->archive) != ARCHIVE_OK ||
        archive_write_zip_set_compression_store(zip->archive) != ARCHIVE_OK ||
        archive_write_set_bytes_per_block(zip->archive, static_cast<int>(kBlockBytes)) !=
            ARCHIVE_OK ||
        archive_write_set_bytes_in_last_block(zip->archive, 1) != ARCHIVE_OK ||
        archive_write_open(zip->archive, zip.get(), nullptr, Write, nullptr) != ARCHIVE_OK) {
        Drop(zip.release());
        return nullptr;
    }
    return zip.release();
}

Entry NewEntry(const char* path, long long mtime, unsigned type, unsigned mode) {
    Entry entry(archive_entry_new());
    if (entry != nullptr) {
        archive_entry_copy_pathname(entry.get(), path);
        archive_entry_set_filetype(entry.get(), type);
        archive_entry_set_perm(entry.get(), mode);
        archive_entry_set_mtime(entry.get(), static_cast<time_t>(mtime), 0);
    }
    return entry;
}

bool WriteHeader(const Zip& zip, const Entry& entry) {
    const InUtf8 language(zip);
    return archive_write_header(zip.archive, entry.get()) >= ARCHIVE_WARN && !zip.silent;
}

int Fail(Zip* zip, const char* problem) {
    zip->problem = problem;
    return 0;
}

int AddFolder(void* state, const char* path, long long mtime) {
    Zip* zip = ZipOf(state);
    const Entry entry = NewEntry(path, mtime, AE_IFDIR, kFolderMode);
    if (entry == nullptr) {
        return Fail(zip, "no memory");
    }
    return WriteHeader(*zip, entry) ? 1 : 0;
}

int CopyContent(Zip* zip, unsigned long long size, int file) {
    while (size > 0) {
        const size_t wanted = static_cast<size_t>(std::min<unsigned long long>(size, kBlockBytes));
        const ssize_t got = read(file, zip->block.get(), wanted);
        if (got < 0 && errno == EINTR) {
            continue;
        }
        if (got <= 0) {
            return Fail(zip, got < 0 ? strerror(errno) : "a file has become shorter");
        }
        if (archive_write_data(zip->archive, zip->block.get(), static_cast<size_t>(got)) != got ||
            zip->silent) {
            return 0;
        }
        size -= static_cast<unsigned long long>(got);
    }
    return 1;
}

int AddFile(void* state, const char* path, long long mtime, unsigned long long size, int file) {
    Zip* zip = ZipOf(state);
    const Entry entry = NewEntry(path, mtime, AE_IFREG, kFileMode);
    if (entry == nullptr || size > LLONG_MAX) {
        return Fail(zip, entry == nullptr ? "no memory" : "a file is too large");
    }
    archive_entry_set_size(entry.get(), static_cast<la_int64_t>(size));
    return WriteHeader(*zip, entry) ? CopyContent(zip, size, file) : 0;
}

int Finish(void* state) {
    const Zip* zip = ZipOf(state);
    return archive_write_close(zip->archive) == ARCHIVE_OK && !zip->silent ? 1 : 0;
}

const char* Problem(void* state) {
    const Zip* zip = ZipOf(state);
    if (zip->problem != nullptr) {
        return zip->problem;
    }
    const char* text = archive_error_string(zip->archive);
    return text != nullptr ? text : "";
}

}  // namespace

extern "C" {
extern TALO_PLATFORM const TaloArchiveModule taloArchiveModule;
const TaloArchiveModule taloArchiveModule = {Begin, AddFolder, AddFile, Finish, Problem, Drop};
}
