#ifndef TALO_PROGRAMS_WEBAPI_SERVER_FAREWELL_H
#define TALO_PROGRAMS_WEBAPI_SERVER_FAREWELL_H

#include <array>
#include <cstddef>

#include "programs/common/ErrorReply.h"
#include "programs/webapi_server/Poller.h"

// Ends connections that no worker answers. A web server that is still sending its
// request when the connection goes loses the reply: so what it sends is taken for a
// while. Nothing here waits, and no more than so many connections are kept.
class Farewell {
  public:
    explicit Farewell(const Poller& poller) : poller_(poller) {}
    ~Farewell();
    Farewell(const Farewell&) = delete;
    Farewell& operator=(const Farewell&) = delete;

    // Writes the reply, and closes the connection when the web server has it.
    void Say(int connection, ReplyStatus status, long long now);

    // The same for one that has its reply.
    void Close(int connection, long long now);

    void OnReadable(const Event& event);

    // Lets go of those that take too long.
    void Tick(long long now);

    bool IsEmpty() const {
        return kept_ == 0;
    }

  private:
    static constexpr size_t kMost = 64;
    struct Kept {
        int connection = -1;
        unsigned serial = 0;
        long long until = 0;
        size_t taken = 0;
    };

    void Keep(int connection, long long now);
    void LetGo(Kept& kept);

    const Poller& poller_;
    std::array<Kept, kMost> all_;
    size_t next_ = 0;
    size_t kept_ = 0;
    unsigned serial_ = 0;
};

#endif
