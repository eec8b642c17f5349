#include <unistd.h>

#include <cstdio>

#include "programs/webapi_server/Loader.h"

// Tells what a program sees of itself behind the call: its arguments and its
// environment, a line for each.
int main(int argc, char** argv) {
    BeginWithLoaderSettings(argv);
    for (int index = 0; index < argc; ++index) {
        std::printf("argument %s\n", argv[index]);
    }
    for (char** entry = environ; *entry != nullptr; ++entry) {
        std::printf("variable %s\n", *entry);
    }
    std::printf("process %d\n", static_cast<int>(getpid()));
    std::fflush(stdout);
    (void)getchar();
    return 0;
}
