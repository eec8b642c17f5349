#include "hosts/linux/account/Backend.h"
#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/sdk/Nodes.h"
#include "hosts/linux/sdk/Sessions.h"
#include "platform/Cgi.h"

// The name alone would not do: it is the session that says who was let in. A
// session outlives its account only until somebody asks.
extern "C" int TaloCgiUIDGet(const char* sessionId, const char* userName) {
    if (sessionId == nullptr || userName == nullptr || *userName == '\0') {
        return -1;
    }
    return host::NoThrow(-1, [&] {
        talo::Session session;
        talo::Account account;
        return talo::FindSession(sessionId, &session) && session.user == userName &&
                       talo::FindAccount(userName, &account) &&
                       (session.node == 0 || talo::MayActFor(session.node, account))
                   ? static_cast<int>(account.uid)
                   : -1;
    });
}
