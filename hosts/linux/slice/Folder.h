#ifndef TALO_HOSTS_LINUX_SLICE_FOLDER_H
#define TALO_HOSTS_LINUX_SLICE_FOLDER_H

#include <string>
#include <vector>

#include "hosts/linux/sdk/Slices.h"

namespace host {

// Where uploads lie: TALO_SLICE_DIR, or the folder that the configuration names
// as "slice_folder". In it every owner has a folder, so that nobody finds another
// one's uploads and to count an owner's costs nothing for the others. An upload
// "ID" is the record "ID" and the data "ID.data", whose size is the offset; who
// locks the record holds the upload. The data file is made first and goes last.
// When the data have been taken away, the record is renamed to "ID.done".
std::string SliceFolder();

// The owner's folder, "" for a text that cannot be an owner. It need not exist.
std::string OwnerFolder(const std::string& owner);

// Makes the owner's folder, where it is missing, for its user alone. False, which
// is logged, when it cannot be made, or others than root and our user may write there.
bool MakeOwnerFolder(const std::string& owner);

std::string SliceRecordPath(const std::string& folder, const std::string& id);
std::string SliceDataPath(const std::string& folder, const std::string& id);
std::string SliceDonePath(const std::string& folder, const std::string& id);

// A new id, "" when the kernel has no random bytes to give.
std::string NewSliceId();

// What a name in an owner's folder is.
enum class SliceNameKind { kRecord, kData, kDone, kUnwritten, kOther };
struct SliceName {
    SliceNameKind kind = SliceNameKind::kOther;
    std::string id;  // of all but the last
};
SliceName ReadSliceName(const std::string& name);

// All names of a folder, none when it cannot be read.
std::vector<std::string> NamesIn(const std::string& folder);

// Opens a regular file of ours, links not followed; -1 for anything else.
int OpenOwnFile(const std::string& path, int flags);

// Whether the path still names the open file.
bool IsInPlace(const std::string& path, int file);

// Reads an open record with its last change. False when it is damaged, which is
// logged.
bool ReadSliceRecord(int record, talo::SliceFile* file, long long* changed);

}  // namespace host

#endif
