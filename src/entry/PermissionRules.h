#ifndef TALO_SRC_ENTRY_PERMISSIONRULES_H
#define TALO_SRC_ENTRY_PERMISSIONRULES_H

namespace TALO {

class APIRequest;

// What TaloCgiIsAuthorizedEx answers, and what stands for "not asked".
enum SessionResult {
    kSessionTimedOut = -1,
    kSessionClientChanged = -3,
    kSessionNotGiven = -5,
    kSessionUser = 1,
    kSessionAdministrator = 2,
};

// Every check that there is.
constexpr int kCheckAll = 15;

// A login name with its end.
constexpr int kLoginNameSize = 493;

// Whether the user holds the application privilege that the API of the request
// asks for; true when it asks for none.
bool HoldsAppPrivilege(APIRequest* request, const char* userName);

}  // namespace TALO

#endif
