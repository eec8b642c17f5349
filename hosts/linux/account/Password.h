#ifndef TALO_HOSTS_LINUX_ACCOUNT_PASSWORD_H
#define TALO_HOSTS_LINUX_ACCOUNT_PASSWORD_H

#include <string>

#include "hosts/linux/account/PasswordModule.h"

namespace host {

// As long as libcrypt hashes.
constexpr size_t kMaxPasswordBytes = 511;

// A hash with the cost of a new one and a password that nobody knows: what is
// verified in the place of a hash that is not there.
extern const char kDummyHash[];

// Whether a hash is in yescrypt's form. The file of accounts takes no other:
// cheaper ones would tell by the clock which accounts exist.
bool IsYescrypt(const std::string& hash);

// Whether it can be a password: not empty, no NUL, not too long. `problem` (may
// be null) says what is wrong.
bool IsPassword(const std::string& password, std::string* problem);

// Opens a module. Null when it is missing or is none; the reason is logged. It
// stays for the life of the process.
const TaloPasswordModule* OpenPasswordModule(const std::string& path);

// False, logged, when the module is missing or refuses.
bool HashPassword(const std::string& password, std::string* hash);

enum class Verdict { kMatches, kDiffers, kUnknown };

// Compares with a hash of any method that libcrypt has; kUnknown when the
// module is missing. A hash of no method known matches nothing.
Verdict VerifyPassword(const std::string& password, const std::string& hash);

// Takes as long for texts that differ at once as for equal ones.
bool EqualInConstantTime(const std::string& left, const std::string& right);

}  // namespace host

#endif
