#include <cstdio>
#include <cstdlib>
#include <memory>

#include "platform/Cgi.h"
#include "src/base/ErrorCode.h"
#include "src/base/JsonConvert.h"
#include "src/request/APIRequestPrivate.h"
#include "src/request/Carriers.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/WebEntry.h"

namespace TALO {

namespace {

bool NamesAPI(const Json::Value& params) {
    return FindMember(&params, "api") != nullptr && FindMember(&params, "version") != nullptr &&
           FindMember(&params, "method") != nullptr;
}

struct Free {
    void operator()(char* memory) const {
        std::free(memory);
    }
};

}  // namespace

bool WebEntry::InitParam(Json::Value& document) {
    if (request->HasEnv("QUERY_STRING") && !InitGetParam(document["getParam"])) {
        return false;
    }
    if (request->GetRequestMethod() != kMethodPost) {
        return true;
    }
    if (request->IsUploadRequest()) {
        // The body is read later, but for the API's identity where the query lacks it.
        if (NamesAPI(Member(document, "getParam")) || LoadUploadAPIDesc(document["postParam"])) {
            return true;
        }
    } else if (InitPostParam(document["postParam"])) {
        return true;
    }
    response->SetError(kErrorBadRequest, Json::Value());
    return false;
}

bool WebEntry::InitGetParam(Json::Value& getParam) {
    const Json::Value line = request->GetEnv("QUERY_STRING", Json::Value());
    if (!line.isString()) {
        response->SetError(kErrorBadRequest, Json::Value());
        return false;
    }
    return DetectAndDecryptParamLine(line.asString(), getParam);
}

bool WebEntry::InitPostParam(Json::Value& postParam) {
    if (postParam.isNull()) {
        postParam = Json::Value(Json::objectValue);
    }
    if (!postParam.isObject() || request->IsUploadRequest()) {
        return false;
    }
    const long long length = ToInt64(request->GetEnv("CONTENT_LENGTH", 0), 0);
    if (length <= 0 || length > kMaxBodyBytes) {
        return false;
    }
    // calloc hands out untouched pages: a client that promises much and sends
    // little costs little.
    const size_t size = static_cast<size_t>(length);
    const std::unique_ptr<char, Free> body(static_cast<char*>(std::calloc(size + 1, 1)));
    if (body == nullptr) {
        return false;
    }
    (void)std::fread(body.get(), 1, size, stdin);
    return DetectAndDecryptParamLine(body.get(), postParam);
}

bool WebEntry::DetectAndDecryptParamLine(const std::string& line, Json::Value& params) {
    if (!MergeDeciphered(line, TaloCgiDetectAndDecryptParamLine, params)) {
        return false;
    }
    if (!params.empty() && !DecryptAESParam(params)) {
        return false;
    }
    // What an inner request lacks is found out by whoever runs it.
    Json::Value* nested = NestedObject(params);
    std::string text;
    if (nested != nullptr && TakeCarrier(*nested, kCipherText, &text)) {
        (void)DecryptParam(text, *nested);
        (void)TakeCarrier(*nested, kCipherToken, &text);
    }
    return true;
}

bool WebEntry::DecryptParam(const std::string& text, Json::Value& params) {
    return MergeDeciphered(text, TaloCgiDecryptParam, params) &&
           (params.empty() || DecryptAESParam(params));
}

bool WebEntry::DecryptAESParam(Json::Value& params) {
    return DecryptAESCarriers(params);
}

}  // namespace TALO
