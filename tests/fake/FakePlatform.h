#ifndef TESTS_FAKE_FAKEPLATFORM_H
#define TESTS_FAKE_FAKEPLATFORM_H

#include <json/json.h>

#include <map>
#include <set>
#include <string>
#include <vector>

// A stand-in for the appliance's platform that lives in memory. A test writes
// its files, names its administrators, makes the Nth call of an operation fail,
// and looks at what was asked for. Text functions follow the host's own rules.
namespace fake {

struct ServiceCall {
    int service;
    int action;
    int flags;
};

struct Session {
    std::string user;
    int result = 1;          // what the check answers
    int timeoutAllowed = 1;  // what it answers when timed-out sessions count
    std::map<int, std::string> options;
    std::string language = "enu";
    std::string file;  // what the context then names as the session's file
};

struct AuthCall {
    std::string sessionId;
    int checkMask;
    int allowTimeout;
    size_t nameSize;
    bool nameWasZero;
    int flags;
};

struct OptionCall {
    int option;
    std::string fallback;  // "(null)" for none
};

struct RemoteCall {
    size_t size;
    bool bufferWasZero;
};

struct UidCall {
    std::string sessionId;
    std::string user;
};

struct ContextCall {
    int timeout;
    int allowTimeout;
    std::string userClass;
    std::string prefix;
};

struct PrivilegeCall {
    std::string user;
    std::string privilege;
    std::string remoteIP;
};

struct TouchCall {
    std::string path;
    int now;
    long when;
};

struct Platform {
    std::map<std::string, std::string> files;            // path to content
    std::set<std::string> administrators;                // user names
    std::map<std::string, std::string> userPreference;   // user to folder
    std::map<std::string, std::string> groupPreference;  // group to folder
    std::string
        decipheredLine;  // what TaloCgiDetectAndDecryptParamLine leaves, "" for the line itself

    std::map<std::string, Session> sessions;  // by id
    std::string sessionDir = "/session";
    int defaultTimeout = 30;
    int skipIPCheck = 0;
    int configuredTimeout = 15;        // TLIBCConfGetORBTimeout
    std::string remoteAddress;         // "" makes TaloCgiGetRemoteIP fail
    std::map<std::string, int> uids;   // user to id
    std::set<std::string> privileges;  // "user/privilege"

    std::vector<AuthCall> authCalls;            // calls of TaloCgiIsAuthorizedEx
    std::vector<ContextCall> contextCalls;      // calls of TaloCgiInitEx
    std::vector<OptionCall> optionCalls;        // calls of TaloCgiGetOption
    std::vector<RemoteCall> remoteCalls;        // calls of TaloCgiGetRemoteIP
    std::vector<UidCall> uidCalls;              // calls of TaloCgiUIDGet
    std::vector<PrivilegeCall> privilegeCalls;  // calls of TLIBAppPrivUserHas
    std::vector<TouchCall> touched;             // calls of TLIBCFileUTime
    std::vector<ServiceCall> services;          // calls of TLIBNetService
    std::vector<std::string> unlinked;          // paths given to TLIBCSysUnlink
    std::vector<std::string> cookiesRead;       // HTTP_COOKIE at each TaloCgiLoadInCookies
    int openContexts = 0;                       // TaloCgiInit less TaloCgiFree
    std::vector<std::string> journal;           // every operation by name, in order

    std::map<std::string, int> calls;   // operation to number of calls
    std::map<std::string, int> failAt;  // operation to the call that fails, counted from 1

    // Makes the Nth call from now of an operation fail, by its name.
    void FailCall(const std::string& operation, int nth);

    // Writes a JSON document as a file.
    void WriteJson(const std::string& path, const Json::Value& document);

    // Counts a call; true when this one is to fail.
    bool Called(const std::string& operation);
};

// The platform of this process.
Platform& Now();

// Back to an empty machine.
void Reset();

}  // namespace fake

#endif
