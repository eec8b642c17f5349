#ifndef TALO_PROGRAMS_WEBAPI_SERVER_ORPHANS_H
#define TALO_PROGRAMS_WEBAPI_SERVER_ORPHANS_H

#include "programs/webapi_server/SlotTable.h"

// Looks after the workers of a master that is gone, in place of it, as long as there
// are any with a request: they serve it to its end, but no longer than they may.
void WatchOrphans(const SlotTable& slots);

#endif
