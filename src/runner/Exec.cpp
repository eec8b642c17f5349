#include <fcntl.h>
#include <unistd.h>

#include <cstdlib>
#include <string>

#include "platform/Paths.h"
#include "platform/System.h"
#include "src/base/ErrorCode.h"
#include "src/base/Guarded.h"
#include "src/runner/APIRunnerPrivate.h"
#include "webapi/APIRunner.h"

namespace TALO {

namespace {

const char kUserVariable[] = "TALO_WEBAPI_USERNAME";

// Works in the web API directory as long as it lives.
class WebAPIDirectory {
  public:
    WebAPIDirectory() : before(open(".", O_PATH | O_DIRECTORY | O_CLOEXEC)) {
        if (chdir(TALO_WEBAPI_DIR) != 0) {
            LOG_ERROR("cannot work in %s: %m", TALO_WEBAPI_DIR);
        }
    }
    ~WebAPIDirectory() {
        if (before >= 0) {
            if (fchdir(before) != 0) {
                LOG_ERROR("cannot go back to the working directory: %m");
            }
            (void)close(before);
        }
    }
    WebAPIDirectory(const WebAPIDirectory&) = delete;
    WebAPIDirectory& operator=(const WebAPIDirectory&) = delete;

  private:
    int before;
};

// Runs under a user's name as long as it lives. The end puts back what
// TALO_WEBAPI_USERNAME was, into both variables; where it was not set, both
// keep the user.
class UserName {
  public:
    explicit UserName(const char* user) {
        const char* value = getenv(kUserVariable);
        known = value != nullptr;
        before = known ? value : "";
        Set(user);
    }
    ~UserName() {
        if (known) {
            Set(before.c_str());
        }
    }
    UserName(const UserName&) = delete;
    UserName& operator=(const UserName&) = delete;

  private:
    static void Set(const char* user) {
        (void)setenv("USERNAME", user, 1);
        (void)setenv(kUserVariable, user, 1);
    }

    bool known;
    std::string before;
};

Json::Value ExecDocument(const char* api, int version, const char* method,
                         const Json::Value& params, const Json::Value& attrs, const char* user) {
    Json::Value document(Json::objectValue);
    document["session"]["username"] = user;
    document["session"]["isAdmin"] = TLIBGroupIsAdminGroupMem(user, 0) == 1;
    document["session"]["isTimeout"] = false;
    document["session"]["isAuthorized"] = true;
    document["environ"]["REQUEST_METHOD"] = "POST";
    Json::Value& post = document["postParam"] = params;
    post["api"] = api;
    post["method"] = method;
    post["version"] = version;
    document["attr"] = attrs;
    return document;
}

void SetBadRequest(Json::Value& out) {
    if (!out.isObject()) {
        out = Json::Value(Json::objectValue);
    }
    out["success"] = false;
    out["error"] = Json::Value(Json::objectValue);
    out["error"]["code"] = kErrorBadRequest;
}

}  // namespace

void APIRunner::Exec(Json::Value& out, const char* api, int version, const char* method,
                     const Json::Value& params, const Json::Value& attrs, const char* user) {
    const auto run = [&] {
        APIRunner runner;
        if (api == nullptr || method == nullptr || user == nullptr) {
            SetBadRequest(out);
            return;
        }
        const WebAPIDirectory directory;
        const UserName name(user);
        runner.Run(ExecDocument(api, version, method, params, attrs, user));
        out = runner.GetResponse();
    };
    if (!Guarded(kSource, __LINE__, run)) {
        SetBadRequest(out);
    }
}

void APIRunner::Exec(Json::Value& out, const char* api, int version, const char* method,
                     const Json::Value& params, const char* user) {
    Exec(out, api, version, method, params, Json::Value(), user);
}

}  // namespace TALO
