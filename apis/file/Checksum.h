#ifndef APIS_FILE_CHECKSUM_H
#define APIS_FILE_CHECKSUM_H

#include <functional>
#include <string>
#include <vector>

#include "hosts/linux/sdk/Places.h"

// Files listed one by one in a result; a task's record is no place for a million.
constexpr size_t kMaxListed = 1000;

struct FileSum {
    std::string path;  // relative to the folder
    std::string sha256;
    unsigned long long size = 0;
};

struct Sums {
    std::string sha256;  // of the file, or of the folder
    unsigned long long files = 0;
    unsigned long long bytes = 0;
    std::vector<FileSum> listed;  // of a folder, the first ones
};

// Told after every block; false stops.
using SumProgress = std::function<bool(unsigned long long bytes)>;

// The bytes that will be read.
talo::FileError CountBytes(const talo::Place& place, const talo::FileFacts& facts,
                           const std::function<bool()>& goesOn, unsigned long long* bytes);

// A file's sum is that of its content. A folder's is that of a text with, for
// each file below it in byte order of the paths, the file's sum, two blanks, the
// path relative to the folder and a NUL. What was done until a failure is in
// `sums`.
talo::FileError ComputeSums(const talo::Place& place, const talo::FileFacts& facts,
                            const SumProgress& progress, Sums* sums);

#endif
