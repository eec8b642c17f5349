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

struct Platform {
    std::map<std::string, std::string> files;            // path to content
    std::set<std::string> administrators;                // user names
    std::map<std::string, std::string> userPreference;   // user to folder
    std::map<std::string, std::string> groupPreference;  // group to folder
    std::string
        decipheredLine;  // what TaloCgiDetectAndDecryptParamLine leaves, "" for the line itself

    std::vector<ServiceCall> services;     // calls of TLIBNetService
    std::vector<std::string> unlinked;     // paths given to TLIBCSysUnlink
    std::vector<std::string> cookiesRead;  // HTTP_COOKIE at each TaloCgiLoadInCookies
    int openContexts = 0;                  // TaloCgiInit less TaloCgiFree
    std::vector<std::string> journal;      // every operation by name, in order

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
