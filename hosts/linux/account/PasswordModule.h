#ifndef TALO_HOSTS_LINUX_ACCOUNT_PASSWORDMODULE_H
#define TALO_HOSTS_LINUX_ACCOUNT_PASSWORDMODULE_H

#include <cstddef>

// What the module talo-password.so offers: the door to libcrypt, opened only by
// a process that has a password to check or to set. Nothing throws; outputs
// stay untouched on failure.
extern "C" {

struct TaloPasswordModule {
    // Writes a setting for a new yescrypt hash, with a salt of the system's own
    // random bytes. 1 on success.
    int (*newSetting)(char* setting, size_t size);
    // Writes the password's hash by a setting, which any hash is too. 1 on
    // success, 0 also for a setting of a method that the library does not have.
    int (*hash)(const char* password, const char* setting, char* hash, size_t size);
};
}

constexpr char kPasswordModuleFile[] = "talo-password.so";
constexpr char kPasswordModuleSymbol[] = "taloPasswordModule";

#endif
