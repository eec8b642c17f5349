#include <cstdio>
#include <cstring>

#include "Groups.h"

namespace {

struct Group {
    const char* name;
    void (*run)();
};

const Group kGroups[] = {
    {"json", bench::JsonText},        {"requests", bench::Requests},
    {"process", bench::ProcessStart}, {"upload", bench::Uploads},
    {"sessions", bench::Sessions},    {"multipart", bench::Multipart},
    {"downloads", bench::Downloads},  {"tasks", bench::Tasks},
    {"relay", bench::Relays},         {"ciphers", bench::Ciphers},
};

bool Wanted(const char* name, int argc, char** argv) {
    for (int word = 1; word < argc; ++word) {
        if (std::strcmp(argv[word], name) == 0) {
            return true;
        }
    }
    return argc == 1;
}

}  // namespace

// The groups to run are named on the command line; all without.
int main(int argc, char** argv) {
    std::printf(
        "Medians of one interleaved run; the last columns are the ratio and the "
        "difference to the first row.\n\n");
    for (const Group& group : kGroups) {
        if (Wanted(group.name, argc, argv)) {
            group.run();
        }
    }
    return 0;
}
