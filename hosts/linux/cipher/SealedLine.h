#ifndef TALO_HOSTS_LINUX_CIPHER_SEALEDLINE_H
#define TALO_HOSTS_LINUX_CIPHER_SEALEDLINE_H

#include <string>

#include "hosts/linux/cipher/KeyRing.h"
#include "hosts/linux/cipher/Secret.h"

// Whole parameter lines, sealed to the appliance's public key.
// docs/enciphered-parameters.md has the format to the byte.
namespace host {

// No line of a form, a query or a JSON document begins like this.
constexpr char kLinePrefix[] = "~talo-line.1~";

using LineNonce = Secret<16>;

// What is within a sealed line.
struct LineContent {
    long long time = 0;  // seconds since the epoch, on the appliance's clock
    LineNonce nonce;     // names the line: there is no other with it
    std::string line;
};

// At the head of every parameter line: it has to cost nothing.
bool IsSealedLine(const char* text);

// Opens a line, with the prefix, by the key that it names. Neither its time nor
// whether it came before is checked here. `content` is untouched on failure.
bool OpenLine(const TaloCipherModule& module, const KeyRing& keys, const std::string& text,
              long long now, LineContent* content);

// Seals one to the public half of a key. `own` is the sender's secret, of this
// line only.
bool SealLine(const TaloCipherModule& module, const Key& half, const Key& own,
              const LineContent& content, std::string* text);

}  // namespace host

#endif
