#include "src/base/FileIdentity.h"

namespace {

// The fake platform's files are in memory. One on the disk that happens to have
// the name of one of them, such as an installed file of defaults, is another one.
bool IsOnNoDisk(const char*, TALO::FileIdentity*) {
    return false;
}

const TALO::FileIdentifier kBefore = TALO::SetFileIdentifier(IsOnNoDisk);

}  // namespace
