#ifndef APIS_SESSION_SESSION_H
#define APIS_SESSION_SESSION_H

namespace TALO {
class APIRequest;
class APIResponse;
}  // namespace TALO

// Codes of TALO.Session.
enum SessionError {
    kBadParameter = 400,     // "errors" names the parameter
    kWrongLogin = 401,       // account or password; which of them is not told
    kAccountLocked = 402,    // the password was right
    kWaitFirst = 403,        // "errors" is {"wait": seconds}
    kPasswordExpired = 404,  // the password was right
    kNoAccounts = 405,       // the accounts, or the sessions, cannot be used
    kNoSuchSession = 406,    // no session of that handle, or not the caller's to end
    kNoCipher = 407,         // the appliance has no key, or no cipher
};

// Log in: "account", "passwd", optional "remember" (boolean) and "client_time"
// (seconds since the epoch on the browser's clock).
void Open(TALO::APIRequest* request, TALO::APIResponse* response);

// Log out, renew the session, and tell about it.
void Close(TALO::APIRequest* request, TALO::APIResponse* response);
void Renew(TALO::APIRequest* request, TALO::APIResponse* response);
void Info(TALO::APIRequest* request, TALO::APIResponse* response);

// The caller's sessions, or everybody's for an administrator; end one by its
// "handle".
void List(TALO::APIRequest* request, TALO::APIResponse* response);
void End(TALO::APIRequest* request, TALO::APIResponse* response);

// What a client needs to encipher its parameters, the password of Open included.
void Cipher(TALO::APIRequest* request, TALO::APIResponse* response);

// The check of every method but Open and Cipher: the API as a whole needs no login,
// since Open cannot have one.
int CheckSession(TALO::APIRequest* request, TALO::APIResponse* response);

#endif
