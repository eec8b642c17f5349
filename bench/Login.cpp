#include <cstdio>
#include <string>

#include "BenchLogin.h"
#include "Groups.h"
#include "Harness.h"
#include "Spawn.h"

namespace bench {

namespace {

std::string Compound(int elements) {
    std::string query = "api=TALO.Entry.Request&version=1&method=request&compound=[";
    for (int element = 0; element < elements; ++element) {
        query += element == 0 ? "" : ",";
        query += R"({"api":"TALO.System","version":2,"method":"info"})";
    }
    return query + "]";
}

}  // namespace

void Sessions() {
    const Login login;
    if (!login.IsReady()) {
        std::fprintf(stderr, "no session could be made\n");
        return;
    }
    const auto ping = Get("api=TALO.System&version=2&method=ping");
    const auto info = Get("api=TALO.System&version=2&method=info", login.Id());
    Compare("What a session check costs",
            {{"ping, no session", [&] { RunProcess(kEntry, ping); }},
             {"info under a session", [&] { RunProcess(kEntry, info); }}},
            101, 5);
    const auto one = Get(Compound(1), login.Id());
    const auto eleven = Get(Compound(11), login.Id());
    const auto hundred = Get(Compound(101), login.Id());
    Compare("Elements of a compound request",
            {{"1 element", [&] { RunProcess(kEntry, one); }},
             {"11 elements", [&] { RunProcess(kEntry, eleven); }},
             {"101 elements", [&] { RunProcess(kEntry, hundred); }}},
            51, 5);
}

}  // namespace bench
