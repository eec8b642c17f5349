#include "src/entry/RestartHttpd.h"

#include "platform/System.h"

namespace TALO {

void RestartHttpd(void*) {
    (void)TLIBNetService(TALO_SERVICE_HTTPD, TALO_SERVICE_RESTART, 0);
}

}  // namespace TALO
