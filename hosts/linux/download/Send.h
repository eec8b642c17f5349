#ifndef TALO_HOSTS_LINUX_DOWNLOAD_SEND_H
#define TALO_HOSTS_LINUX_DOWNLOAD_SEND_H

#include <signal.h>

#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>

namespace host {

// Standard output for what is too large to be buffered. As long as it lives, a
// client that has gone is an error and no signal, and the descriptor waits
// instead of refusing. Every operation answers false when the client has gone or
// the content ended early; the rest of the answer is then of no use.
class ClientStream {
  public:
    ClientStream();
    ~ClientStream();
    ClientStream(const ClientStream&) = delete;
    ClientStream& operator=(const ClientStream&) = delete;

    // Writes behind whatever std::cout and stdout still hold.
    bool WriteHeader(const std::string& text);

    bool Write(const char* bytes, size_t size);

    // Writes exactly these bytes of a regular file, wherever its position stands.
    bool WriteFile(int file, uint64_t first, uint64_t length);

    // Writes what the file still holds, up to its end.
    bool WriteRest(FILE* file);

  private:
    char* Block();

    std::unique_ptr<char[]> block_;
    sigset_t before_;
    bool blocked_ = false;  // whether SIGPIPE is held back by us
    int flags_ = -1;        // the descriptor's, when they are to be put back
};

}  // namespace host

#endif
