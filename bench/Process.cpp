#include "Groups.h"
#include "Harness.h"
#include "Spawn.h"

namespace bench {

void ProcessStart() {
    const auto ping = Get("api=TALO.System&version=1&method=ping&text=hi");
    Compare("A whole process",
            {{"bare C++ program with the JSON library", [] { RunProcess(BARE_PROGRAM, {}); }},
             {"entry.cgi answering ping", [&] { RunProcess(kEntry, ping); }}},
            201, 5);
}

}  // namespace bench
