#ifndef TALO_HOSTS_LINUX_SDK_SESSIONS_H
#define TALO_HOSTS_LINUX_SDK_SESSIONS_H

#include <string>
#include <vector>

#include "platform/Platform.h"

// The login sessions of a Debian host: one file each, named by its id, in a
// folder that only the web API's user may enter. Nothing throws; outputs stay
// untouched on failure.
namespace talo {

struct Session {
    std::string user;
    std::string address;       // of the client that logged in
    std::string language;      // "" for the default
    std::string application;   // "" for the administration interface
    std::string privilege;     // web-API privilege text
    int timeout = 0;           // minutes without use, 0 for the appliance's default
    bool skipAddress = false;  // not bound to the address
    long long node = 0;        // the appliance that acts for the user, 0 for none
    std::string handle;        // names the session to others than its owner; no secret
    long long created = 0;     // seconds since the epoch
    long long lastUse = 0;     // seconds since the epoch
};

// Minutes without use after which a session ends that says nothing else.
TALO_PLATFORM int DefaultTimeout();

// Whether the request of this process comes from the appliance's own pages, or
// from a client that is no browser.
TALO_PLATFORM bool ComesFromOwnSite();

// Whether a text has the form of an id: it may then be a part of a path.
TALO_PLATFORM bool IsSessionId(const std::string& id);

// Begins a session; id, handle, created and lastUse are made here. The id is
// 256 random bits and a secret of the client.
TALO_PLATFORM bool CreateSession(const Session& session, std::string* id);

TALO_PLATFORM bool FindSession(const std::string& id, Session* session);

// Sets the last use to now. False when there is no such session. The second form is
// for who has found it in the same request already, and spares another look.
TALO_PLATFORM bool RenewSession(const std::string& id);
TALO_PLATFORM bool RenewSession(const std::string& id, Session* found);

// Ends a session, by its id or by its handle.
TALO_PLATFORM bool EndSession(const std::string& id);
TALO_PLATFORM bool EndSessionByHandle(const std::string& handle);

// All sessions that have not timed out, in the order of their creation; the
// ones that have are removed on the way.
TALO_PLATFORM std::vector<Session> ListSessions();

}  // namespace talo

#endif
