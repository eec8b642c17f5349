#ifndef TALO_HOSTS_LINUX_FILE_TREE_H
#define TALO_HOSTS_LINUX_FILE_TREE_H

#include <sys/stat.h>

#include "hosts/linux/sdk/Places.h"

namespace host {

enum class TreeTask {
    kLook,    // folders before what is in them
    kRead,    // the same, with files opened
    kRemove,  // what is in a folder before the folder, each removed after its visit
};

// Visits everything below an open folder, which stays the caller's, and stays
// itself. Needs two descriptors at a time whatever the depth, and follows no
// link.
talo::FileError WalkTree(int top, TreeTask task, const talo::TreeVisit& visit);

talo::FileFacts FactsOf(const struct stat& facts);

// The names in an open folder but "." and "..". kTooMany when there are more
// than `most`; `names` then holds that many.
talo::FileError ReadNames(int folder, size_t most, std::vector<std::string>* names);

}  // namespace host

#endif
