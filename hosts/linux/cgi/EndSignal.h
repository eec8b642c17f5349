#ifndef TALO_HOSTS_LINUX_CGI_ENDSIGNAL_H
#define TALO_HOSTS_LINUX_CGI_ENDSIGNAL_H

#include <signal.h>

namespace host {

// Web servers end a program with SIGTERM when its client goes away. While this
// lives, the signal interrupts what waits instead of ending the process, so that
// half an upload can be removed; the process ends afterwards. A signal that
// somebody else handles or ignores is left alone. One at a time.
class EndSignal {
  public:
    EndSignal();
    ~EndSignal();  // which ends the process when the signal came
    EndSignal(const EndSignal&) = delete;
    EndSignal& operator=(const EndSignal&) = delete;

    static bool HasCome();

  private:
    struct sigaction before_;
    bool taken_;
};

}  // namespace host

#endif
