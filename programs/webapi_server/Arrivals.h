#ifndef TALO_PROGRAMS_WEBAPI_SERVER_ARRIVALS_H
#define TALO_PROGRAMS_WEBAPI_SERVER_ARRIVALS_H

enum class Arrival {
    kClient,  // perhaps; another may have been quicker
    kOrder,   // of the master's, or it is gone
    kNone,    // the wait has failed
};

// Where a worker waits for clients and orders at once. Of all who wait for the same
// clients the one that has stood in line longest is woken: the memory of its last
// request is the nearest.
class Arrivals {
  public:
    Arrivals(int listener, int control);
    ~Arrivals();
    Arrivals(const Arrivals&) = delete;
    Arrivals& operator=(const Arrivals&) = delete;

    // From then on it has its place. False when nobody can be waited for.
    bool StandInLine();

    // Behind StandInLine.
    Arrival Await() const;

    // What a child must not keep.
    int Descriptor() const {
        return epoll_;
    }

  private:
    bool Add(int descriptor, unsigned events) const;

    const int listener_;
    const int control_;
    const int epoll_;
    bool isInLine_ = false;
};

#endif
