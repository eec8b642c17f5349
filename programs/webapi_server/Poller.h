#ifndef TALO_PROGRAMS_WEBAPI_SERVER_POLLER_H
#define TALO_PROGRAMS_WEBAPI_SERVER_POLLER_H

enum class Source : unsigned char {
    kListener,
    kSignals,
    kTemplate,  // its control socket
    kControl,   // of a worker
    kProcess,   // a worker ended
    kFarewell,  // a connection that was answered here
};

// Whose descriptor has something to tell. The serial tells a new owner of an index
// from the one before, of which an event may be under way still.
struct Event {
    Source source;
    int index;
    unsigned serial;
};

// epoll, with events in the master's own terms. Level-triggered.
class Poller {
  public:
    Poller();
    ~Poller();
    Poller(const Poller&) = delete;
    Poller& operator=(const Poller&) = delete;

    bool Add(int descriptor, Event event) const;

    // Tells of it only while nobody waits who has added the same one like this before.
    bool AddLastInLine(int descriptor, Event event) const;

    // Needed before a close: while another process holds it too, the descriptor
    // would go on to be watched.
    void Remove(int descriptor) const;

    // The number of events; 0 after so many milliseconds or a signal.
    int Wait(Event* events, int most, int milliseconds) const;

  private:
    bool Add(int descriptor, Event event, unsigned events) const;

    int epoll_;
};

#endif
