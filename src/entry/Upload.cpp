#include <string>

#include "platform/Cgi.h"
#include "platform/System.h"
#include "platform/WebAPIUtil.h"
#include "src/base/ErrorCode.h"
#include "src/entry/APIUploadPrivate.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/WebEntry.h"

namespace TALO {

namespace {

constexpr int kHashCapacity = 256;

// The API identity: what a client puts first into a form that has to say itself
// whose it is.
constexpr int kIdentityFields = 3;

}  // namespace

bool WebEntry::LoadUploadAPIDesc(Json::Value& postParam) {
    if (cgiContext->paramHash == nullptr) {
        cgiContext->paramHash = TLIBCSzHashAlloc(kHashCapacity);
    }
    if (cgiContext->paramHash == nullptr) {
        return false;
    }
    TLIBCHashRemoveAll(cgiContext->paramHash);
    TALOCGIUPLOADCOUNTERS counters = {};
    char name[256] = "";
    if (TaloCgiLoadUploadNumParams(&cgiContext->paramHash, kIdentityFields, 0, &counters, name,
                                   sizeof name) < 0) {
        return false;
    }
    Json::Value environ(Json::objectValue);
    environ["CONTENT_LENGTH"] = std::to_string(counters.total - counters.consumed);
    request->InitEnv(environ);
    return WebAPIUtil::SzHashToJsonObj(cgiContext->paramHash, postParam);
}

bool WebEntry::HandleUpload(APIRequest* request, APIResponse* response) {
    if (GetMethodAttr(request, "deferUpload")) {
        return true;
    }
    Json::Value document(Json::objectValue);
    document["postParam"] = Json::Value(Json::objectValue);
    const int result = APIUpload(request).GetUploadAll(document["postParam"], &uploadFiles);
    if (result == kUploadDone) {
        request->InitParam(document, false);
        return true;
    }
    Json::Value details(Json::objectValue);
    details["upload_err"] = result;
    response->SetError(kErrorUpload, details);
    return false;
}

}  // namespace TALO
