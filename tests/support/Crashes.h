#ifndef TESTS_SUPPORT_CRASHES_H
#define TESTS_SUPPORT_CRASHES_H

#include <signal.h>
#include <sys/mman.h>
#include <sys/resource.h>
#include <unistd.h>

#include <cstdlib>
#include <stdexcept>
#include <string>
#include <thread>

// The ways in which a method may end its process. A sanitizer would see them
// coming, and end the process its own way.
#define CRASHES __attribute__((no_sanitize("undefined", "address"), noinline)) inline

namespace support {

CRASHES void WriteToNowhere() {
    int* volatile nowhere = nullptr;
    *nowhere = 1;
}

// Pages of a file behind its end.
CRASHES void WriteBehindAFile() {
    FILE* const file = std::tmpfile();
    void* const pages = mmap(nullptr, 4096, PROT_READ | PROT_WRITE, MAP_SHARED, fileno(file), 0);
    *static_cast<volatile char*>(pages) = 1;
}

CRASHES void DivideByZero() {
    volatile int zero = 0;
    volatile int result = 1000 / zero;
    (void)result;
}

CRASHES void RunNoInstruction() {
    __builtin_trap();
}

CRASHES int Deeper(volatile int* depth) {
    volatile char frame[4096];
    frame[0] = static_cast<char>(*depth);
    *depth = *depth + 1;
    return *depth > 0 ? Deeper(depth) + frame[0] : 0;
}

CRASHES void OverflowTheStack() {
    volatile int depth = 0;
    (void)Deeper(&depth);
}

inline void ThrowInAThread() {
    std::thread([] { throw std::runtime_error("nobody catches this"); }).join();
}

inline void EndByOthers() {
    (void)kill(getpid(), SIGSEGV);
    (void)pause();
}

struct Crash {
    const char* name;
    void (*happens)();
    int signal;
};

constexpr Crash kCrashes[] = {
    {"segfault", WriteToNowhere, SIGSEGV},   {"bus", WriteBehindAFile, SIGBUS},
    {"divide", DivideByZero, SIGFPE},        {"illegal", RunNoInstruction, SIGILL},
    {"overflow", OverflowTheStack, SIGSEGV}, {"abort", std::abort, SIGABRT},
    {"thread", ThrowInAThread, SIGABRT},     {"killed", EndByOthers, SIGSEGV},
};

// Leaves no core file.
inline void CrashBy(const std::string& name) {
    const struct rlimit none = {0, 0};
    (void)setrlimit(RLIMIT_CORE, &none);
    for (const Crash& crash : kCrashes) {
        if (name == crash.name) {
            crash.happens();
        }
    }
}

}  // namespace support

#undef CRASHES

#endif
