#ifndef TALO_PROGRAMS_WEBAPI_SERVER_LISTEN_H
#define TALO_PROGRAMS_WEBAPI_SERVER_LISTEN_H

#include <sys/types.h>

#include <string>

// The UNIX socket that the web server connects to.
class Listener {
  public:
    Listener() = default;
    ~Listener();
    Listener(const Listener&) = delete;
    Listener& operator=(const Listener&) = delete;

    // Makes the socket, which its owner and group may use. One that nobody listens on
    // any more is replaced; one that is in use, or that is no socket, is refused.
    // False with a problem.
    bool Make(const std::string& path, int backlog, std::string* problem);

    // Takes one that was made by another, who removes it too.
    bool Adopt(int descriptor, std::string* problem);

    int Get() const {
        return descriptor_;
    }
    bool IsOwn() const {
        return !path_.empty();
    }

    // Takes the name away, so that no one can connect any more. Who has, can be
    // accepted still.
    void Unlink();

    void Close();

  private:
    int descriptor_ = -1;
    std::string path_;
    dev_t device_ = 0;
    ino_t number_ = 0;
};

#endif
