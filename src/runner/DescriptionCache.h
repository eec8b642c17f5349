#ifndef TALO_SRC_RUNNER_DESCRIPTIONCACHE_H
#define TALO_SRC_RUNNER_DESCRIPTIONCACHE_H

#include <json/json.h>

namespace TALO {

// When the content of a file is kept. A copy costs time and memory, and a process
// that serves one request reads the description of an API once.
enum class Keep {
    kAtOnce,
    kWhenReadAgain,
};

// As WebAPIUtil::ReadJsonFile, but for a file that this process has read before
// and that has not changed since: nothing is read then. The file is looked at
// each time. A file that is not on the disk, one that changed a moment ago, a
// refused one, and what goes beyond the bounds below are read each time.
bool ReadDescriptionFile(Json::Value& out, const char* path, Keep keep);

// What is kept at most. The bytes are those of the files; in memory they take
// about ten times as much.
constexpr int kMostFilesKept = 2048;
constexpr long long kMostBytesKept = 8LL << 20;

}  // namespace TALO

#endif
