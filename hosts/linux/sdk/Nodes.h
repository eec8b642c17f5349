#ifndef TALO_HOSTS_LINUX_SDK_NODES_H
#define TALO_HOSTS_LINUX_SDK_NODES_H

#include <string>
#include <vector>

#include "hosts/linux/sdk/Accounts.h"
#include "platform/Platform.h"

// The other appliances that this one knows: how it reaches them, and what they may
// do here. The two are settled apart: who may be called may not call back for
// that. Nothing throws; outputs stay untouched on failure.
namespace talo {

// An appliance, by a number above 0 that this one knows it by.
struct Node {
    long long id = 0;

    // How it is reached; empty when it is not called from here.
    std::string url;        // of its entry: "https://nas2.local/webapi/entry.cgi"
    std::string authority;  // file of the certificates that its own is checked against;
                            // "" for the system's
    std::string pin;        // "sha256//" and the base64 of the SHA-256 of its public key:
                            // it has to show that one too; "" for any
    long long self = 0;     // what it knows this appliance by
    std::string secret;     // what this appliance proves that with

    // What it may do here; empty when it may not call.
    std::string secretHash;            // SHA-256 of the secret it has to show, hexadecimal
    std::vector<std::string> classes;  // of the users that it may act for: "normal.local"
};

// One appliance, and all of them in the order of their ids. A file that is not
// there has none; one that cannot be read or that others than its owner can
// change answers false, logged.
TALO_PLATFORM bool FindNode(long long id, Node* node);
TALO_PLATFORM bool ListNodes(std::vector<Node>* nodes);

// Changes to the file of appliances. Each is atomic. SetNode replaces one of the
// same id. An appliance that is removed, or gets another secret to show, loses its
// sessions here. False with `problem` in words when it cannot be done.
TALO_PLATFORM bool SetNode(const Node& node, std::string* problem);
TALO_PLATFORM bool RemoveNode(long long id, std::string* problem);

// A secret of 256 random bits, and what a file may hold in its place.
TALO_PLATFORM bool NewNodeSecret(std::string* secret, std::string* hash);

// Whether `secret` is what the appliance `id` has to show. False for one that is
// not known or may not call.
TALO_PLATFORM bool ProvesNode(long long id, const std::string& secret);

// Whether the appliance may act for the account as things stand now: it is known,
// the account is not locked, and its class is among those that it was granted.
TALO_PLATFORM bool MayActFor(long long id, const Account& account);

// Why a call of another appliance failed; 0 for none. CredRequestMgr::GetError
// answers these numbers.
enum class RelayError {
    kNone = 0,
    kUnknownNode = 1,  // no such appliance, or it is not called from here
    kUnavailable = 2,  // the library, the file of appliances or memory is missing
    kTooManyHops = 3,  // the call came over too many appliances already
    kNoCaller = 4,     // no session says for whom to call
    kNotReached = 5,   // no address, no connection, or none in time
    kNotTrusted = 6,   // its certificate or its key is not what it should be
    kTimedOut = 7,     // no whole answer in time
    kBroken = 8,       // the connection ended in the middle of the call
    kTooLong = 9,      // the answer is longer than the limit
    kStatus = 10,      // it answered with an HTTP status other than 200
    kRefused = 11,     // it does not let this appliance act for the caller
    kBadBody = 12,     // the body that should be sent on ended too early
};

// In words, for a log or a terminal.
TALO_PLATFORM const char* RelayErrorText(RelayError error);

// Calls the appliance as it would be called for a user: it is reached, trusted,
// and lets this appliance act for that user.
TALO_PLATFORM RelayError TestNode(long long id, const std::string& user);

}  // namespace talo

#endif
