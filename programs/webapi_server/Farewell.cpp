#include "programs/webapi_server/Farewell.h"

#include <errno.h>
#include <sys/socket.h>
#include <unistd.h>

namespace {

constexpr long long kMostMilliseconds = 2000;
constexpr size_t kMostTaken = 64u << 20;

// What came of a look at what the web server sends.
enum class Rest { kNothingYet, kSome, kEnd };

Rest TakeSome(int connection, size_t* taken) {
    static char discarded[64 * 1024];
    const ssize_t got = recv(connection, discarded, sizeof discarded, MSG_DONTWAIT);
    if (got > 0) {
        *taken += static_cast<size_t>(got);
        return Rest::kSome;
    }
    return got < 0 && (errno == EAGAIN || errno == EINTR) ? Rest::kNothingYet : Rest::kEnd;
}

}  // namespace

Farewell::~Farewell() {
    for (Kept& kept : all_) {
        LetGo(kept);
    }
}

void Farewell::Say(int connection, ReplyStatus status, long long now) {
    const ErrorReply reply = ReplyFor(status);
    // It fits the buffer of a connection that nobody wrote to.
    (void)send(connection, reply.text, reply.size, MSG_DONTWAIT | MSG_NOSIGNAL);
    (void)shutdown(connection, SHUT_WR);
    Keep(connection, now);
}

void Farewell::Close(int connection, long long now) {
    (void)shutdown(connection, SHUT_WR);
    size_t taken = 0;
    if (TakeSome(connection, &taken) == Rest::kSome) {
        Keep(connection, now);
        return;
    }
    (void)close(connection);
}

void Farewell::Keep(int connection, long long now) {
    Kept& kept = all_[next_];
    LetGo(kept);  // the oldest
    kept = {connection, ++serial_, now + kMostMilliseconds, 0};
    if (!poller_.Add(connection, {Source::kFarewell, static_cast<int>(next_), serial_})) {
        (void)close(connection);
        kept.connection = -1;
        return;
    }
    ++kept_;
    next_ = (next_ + 1) % all_.size();
}

void Farewell::OnReadable(const Event& event) {
    Kept& kept = all_[static_cast<size_t>(event.index) % all_.size()];
    if (kept.connection < 0 || kept.serial != event.serial) {
        return;
    }
    if (TakeSome(kept.connection, &kept.taken) == Rest::kEnd || kept.taken > kMostTaken) {
        LetGo(kept);
    }
}

void Farewell::Tick(long long now) {
    for (Kept& kept : all_) {
        if (kept.connection >= 0 && now >= kept.until) {
            LetGo(kept);
        }
    }
}

void Farewell::LetGo(Kept& kept) {
    if (kept.connection < 0) {
        return;
    }
    poller_.Remove(kept.connection);
    (void)close(kept.connection);
    kept.connection = -1;
    --kept_;
}
