#include <memory>
#include <new>

#include "src/base/ErrorCode.h"
#include "src/base/Guarded.h"
#include "src/base/JsonConvert.h"
#include "src/runner/APIRunnerPrivate.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APIRunner.h"

namespace TALO {

namespace {

// The environment of an element is the outer request's, its parameters come as
// if they had been posted.
Json::Value ElementDocument(const APIRequest& outer) {
    Json::Value document(Json::objectValue);
    document["environ"] = outer.GetEnv("", Json::Value(Json::objectValue));
    document["environ"].removeMember("QUERY_STRING");
    document["environ"]["REQUEST_METHOD"] = "POST";
    document["postParam"] = Json::Value(Json::objectValue);
    return document;
}

// What the response holds, under the name of the request when it has one.
Json::Value Answer(const APIResponse& response, const APIRequest& request) {
    Json::Value body = response.GetBody();
    const std::string api = request.GetAPIClass();
    const std::string method = request.GetAPIMethod();
    const int version = request.GetAPIVersion();
    if (!api.empty() && !method.empty() && version > 0) {
        body["api"] = api;
        body["version"] = version;
        body["method"] = method;
    }
    return body;
}

}  // namespace

int APIRunner::ProcessEntry(APIRequest* request, APIResponse* response) {
    if (request->GetAPIMethod() != "request") {
        return 0;
    }
    if (!request->HasParam("compound")) {
        response->SetError(kErrorCompoundOrFork, Json::Value());
        return 0;
    }
    ++compoundDepth;
    const int result = HandleCompound(request, response);
    --compoundDepth;
    return result;
}

// One request and one response serve all elements. The response is not reset in
// between: an element that sets nothing shows what the one before it left.
int APIRunner::HandleCompound(APIRequest* request, APIResponse* response) {
    const bool stopWhenError = ToBool(request->GetParam("stop_when_error", Json::Value()));
    const Json::Value list = request->GetParam("compound", Json::Value());
    if (!list.isArray()) {
        response->SetError(kErrorCompoundOrFork, Json::Value());
        return 0;
    }
    const std::unique_ptr<APIRequest> element(new (std::nothrow)
                                                  APIRequest(ElementDocument(*request)));
    if (element == nullptr) {
        LOG_ERROR("new APIRequest Fail");
        response->SetError(kErrorNoResult, Json::Value());
        return 0;
    }
    const std::unique_ptr<APIResponse> answer(new (std::nothrow) APIResponse(element.get()));
    if (answer == nullptr) {
        LOG_ERROR("new APIResponse Fail");
        response->SetError(kErrorNoResult, Json::Value());
        return 0;
    }
    Json::Value result(Json::objectValue);
    Json::Value& answers = result["result"] = Json::Value(Json::arrayValue);
    bool failed = false;
    for (const Json::Value& params : list) {
        Json::Value document(Json::objectValue);
        document["postParam"] = params;
        // What one element may know of the login is none of the next one's business.
        element->InitSession(Json::Value());
        const bool readable = params.isObject() && Guarded(kSource, __LINE__, [&] {
                                  element->InitParam(document, true);
                              });
        if (stopWhenError && failed) {
            answer->SetError(kErrorCompoundSkipped, Json::Value());
        } else if (!readable) {
            answer->SetError(kErrorBadRequest, Json::Value());
            failed = true;
        } else {
            failed = !RunElement(element.get(), answer.get(), response) || failed;
        }
        answers.append(readable ? Answer(*answer, *element) : answer->GetBody());
    }
    result["has_fail"] = failed;
    response->SetCallbackFuncs(answer->GetCallbackFuncs());
    response->TakeSuccess(&result);
    return 1;
}

// Runs one element and carries over what concerns the whole reply.
bool APIRunner::RunElement(APIRequest* element, APIResponse* answer, APIResponse* response) {
    const Json::Value& attributes =
        GetMethod(element->GetAPIClass(), element->GetAPIVersion(), element->GetAPIMethod());
    if (ToBool(Member(attributes, "allowUpload")) || ToBool(Member(attributes, "allowDownload"))) {
        answer->SetError(kErrorCompoundTransfer, Json::Value());
        return false;
    }
    const int processed = Process(element, answer);
    if (answer->HasServerError()) {
        response->SetServerError(answer->GetServerError());
    }
    if (answer->GetHttpdRestart()) {
        response->SetHttpdRestart(true);
    }
    return processed != 0 && answer->GetError() == kErrorNone;
}

}  // namespace TALO
