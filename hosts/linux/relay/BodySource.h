#ifndef TALO_HOSTS_LINUX_RELAY_BODYSOURCE_H
#define TALO_HOSTS_LINUX_RELAY_BODYSOURCE_H

#include <cstddef>
#include <cstdio>

namespace host {

// A body of known size that is read from a stream piece by piece. A pipe or a
// socket is only read when it has something, so that whoever feeds it slowly keeps
// nobody else waiting. What was taken out of the stream is what Read gave out.
class BodySource {
  public:
    BodySource(FILE* in, long long size);

    enum Result { kWait = -1, kEnd = 0 };

    // Up to `most` bytes: their number; kWait when there are none yet, kEnd behind
    // the last one, or when the stream ended before it.
    long Read(char* to, size_t most);

    bool IsWhole() const {
        return left_ == 0;
    }

    // What to wait for when Read says so.
    int Descriptor() const {
        return descriptor_;
    }

  private:
    FILE* in_;
    long long left_;
    int descriptor_;
    bool waits_;  // a read of the descriptor may take its time
};

}  // namespace host

#endif
