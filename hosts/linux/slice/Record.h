#ifndef TALO_HOSTS_LINUX_SLICE_RECORD_H
#define TALO_HOSTS_LINUX_SLICE_RECORD_H

#include <string>

#include "hosts/linux/sdk/Slices.h"

namespace host {

constexpr size_t kMaxSliceOwnerBytes = 100;
constexpr size_t kMaxSliceTargetBytes = 16384;

// A record is the target, escaped, and some hundred bytes; what is larger is none
// of ours.
constexpr size_t kMaxSliceRecordBytes = size_t{128} * 1024;

// An upload as the text of its record, and back. Whether it is complete, the
// record's name says. False for a text that is no JSON
// object, or has a member missing, of another type or out of its range.
std::string FormatSliceRecord(const talo::SliceFile& file);
bool ParseSliceRecord(const std::string& text, talo::SliceFile* file);

}  // namespace host

#endif
