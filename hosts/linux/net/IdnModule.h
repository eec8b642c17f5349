#ifndef TALO_HOSTS_LINUX_NET_IDNMODULE_H
#define TALO_HOSTS_LINUX_NET_IDNMODULE_H

#include <cstddef>

// What the module talo-idn.so offers: the door to libidn2, opened only by a
// process that has a name to test which is not ASCII. Nothing throws; outputs
// stay untouched on failure.
extern "C" {

struct TaloIdnModule {
    // Writes an internationalised name (UTF-8) as it stands in the DNS ("xn--" and
    // so on, lower case). 1 on success; 0 for what is no such name, or does not fit.
    int (*toAscii)(const char* name, char* ascii, size_t size);
};
}

constexpr char kIdnModuleFile[] = "talo-idn.so";
constexpr char kIdnModuleSymbol[] = "taloIdnModule";

#endif
