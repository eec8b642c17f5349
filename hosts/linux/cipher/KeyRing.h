#ifndef TALO_HOSTS_LINUX_CIPHER_KEYRING_H
#define TALO_HOSTS_LINUX_CIPHER_KEYRING_H

#include <optional>
#include <string>

#include "hosts/linux/cipher/Secret.h"

// The keys that parameter lines are sealed to. They are made on first use and
// kept in one file, mode 0600, of a folder that nobody else can enter.
namespace host {

// The key before the last rotation is taken for so long.
constexpr long long kPreviousSeconds = 24LL * 3600;

constexpr size_t kKeyIdBytes = 9;

// An X25519 key.
struct LineKey {
    Key half;  // the public one
    Key secret;
};

struct KeyRing {
    LineKey current;
    long long since = 0;  // when the current key was made, seconds since the epoch
    std::optional<LineKey> previous;
};

// The beginning of the public half: random enough to tell two keys apart.
std::string KeyIdOf(const Key& half);

// The key of that id, null when there is none or it has had its day.
const LineKey* FindKey(const KeyRing& ring, const std::string& id, long long now);

std::string FormatKeyRing(const KeyRing& ring);
bool ParseKeyRing(const std::string& content, KeyRing* ring);

// The keys of a folder. Whoever comes first makes them: of several processes at
// once, one does. False, logged, when they cannot be made or are not to be
// trusted: keys that others could have read or written are refused, and damaged
// ones never replaced silently.
bool OpenKeyRing(const TaloCipherModule& module, const std::string& dir, long long now,
                 KeyRing* ring);

// Makes a new key; the current one becomes the previous one, which it replaces.
bool RotateKeyRing(const TaloCipherModule& module, const std::string& dir, long long now);

}  // namespace host

#endif
