#ifndef TALO_HOSTS_LINUX_CIPHER_SEENLINES_H
#define TALO_HOSTS_LINUX_CIPHER_SEENLINES_H

#include <string>

#include "hosts/linux/cipher/SealedLine.h"

// Sealed lines that came already. A line counts for ten minutes before and after
// its time, so nonces are kept only as long: in one file for each ten minutes of
// the lines' own times. A file has a fixed number of places, since anybody may
// send lines: when the places run out, lines are refused, never forgotten.
namespace host {

constexpr long long kMostSkewSeconds = 600;

// A nonce's last byte chooses its bucket. At most 4 MiB for ten minutes.
constexpr size_t kSeenBuckets = 64;
constexpr size_t kSeenPlaces = 4096;

enum class Seen {
    kFirst,      // and noted
    kBefore,     // a replay
    kOutOfTime,  // too old, too new, or from before the machine was started
    kTrouble,    // cannot be told, which is logged: the line must not count
};

// `started` is when the machine was: the files are gone with a restart, so that
// what was sealed before may have come before.
Seen NoteLine(const std::string& dir, const LineContent& content, long long now, long long started);

// When the machine was started, on today's clock.
long long MachineStart(long long now);

}  // namespace host

#endif
