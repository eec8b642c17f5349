#include <sys/prctl.h>
#include <syslog.h>

#include <cctype>
#include <cstdio>

#include "src/base/ErrorCode.h"
#include "src/base/Log.h"
#include "src/runner/APIRunnerPrivate.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APIRunner.h"

namespace TALO {

namespace {

// openlog keeps the pointer, so the names live as long as the process.
char logIdentity[1024];
char taskName[17];

// API and method are the client's text: a line break in one must not begin a
// line of its own in the log.
void ReplaceControls(char* text) {
    for (; *text != '\0'; ++text) {
        if (std::iscntrl(static_cast<unsigned char>(*text))) {
            *text = '?';
        }
    }
}

void IdentifyToLog() {
    closelog();
    openlog(logIdentity, LOG_PID | LOG_CONS, 0);
}

}  // namespace

int APIRunner::SetProcessName(APIRequest* request, APIResponse* response) {
    const std::string api = request->GetAPIClass();
    if (api.empty()) {
        response->SetError(kErrorBadRequest, Json::Value());
        return 0;
    }
    const std::string method = request->GetAPIMethod();
    const int version = request->GetAPIVersion();
    (void)snprintf(logIdentity, sizeof logIdentity, "%s_%s[%d].%s", d->GetProcName().c_str(),
                   api.c_str(), version, method.c_str());
    ReplaceControls(logIdentity);
    IdentifyToLog();
    d->SetArgv0(logIdentity);
    (void)snprintf(taskName, sizeof taskName, "%s[%d].%s", api.c_str(), version, method.c_str());
    ReplaceControls(taskName);
    if (prctl(PR_SET_NAME, taskName) != 0) {
        response->SetError(kErrorProcessName, Json::Value());
        LOG_ERROR("Set process name fail[%m]");
        return 0;
    }
    return 1;
}

void APIRunner::SetArgs(int argc, char** argv) {
    d->SetArgs(argc, argv);
}

void RestoreProcessName(APIRunnerPrivate* d) {
    const std::string& name = d->GetOrigProcName();
    d->SetArgv0(name);
    d->LeaveArgv0();
    (void)snprintf(logIdentity, sizeof logIdentity, "%s", name.c_str());
    IdentifyToLog();
    (void)snprintf(taskName, sizeof taskName, "%s", name.c_str());
    (void)prctl(PR_SET_NAME, taskName);
}

}  // namespace TALO
