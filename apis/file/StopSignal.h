#ifndef APIS_FILE_STOPSIGNAL_H
#define APIS_FILE_STOPSIGNAL_H

#include <signal.h>

// How a background task is asked to stop: SIGTERM. From before the task's process
// is made until it is ready to notice, the signal is held back, so that it never
// ends the process without a result.

// Holds the signal back while it lives, in this process and those made meanwhile.
class HeldStop {
  public:
    HeldStop();
    ~HeldStop();
    HeldStop(const HeldStop&) = delete;
    HeldStop& operator=(const HeldStop&) = delete;

  private:
    sigset_t before_;
};

// For the task's process: from now on the signal interrupts what waits, and is
// remembered.
void NoticeStop();
bool IsStopAsked();

#endif
