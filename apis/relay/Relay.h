#ifndef APIS_RELAY_RELAY_H
#define APIS_RELAY_RELAY_H

namespace TALO {
class APIRequest;
class APIResponse;
}  // namespace TALO

// The one code of TALO.Relay. Which of the reasons it was is only logged: who has
// no right here learns nothing about appliances and accounts.
enum RelayOpenError { kRefused = 500 };

// Begins a session for "user" that the appliance "node", which proves with "secret"
// to be it, then acts under; "lang" (optional) is the user's language. The session
// counts as long as the appliance may act for the account.
void Open(TALO::APIRequest* request, TALO::APIResponse* response);

#endif
