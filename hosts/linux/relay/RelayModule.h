#ifndef TALO_HOSTS_LINUX_RELAY_RELAYMODULE_H
#define TALO_HOSTS_LINUX_RELAY_RELAYMODULE_H

#include <cstddef>
#include <cstdio>

// What the module talo-relay.so offers: the door to libcurl, opened only by a
// process that calls another appliance. Nothing throws, neither does what it calls
// back.
extern "C" {

// One HTTPS request and what comes of it. All texts are the owner's and stay until
// `over` is called; so does the call itself.
struct TaloRelayCall {
    const char* url;             // https, whatever it says
    const char* authority;       // file of certificates; "" for the system's
    const char* pin;             // "sha256//..."; "" for any key
    const char* const* headers;  // whole lines, a null pointer behind the last
    const char* form;            // the body, or null where it comes from `in`
    FILE* in;                    // read up to the body's size, never farther than a block
    long long bodySize;
    long seconds;    // for this call with all its repetitions; not above 0 for no limit
    long long most;  // bytes of an answer

    // Takes the next piece of an answer with status 200. 0 ends the call.
    int (*take)(TaloRelayCall* call, const char* bytes, size_t size);
    // Called when the call has ended, whatever came of it. With 1 it is made once
    // more as it then is, over the same connection where that still stands.
    int (*over)(TaloRelayCall* call);
    void* owner;

    int error;              // a talo::RelayError
    long status;            // HTTP, 0 without an answer
    char requestError[32];  // the answer's header of that name
    char problem[256];      // what libcurl says of a failure
};

struct TaloRelayModule {
    // Makes the calls, several at a time, until each is over.
    void (*perform)(TaloRelayCall* const* calls, size_t count);
};
}

constexpr char kRelayModuleFile[] = "talo-relay.so";
constexpr char kRelayModuleSymbol[] = "taloRelayModule";

#endif
