#include <fcntl.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "BenchLogin.h"
#include "Groups.h"
#include "Spawn.h"
#include "platform/System.h"

namespace bench {

namespace {

constexpr size_t kBlock = 1 << 20;
constexpr size_t kDefaultMebibytes = 1024;
constexpr int kRounds = 5;
const char kBoundary[] = "----------------------------bench5e91c07b2d";

struct Run {
    double seconds = 0;
    long peakKibibytes = 0;
};

[[noreturn]] void GiveUp(const char* what) {
    perror(what);
    std::exit(1);
}

// The size of the file, in mebibytes: of the variable BENCH_MEBIBYTES.
size_t Mebibytes() {
    const char* text = getenv("BENCH_MEBIBYTES");
    char* end = nullptr;
    const unsigned long number = text != nullptr ? std::strtoul(text, &end, 10) : 0;
    return number > 0 && *end == '\0' && number <= 1 << 20 ? number : kDefaultMebibytes;
}

bool WriteAll(int to, const char* data, size_t size) {
    for (size_t written = 0; written < size;) {
        const ssize_t put = write(to, data + written, size - written);
        if (put <= 0) {
            return false;
        }
        written += static_cast<size_t>(put);
    }
    return true;
}

// Feeds a form with one file of noise, the same block again and again.
[[noreturn]] void Feed(int to, const std::string& head, const std::string& tail, size_t mebibytes) {
    static char block[kBlock];
    unsigned state = 1;
    for (char& byte : block) {
        state = state * 1664525 + 1013904223;
        byte = static_cast<char>(state >> 24);
    }
    bool good = WriteAll(to, head.data(), head.size());
    for (size_t count = 0; good && count < mebibytes; ++count) {
        good = WriteAll(to, block, kBlock);
    }
    _exit(good && WriteAll(to, tail.data(), tail.size()) ? 0 : 1);
}

int Output(const std::string& path) {
    const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
    if (file < 0) {
        GiveUp(path.c_str());
    }
    return file;
}

pid_t Fork() {
    const pid_t child = fork();
    if (child < 0) {
        GiveUp("fork");
    }
    return child;
}

// Runs a program between the feeding pipe and a file.
Run RunFed(const char* const* program, const std::vector<std::string>& environment,
           const std::string& output, const std::string& head, const std::string& tail,
           size_t mebibytes, bool removes) {
    int ends[2];
    if (pipe2(ends, O_CLOEXEC) != 0) {
        GiveUp("pipe");
    }
    const int file = Output(output);
    const auto start = std::chrono::steady_clock::now();
    const pid_t reader = Fork();
    if (reader == 0) {
        std::vector<char*> variables;
        variables.reserve(environment.size() + 1);
        for (const std::string& variable : environment) {
            variables.push_back(const_cast<char*>(variable.c_str()));
        }
        variables.push_back(nullptr);
        (void)dup2(ends[0], STDIN_FILENO);
        (void)dup2(file, STDOUT_FILENO);
        (void)execve(program[0], const_cast<char* const*>(program), variables.data());
        _exit(1);
    }
    const pid_t feeder = Fork();
    if (feeder == 0) {
        Feed(ends[1], head, tail, mebibytes);
    }
    (void)close(ends[0]);
    (void)close(ends[1]);
    (void)close(file);
    struct rusage usage = {};
    int readerStatus = -1;
    int feederStatus = -1;
    if (wait4(reader, &readerStatus, 0, &usage) != reader ||
        waitpid(feeder, &feederStatus, 0) != feeder || readerStatus != 0 || feederStatus != 0) {
        std::fprintf(stderr, "%s did not take the file\n", program[0]);
        std::exit(1);
    }
    if (removes) {
        (void)unlink(output.c_str());
    }
    const std::chrono::duration<double> time = std::chrono::steady_clock::now() - start;
    return {time.count(), usage.ru_maxrss};
}

// The entry reads the whole body before the method finds that there is no such
// share, which is its code 401.
void CheckReply(const std::string& path) {
    char reply[4096] = "";
    FILE* file = fopen(path.c_str(), "re");
    if (file != nullptr) {
        reply[fread(reply, 1, sizeof reply - 1, file)] = '\0';
        (void)fclose(file);
    }
    if (std::strstr(reply, "\"code\":401") == nullptr) {
        std::fprintf(stderr, "the upload was refused: %s\n", reply);
        std::exit(1);
    }
}

// Where the entry puts the upload, so that both write to one file system.
std::string UploadFolder(size_t mebibytes) {
    TALOVOLUME volume = {};
    int status = -1;
    const unsigned long long needed = (mebibytes + 6) * kBlock;
    return VolumeAvailGet(needed, &volume, &status, 1) == 1 ? volume.mountPath : "/tmp";
}

double Median(std::vector<double> values) {
    std::sort(values.begin(), values.end());
    return values[values.size() / 2];
}

}  // namespace

// Both files are removed within the time: the entry removes its own.
void Uploads() {
    const Login login;
    const size_t mebibytes = Mebibytes();
    const std::string stem = UploadFolder(mebibytes) + "/bench-" + std::to_string(getpid());
    const std::string copy = stem + ".copy";
    const std::string reply = stem + ".reply";
    const std::string dashes = std::string("--") + kBoundary;
    const std::string head = dashes +
                             "\r\nContent-Disposition: form-data; name=\"file\"; "
                             "filename=\"large.bin\"\r\n\r\n";
    const std::string tail = "\r\n" + dashes + "--\r\n";
    std::vector<std::string> environment =
        Get("api=TALO.File&version=1&method=upload&path=/no-such-share", login.Id());
    environment[0] = "REQUEST_METHOD=POST";
    environment.push_back(std::string("CONTENT_TYPE=multipart/form-data; boundary=") + kBoundary);
    environment.push_back("CONTENT_LENGTH=" +
                          std::to_string(head.size() + mebibytes * kBlock + tail.size()));
    const char* const cat[] = {"/bin/cat", nullptr};
    const char* const entry[] = {kEntry, nullptr};

    std::vector<double> plain;
    std::vector<double> uploaded;
    long peak = 0;
    for (int round = 0; round < kRounds; ++round) {
        plain.push_back(RunFed(cat, {}, copy, head, tail, mebibytes, true).seconds);
        const Run run = RunFed(entry, environment, reply, head, tail, mebibytes, false);
        CheckReply(reply);
        uploaded.push_back(run.seconds);
        peak = std::max(peak, run.peakKibibytes);
    }
    (void)unlink(reply.c_str());
    const double size = static_cast<double>(mebibytes);
    std::printf("An upload of %zu MiB out of a pipe\n", mebibytes);
    std::printf("  %-44s %10.0f MiB/s\n", "cat > file, and its removal", size / Median(plain));
    std::printf("  %-44s %10.0f MiB/s  %6.2f of it\n", "entry.cgi", size / Median(uploaded),
                Median(plain) / Median(uploaded));
    std::printf("  %-44s %10.1f MiB\n\n", "peak resident memory of entry.cgi",
                static_cast<double>(peak) / 1024);
}

}  // namespace bench
