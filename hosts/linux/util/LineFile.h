#ifndef TALO_HOSTS_LINUX_UTIL_LINEFILE_H
#define TALO_HOSTS_LINUX_UTIL_LINEFILE_H

#include <algorithm>
#include <cstddef>
#include <functional>
#include <string>

// Files of the configuration that have a thing a line.
namespace host {

struct LineFile {
    const char* path;
    const char* what;  // "file of accounts", for who is told that it is full
    size_t maxBytes;
    bool (*read)(const std::string& path, size_t most, std::string* content);
};

// Calls `visit` with the number and the bytes of each line, blank ones left
// out, until it answers false.
template <typename Visit>
void ForEachLine(const std::string& content, Visit visit) {
    size_t number = 0;
    for (size_t start = 0; start < content.size();) {
        const size_t end = std::min(content.find('\n', start), content.size());
        ++number;
        if (content.find_first_not_of(" \t\r", start) < end && !visit(number, start, end)) {
            return;
        }
        start = end + 1;
    }
}

// Where a line is, without its end.
struct LinePlace {
    size_t start;
    size_t end;
};

void EraseLine(std::string* content, const LinePlace& place);
void AppendLine(std::string* content, const std::string& line);

// `change` edits the content, or refuses in words.
using ContentChange = std::function<bool(std::string* content, std::string* problem)>;

// Changes a file, one after the other whoever does it: a lock on "PATH.lock" is
// held from reading to writing. Readers see the old content or the new one. Mode
// 0600; its folder is made when it is missing. False with `problem` in words.
bool ChangeLineFile(const LineFile& file, const ContentChange& change, std::string* problem);

}  // namespace host

#endif
