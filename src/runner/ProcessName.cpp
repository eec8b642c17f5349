#include <sys/prctl.h>
#include <syslog.h>

#include <algorithm>
#include <cctype>
#include <cstddef>
#include <cstring>
#include <string>

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

// As the system shows it.
std::string UpToZero(const std::string& text) {
    return text.substr(0, text.find('\0'));
}

// API and method are the client's text: a line break in one must not begin a
// line of its own in the log.
std::string WithoutControls(std::string text) {
    std::replace_if(
        text.begin(), text.end(), [](unsigned char byte) { return std::iscntrl(byte) != 0; }, '?');
    return text;
}

// As much as there is room for.
template <size_t Size>
void Write(const std::string& text, char (&to)[Size]) {
    const size_t size = std::min(text.size(), Size - 1);
    std::memcpy(to, text.data(), size);
    to[size] = '\0';
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
    const std::string call =
        WithoutControls(UpToZero(api) + "[" + std::to_string(request->GetAPIVersion()) + "]." +
                        UpToZero(request->GetAPIMethod()));
    Write(WithoutControls(UpToZero(d->GetProcName())) + "_" + call, logIdentity);
    IdentifyToLog();
    d->SetArgv0(logIdentity);
    Write(call, taskName);
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
    Write(name, logIdentity);
    IdentifyToLog();
    Write(name, taskName);
    (void)prctl(PR_SET_NAME, taskName);
}

}  // namespace TALO
