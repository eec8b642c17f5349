#ifndef TESTS_FAKE_FAKERELAY_H
#define TESTS_FAKE_FAKERELAY_H

#include <json/json.h>

#include <cstdio>
#include <string>
#include <vector>

// The stand-in's calls of other appliances: nothing is sent, all of it is written
// down, and the script says how it went. Its operations are in the journal as
// "CredRequestMgr.Run" and the like; fake::Now().FailCall makes the queueing and
// the performing of calls fail by those names.
namespace fake {

// A queued call, of either kind.
struct RelayCall {
    bool streamed = false;  // queued by AddRelayRequest
    long long target = 0;
    std::string api;
    int version = 0;
    std::string method;
    Json::Value params;   // of a plain call
    Json::Value headers;  // of a streamed one, and its two files
    FILE* in = nullptr;
    FILE* out = nullptr;
    std::vector<long> timeouts;  // each that it was given
    std::string sent;            // what was read from `in`
};

struct RelayScript {
    int index = 0;           // that queueing answers
    bool hasRequest = true;  // whether GetRequest finds the call
    bool readsBody = true;   // whether Run reads the whole of `in`
    bool succeeds = true;    // what Run answers
    int error = 0;           // what GetError answers
    std::string response;    // what GetResponse answers for that index
    std::string throws;      // the operation that throws, "" none

    std::vector<RelayCall> calls;  // of all managers, in the order of their queueing
    int openManagers = 0;
};

// The script of this process, and what came of it.
RelayScript& Relay();

// Forgets both. Reset() does it too.
void ResetRelay();

}  // namespace fake

#endif
