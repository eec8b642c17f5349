#ifndef TALO_SRC_ENTRY_RESTARTHTTPD_H
#define TALO_SRC_ENTRY_RESTARTHTTPD_H

namespace TALO {

// A callback: asks the service control to restart the web server. The argument
// is ignored.
void RestartHttpd(void* argument);

}  // namespace TALO

#endif
