#include "Entry.h"
#include "File.h"
#include "Parameters.h"
#include "Target.h"
#include "apis/common/TextParameter.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APIUpload.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

constexpr long long kLatestTime = 253402300799;  // the end of the year 9999

// The temporary file that the entry has made of the field "file". A client can
// write the path of any file of the machine into that field.
bool FindUpload(APIRequest* request, std::string* path) {
    const auto file = request->GetAndCheckString("file", APIRequest::REQUIRED, nullptr);
    if (file.IsInvalid() || !TALO::APIUpload(request).IsUploadedFile(file.Get())) {
        return false;
    }
    *path = file.Get();
    return true;
}

}  // namespace

void Upload(APIRequest* request, APIResponse* response) {
    bool overwrite = false;
    long long mtime = -1;
    if (!ReadFlag(*request, "overwrite", &overwrite)) {
        response->SetError(kBadParameter, "overwrite");
        return;
    }
    if (!ReadNumber(*request, "mtime", 0, kLatestTime, &mtime)) {
        response->SetError(kBadParameter, "mtime");
        return;
    }
    const auto folder = request->GetAndCheckString("path", APIRequest::REQUIRED, nullptr);
    if (folder.IsInvalid() || folder.Get() == "/") {
        response->SetError(kBadParameter, "path");
        return;
    }
    std::string upload;
    std::string name;
    if (!FindUpload(request, &upload)) {
        response->SetError(kNotUploaded, Json::Value());
        return;
    }
    if (!ReadTypedText(*request, "file_filename", &name) || !talo::IsComponent(name)) {
        response->SetError(kBadParameter, "file_filename");
        return;
    }
    Target target;
    if (!OpenTargetAt(*request, response, "path", folder.Get() + "/" + name, Access::kChange,
                      &target) ||
        AnswerError(response, target.place.TakeIn(upload, overwrite, mtime), target.path)) {
        return;
    }
    talo::FileFacts facts;
    if (!AnswerError(response, target.place.Stat(&facts), target.path)) {
        response->SetSuccess(EntryAt(target, facts));
    }
}
