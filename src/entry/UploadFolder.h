#ifndef TALO_SRC_ENTRY_UPLOADFOLDER_H
#define TALO_SRC_ENTRY_UPLOADFOLDER_H

#include <string>

namespace TALO {

// Room that an upload leaves free where it goes.
constexpr unsigned long long kUploadReserve = 5ULL << 20;

// The folder for temporary files that takes `needed` bytes: that of a data volume
// first, then "/tmp", then the one on the root file system, which keeps a further
// 200 MiB. False, with the platform's error set, when there is none.
bool FindUploadTmpDir(std::string* dir, unsigned long long needed);

}  // namespace TALO

#endif
