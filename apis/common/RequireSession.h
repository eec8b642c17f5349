#ifndef APIS_COMMON_REQUIRESESSION_H
#define APIS_COMMON_REQUIRESESSION_H

namespace TALO {
class APIRequest;
class APIResponse;
}  // namespace TALO

// What a method does to the session that it needs.
enum class SessionUse {
    kRenew,         // an ordinary call: counts as a use
    kLook,          // does not keep the session alive
    kEvenTimedOut,  // a session that has timed out will do, and stays so
};

// For an API that as a whole needs no login, the check of a method that does.
// Gives the request the facts of its session. False with the error set on the
// response, as if the framework had refused the call.
bool RequireSession(TALO::APIRequest* request, TALO::APIResponse* response, SessionUse use);

#endif
