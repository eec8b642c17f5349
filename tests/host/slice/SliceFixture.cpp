#include "tests/host/slice/SliceFixture.h"

#include <fcntl.h>
#include <stdlib.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <stdexcept>

#include "platform/Paths.h"

namespace fs = std::filesystem;
using talo::SliceResult;

namespace {

constexpr char kModule[] = TALO_MODULE_DIR "talo-digest.so";
constexpr char kModuleAway[] = TALO_MODULE_DIR "talo-digest.so.away";

// What mia's folder is called.
constexpr char kMia[] = "6d6961";

int FileWith(const std::string& content) {
    const int file = memfd_create("input", MFD_CLOEXEC);
    if (file < 0 || write(file, content.data(), content.size()) != content.size() ||
        lseek(file, 0, SEEK_SET) != 0) {
        throw std::runtime_error("no file in memory");
    }
    return file;
}

}  // namespace

Input::Input(const std::string& content) : before_(fcntl(STDIN_FILENO, F_DUPFD_CLOEXEC, 3)) {
    const int file = FileWith(content);
    (void)dup2(file, STDIN_FILENO);
    (void)close(file);
}

Input::~Input() {
    if (before_ >= 0) {
        (void)dup2(before_, STDIN_FILENO);
        (void)close(before_);
    } else {
        (void)close(STDIN_FILENO);
    }
}

size_t Input::Taken() const {
    return static_cast<size_t>(lseek(STDIN_FILENO, 0, SEEK_CUR));
}

SliceTest::SliceTest() : lent_(false), away_(false) {
    char folder[] = "/dev/shm/slice-test-XXXXXX";
    if (mkdtemp(folder) == nullptr) {
        throw std::runtime_error("no folder in memory");
    }
    folder_ = folder;
    Place(folder_ + "/slices");
}

SliceTest::~SliceTest() {
    fs::remove_all(folder_);
    fs::remove(TALO_HOST_CONF);
    if (lent_) {
        fs::remove(kModule);
    }
    if (away_) {
        fs::rename(kModuleAway, kModule);
    }
}

void SliceTest::Configure(const std::string& lines) const {
    fs::create_directories(fs::path(TALO_HOST_CONF).parent_path());
    Write(TALO_HOST_CONF, "slice_folder=\"" + place_ + "\"\n" + lines);
}

void SliceTest::Place(const std::string& folder) {
    place_ = folder;
    Configure("");
}

void SliceTest::LendDigests() {
    if (!fs::exists(kModule)) {
        fs::create_directories(TALO_MODULE_DIR);
        fs::remove(kModule);
        fs::create_symlink(DIGEST_MODULE, kModule);
        lent_ = true;
    }
}

void SliceTest::TakeDigestsAway() {
    if (fs::exists(kModule)) {
        fs::rename(kModule, kModuleAway);
        away_ = true;
    }
}

std::string SliceTest::Begin(unsigned long long length, const std::string& digest) {
    talo::SliceFile file;
    file.owner = "mia";
    file.length = length;
    file.digest = digest;
    file.target = "/photos/a.jpg";
    talo::SliceUpload upload;
    return upload.Create(file) == SliceResult::kDone ? upload.Id() : "";
}

SliceResult SliceTest::Create(const std::string& owner, unsigned long long length,
                              std::string* id) {
    talo::SliceFile file;
    file.owner = owner;
    file.length = length;
    talo::SliceUpload upload;
    const SliceResult result = upload.Create(file);
    if (id != nullptr) {
        *id = upload.Id();
    }
    return result;
}

SliceResult SliceTest::Send(const std::string& id, unsigned long long offset,
                            const std::string& content, const std::string& digest,
                            const std::string& owner) {
    const Input input(content);
    talo::SliceUpload upload;
    const SliceResult result = upload.Open(id, owner);
    return result == SliceResult::kDone ? upload.Append(offset, content.size(), digest) : result;
}

SliceResult SliceTest::SendPart(const std::string& id, unsigned long long offset,
                                const std::string& content, unsigned long long promised,
                                const std::string& digest) {
    const Input input(content);
    talo::SliceUpload upload;
    const SliceResult result = upload.Open(id, "mia");
    return result == SliceResult::kDone ? upload.Append(offset, promised, digest) : result;
}

long long SliceTest::OffsetOf(const std::string& id, const std::string& owner) {
    talo::SliceFile file;
    unsigned long long offset = 0;
    const SliceResult result = talo::FindSliceUpload(id, owner, &file, &offset);
    return result == SliceResult::kDone ? static_cast<long long>(offset) : -1;
}

bool SliceTest::Exists(const std::string& id, const std::string& owner) {
    return OffsetOf(id, owner) >= 0;
}

std::string SliceTest::FolderPath() const {
    return place_ + "/" + kMia;
}

std::string SliceTest::PathOf(const std::string& name) const {
    return FolderPath() + "/" + name;
}

std::string SliceTest::DataPathOf(const std::string& id) const {
    return PathOf(id + ".data");
}

std::vector<std::string> SliceTest::Names() const {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(FolderPath())) {
        names.push_back(entry.path().filename());
    }
    std::sort(names.begin(), names.end());
    return names;
}

std::string SliceTest::Read(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void SliceTest::Write(const std::string& path, const std::string& content) {
    std::ofstream(path, std::ios::binary) << content;
}

void SliceTest::LeaveUnused(const std::string& id, long long seconds) const {
    Age(PathOf(id), seconds);
    Age(DataPathOf(id), seconds);
}

void SliceTest::Age(const std::string& path, long long seconds) {
    struct timespec times[2] = {};
    times[0].tv_sec = times[1].tv_sec = time(nullptr) - static_cast<time_t>(seconds);
    ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), times, AT_SYMLINK_NOFOLLOW), 0) << path;
}

void SliceTest::MakeSweepDue() const {
    Age(place_ + "/.swept", 2 * 3600);
}

size_t SliceTest::OpenDescriptors() {
    return static_cast<size_t>(
        std::distance(fs::directory_iterator("/proc/self/fd"), fs::directory_iterator()));
}

std::string Content(size_t size) {
    std::string content(size, '\0');
    unsigned state = 1;
    for (char& byte : content) {
        state = state * 1103515245u + 12345u;
        byte = static_cast<char>(state >> 16);
    }
    return content;
}

namespace talo {

void PrintTo(SliceResult result, std::ostream* out) {
    constexpr const char* kNames[] = {"kDone",     "kNotFound", "kBusy",  "kWrongOffset",
                                      "kTooLong",  "kTooMany",  "kCut",   "kWrongDigest",
                                      "kNoDigest", "kNoSpace",  "kFailed"};
    *out << kNames[static_cast<int>(result)];
}

}  // namespace talo

std::string UnusedSliceId() {
    return "u" + std::string(40, '0');
}
