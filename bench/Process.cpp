#include <cstdio>

#include "BenchLogin.h"
#include "Groups.h"
#include "Harness.h"
#include "Spawn.h"

namespace bench {

// A whole request is the one under a session: description, library, session file and
// account are read for it.
void ProcessStart() {
    const Login login;
    if (!login.IsReady()) {
        std::fprintf(stderr, "no session could be made\n");
        return;
    }
    const auto ping = Get("api=TALO.System&version=1&method=ping&text=hi");
    const auto info = Get("api=TALO.System&version=2&method=info", login.Id());
    Compare("A whole process",
            {{"bare C++ program with the JSON library", [] { RunProcess(BARE_PROGRAM, {}); }},
             {"entry.cgi answering ping", [&] { RunProcess(kEntry, ping); }},
             {"entry.cgi answering info under a session", [&] { RunProcess(kEntry, info); }}},
            201, 5);
}

}  // namespace bench
