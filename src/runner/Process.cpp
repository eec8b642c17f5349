#include "src/base/AnswerMark.h"
#include "src/base/ErrorCode.h"
#include "src/base/Guarded.h"
#include "src/base/JsonConvert.h"
#include "src/runner/APIRunnerPrivate.h"
#include "src/runner/ProcessGuards.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APIRunner.h"

namespace TALO {

namespace {

const char kEntryAPI[] = "TALO.Entry.Request";

int Fail(APIResponse* response, ErrorCode code) {
    response->SetError(code, Json::Value());
    return 0;
}

// Whether an entry of a version's list names the method: as a text, or as any
// member of an object.
bool NamesMethod(const Json::Value& entry, const std::string& method) {
    return entry == Json::Value(method) || FindMember(&entry, method) != nullptr;
}

bool ListsMethod(const Json::Value& entries, const std::string& method) {
    for (Json::ArrayIndex index = 0; entries.isArray() && index < entries.size(); ++index) {
        if (NamesMethod(entries[index], method)) {
            return true;
        }
    }
    return false;
}

struct Identity {
    explicit Identity(const APIRequest& request)
        : api(request.GetAPIClass()),
          version(request.GetAPIVersion()),
          method(request.GetAPIMethod()) {}

    const std::string api;
    const int version;
    const std::string method;
};

// The row of that identity, else the terminating row.
template <typename Row>
const Row* FindRow(const Row* row, const Identity& identity) {
    while (row->apiName != nullptr &&
           !(identity.api == row->apiName && identity.version == row->version &&
             row->method != nullptr && identity.method == row->method)) {
        ++row;
    }
    return row;
}

// A terminating row may have a function too: the check of every method not listed.
int RunCheck(const _tag_API_CHECK_TABLE* table, const Identity& identity, APIRequest* request,
             APIResponse* response) {
    if (table == nullptr) {
        return 1;
    }
    const APICheckFunc check = FindRow(table, identity)->check;
    if (check == nullptr) {
        return 1;
    }
    int passed = 0;
    if (!Guarded(kSource, __LINE__, [&] { passed = check(request, response); })) {
        return Fail(response, kErrorNoResult);
    }
    return passed;
}

int RunMethod(const _tag_API_TABLE* table, const Identity& identity, APIRequest* request,
              APIResponse* response) {
    const _tag_API_TABLE* row = FindRow(table, identity);
    if (row->apiName == nullptr) {
        return Fail(response, kErrorNotInTable);
    }
    response->SetError(kErrorNoResult, Json::Value());
    if (!Guarded(kSource, __LINE__, [&] { row->func(request, response); })) {
        response->SetError(kErrorNoResult, Json::Value());
    }
    return 1;
}

}  // namespace

int APIRunner::Process(APIRequest* request, APIResponse* response) {
    if (!SetProcessName(request, response) || !CheckRequestParam(request, response) ||
        !AddAPIInfo(request)) {
        return 0;
    }
    if (request->HasParam("relay_nd")) {
        return Fail(response, kErrorRelay);
    }
    const int result = request->GetAPIClass() == kEntryAPI ? ProcessEntry(request, response)
                                                           : ProcessLib(request, response);
    // The elements of a compound request have renamed the process.
    (void)SetProcessName(request, response);
    return result;
}

int APIRunner::CheckRequestParam(APIRequest* request, APIResponse* response) {
    const std::string api = request->GetAPIClass();
    const std::string method = request->GetAPIMethod();
    const int version = request->GetAPIVersion();
    if (api.empty() || version < 1 || method.empty()) {
        return Fail(response, kErrorBadRequest);
    }
    if (!InitLibDesc(libDesc, request)) {
        return Fail(response, kErrorNoSuchAPI);
    }
    const Json::Value* desc = FindMember(&libDesc, api);
    if (desc == nullptr) {
        return Fail(response, kErrorNoSuchAPI);
    }
    if (version < ToInt(Member(*desc, "minVersion"), 0) ||
        version > ToInt(Member(*desc, "maxVersion"), 0)) {
        return Fail(response, kErrorVersion);
    }
    if (!ListsMethod(Member(Member(*desc, "methods"), std::to_string(version)), method)) {
        return Fail(response, kErrorNoSuchMethod);
    }
    const Json::Value& attributes = GetMethod(api, version, method);
    if (!ToBool(Member(attributes, "allowUpload")) && request->IsUploadRequest()) {
        return Fail(response, kErrorUploadNotAllowed);
    }
    if (!ToBool(Member(attributes, "allowDemo")) && request->IsDemoMode()) {
        return Fail(response, kErrorDemoMode);
    }
    return 1;
}

int APIRunner::AddAPIInfo(APIRequest* request) {
    if (request == nullptr) {
        return 0;
    }
    const Json::Value* desc = FindMember(&libDesc, request->GetAPIClass());
    if (desc == nullptr) {
        return 0;
    }
    request->InitAPIInfo(*desc);
    return 1;
}

// The API's identity is what it was when the call began: an upload's body may
// bring parameters of those names, but not another method.
int APIRunner::ProcessLib(APIRequest* request, APIResponse* response) {
    if (NeedPermission(request) && !CheckPermission(request, response) &&
        !SkipPermission(request)) {
        return 0;
    }
    const Identity identity(*request);
    const Json::Value& attributes = GetMethod(identity.api, identity.version, identity.method);
    const bool allowUpload = ToBool(Member(attributes, "allowUpload"));
    const bool allowDownload = ToBool(Member(attributes, "allowDownload"));
    if (request->IsUploadRequest() && (!allowUpload || !HandleUpload(request, response))) {
        return 0;
    }
    _tag_API_TABLE* table = nullptr;
    _tag_API_CHECK_TABLE* checkTable = nullptr;
    if (!OpenLib(request, &table, &checkTable) || table == nullptr) {
        return Fail(response, kErrorLibrary);
    }
    if (allowDownload) {
        MarkAnswerBegun();
    }
    const StandardStreams streams(!allowUpload, !allowDownload);
    const SchedulingPriority priority(ToInt(request->GetAPIInfo("priority", 0), 0));
    return RunCheck(checkTable, identity, request, response)
               ? RunMethod(table, identity, request, response)
               : 0;
}

}  // namespace TALO
