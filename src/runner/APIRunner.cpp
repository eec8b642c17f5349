#include "webapi/APIRunner.h"

#include <unistd.h>

#include <cstring>

#include "platform/Paths.h"
#include "src/base/ErrorCode.h"
#include "src/base/Guarded.h"
#include "src/base/JsonConvert.h"
#include "src/runner/APIRunnerPrivate.h"
#include "src/runner/DescriptionCache.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

namespace TALO {

APIRunner::APIRunner()
    : libDef(Json::objectValue),
      libDesc(Json::objectValue),
      request(new APIRequest(Json::Value())),
      response(new APIResponse(request)),
      compoundDepth(0),
      d(new APIRunnerPrivate(this)) {
    (void)setsid();
    Json::Value defaults;
    if (ReadDescriptionFile(defaults, TALO_LIB_DEF, Keep::kAtOnce) && defaults.isObject()) {
        libDef.swap(defaults);
    }
}

APIRunner::~APIRunner() {
    CloseLib();
    delete response;
    delete request;
    RestoreProcessName(d);
    delete d;
}

int APIRunner::Run(const Json::Value& document) {
    const auto run = [this, &document] {
        if (document.isNull()) {
            response->SetError(kErrorBadRequest, Json::Value());
            return;
        }
        if (!Initialize(document) || !SetProcessName(request, response)) {
            return;
        }
        if (request->HasParam("relay_nd")) {
            response->SetError(kErrorBadRequest, Json::Value());
            return;
        }
        (void)Process(request, response);
    };
    if (!Guarded(kSource, __LINE__, run)) {
        response->SetError(kErrorBadRequest, Json::Value());
    }
    return response->GetError() == kErrorNone ? 1 : 0;
}

int APIRunner::Initialize(const Json::Value& document) {
    Json::Value environment(Json::objectValue);
    if (!InitEnv(environment)) {
        response->SetError(kErrorBadRequest, Json::Value());
        return 0;
    }
    request->TakeEnv(&environment);
    if (const Json::Value* given = FindMember(&document, "environ")) {
        request->InitEnv(*given);
    }
    if (const Json::Value* session = FindMember(&document, "session")) {
        request->InitSession(*session);
    }
    const Json::Value& attributes = Member(document, "attr");
    if (attributes.isObject()) {
        for (auto attribute = attributes.begin(); attribute != attributes.end(); ++attribute) {
            (void)request->SetAttr(attribute.name(), *attribute);
        }
    }
    if (document.empty()) {
        response->SetError(kErrorBadRequest, Json::Value());
        return 0;
    }
    request->InitParam(document, false);
    return 1;
}

bool APIRunner::NeedPermission(APIRequest*) {
    return false;
}

bool APIRunner::CheckPermission(APIRequest*, APIResponse*) {
    return true;
}

bool APIRunner::HandleUpload(APIRequest*, APIResponse*) {
    return true;
}

bool APIRunner::SkipPermission(APIRequest*) {
    return true;
}

int APIRunner::InitEnv(Json::Value& environment) {
    if (!environment.isObject()) {
        response->SetError(kErrorBadRequest, Json::Value());
        return 0;
    }
    for (char** entry = environ; entry != nullptr && *entry != nullptr; ++entry) {
        const char* equals = std::strchr(*entry, '=');
        if (equals != nullptr) {
            *environment.demand(*entry, equals) = equals + 1;
        }
    }
    return 1;
}

Json::Value APIRunner::GetResponse() {
    if (response == nullptr) {
        return Json::Value();
    }
    Json::Value body = response->GetBody();
    body["httpd_restart"] = response->GetHttpdRestart();
    return body;
}

}  // namespace TALO
