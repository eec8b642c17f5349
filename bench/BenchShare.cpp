#include "BenchShare.h"

#include <fcntl.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <fstream>

#include "platform/Paths.h"

namespace bench {

namespace {
const char kFile[] = "tiny.txt";
}

Share::Share(const std::string& reader) {
    if (mkdtemp(&folder_[0]) == nullptr ||
        !(std::ofstream(folder_ + "/" + kFile) << "a few bytes\n").flush()) {
        std::perror(folder_.c_str());
        return;
    }
    const std::string name = std::filesystem::path(folder_).filename().string();
    ready_ = AddLine(R"({"name": ")" + name + R"(", "folder": ")" + folder_ +
                     R"(", "readers": [")" + reader + R"("]})");
    if (!ready_) {
        std::perror(TALO_SHARES_FILE);
    }
}

// What others have settled stays: the line is put behind it, and cut off again.
bool Share::AddLine(const std::string& line) {
    struct stat facts = {};
    if (stat(TALO_SHARES_FILE, &facts) == 0) {
        oldSize_ = facts.st_size;
    }
    const int file = open(TALO_SHARES_FILE, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0644);
    if (file < 0) {
        return false;
    }
    added_ = true;
    // The last line there may lack its end.
    const std::string text = "\n" + line + "\n";
    const bool written = write(file, text.data(), text.size()) == static_cast<ssize_t>(text.size());
    return close(file) == 0 && written;
}

Share::~Share() {
    if (added_ &&
        (oldSize_ < 0 ? unlink(TALO_SHARES_FILE) : truncate(TALO_SHARES_FILE, oldSize_)) != 0) {
        std::perror(TALO_SHARES_FILE);
    }
    std::error_code ignored;
    std::filesystem::remove_all(folder_, ignored);
}

std::string Share::FilePath() const {
    return "/" + std::filesystem::path(folder_).filename().string() + "/" + kFile;
}

}  // namespace bench
