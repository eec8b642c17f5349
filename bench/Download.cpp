#include <fcntl.h>
#include <stdlib.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <functional>
#include <string>
#include <vector>

#include "Groups.h"
#include "Harness.h"
#include "platform/HTTPFileOutputer.h"

namespace bench {

namespace {

constexpr size_t kFileBytes = 256u << 20;

[[noreturn]] void Fail(const char* what) {
    std::perror(what);
    std::exit(1);
}

// A file of that size, in the page cache, gone at the end of the run.
class LargeFile {
  public:
    LargeFile() {
        const int file = mkostemp(&path_[0], O_CLOEXEC);
        const std::string block(1u << 20, 'x');
        for (size_t written = 0; file >= 0 && written < kFileBytes; written += block.size()) {
            if (write(file, block.data(), block.size()) != static_cast<ssize_t>(block.size())) {
                Fail("cannot write a large file");
            }
        }
        (void)close(file);
    }
    ~LargeFile() {
        (void)unlink(path_.c_str());
    }
    LargeFile(const LargeFile&) = delete;
    LargeFile& operator=(const LargeFile&) = delete;
    const std::string& Path() const {
        return path_;
    }

  private:
    std::string path_ = "/tmp/webapi-bench-XXXXXX";
};

// Runs `sender` in a process of its own, at the one end of a pipe, and reads the
// other end to its end. Both subjects pay for the same fork.
void ThroughPipe(const std::function<int()>& sender) {
    int ends[2];
    if (pipe2(ends, O_CLOEXEC) != 0) {
        Fail("pipe");
    }
    const pid_t child = fork();
    if (child == 0) {
        (void)dup2(ends[1], STDOUT_FILENO);
        _exit(sender());
    }
    (void)close(ends[1]);
    static std::vector<char> block(1u << 16);
    size_t total = 0;
    for (ssize_t got = 0; (got = read(ends[0], block.data(), block.size())) > 0;) {
        total += static_cast<size_t>(got);
    }
    (void)close(ends[0]);
    int status = -1;
    if (waitpid(child, &status, 0) != child || status != 0 || total < kFileBytes) {
        Fail("a sender failed");
    }
}

int RunCat(const std::string& path) {
    (void)execlp("cat", "cat", path.c_str(), nullptr);
    return 127;
}

int Download(const std::string& path) {
    return HTTPFileOutputer().Output(path.c_str(), "text/plain") == 0 ? 0 : 1;
}

}  // namespace

void Downloads() {
    const LargeFile file;
    (void)unsetenv("MOD_X_SENDFILE_ENABLED");
    (void)std::fflush(stdout);
    Compare("256 MiB into a pipe",
            {{"cat", [&] { ThroughPipe([&] { return RunCat(file.Path()); }); }},
             {"a download", [&] { ThroughPipe([&] { return Download(file.Path()); }); }}},
            7, 1);
    struct rusage usage = {};
    (void)getrusage(RUSAGE_CHILDREN, &usage);
    std::printf("  %-44s %10ld KiB\n\n", "most memory of a sender, the benchmark's own included",
                usage.ru_maxrss);
}

}  // namespace bench
