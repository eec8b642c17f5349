#include "Slices.h"

#include "File.h"
#include "Target.h"
#include "hosts/linux/sdk/Slices.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIRequest;
using TALO::APIResponse;
using talo::SliceResult;

namespace {

struct CodeRow {
    SliceResult result;
    int code;
};

constexpr CodeRow kCodes[] = {
    {SliceResult::kNotFound, kNoSuchUpload},   {SliceResult::kBusy, kUploadBusy},
    {SliceResult::kWrongOffset, kWrongOffset}, {SliceResult::kTooLong, kTooLong},
    {SliceResult::kTooMany, kTooManyUploads},  {SliceResult::kCut, kCutOff},
    {SliceResult::kWrongDigest, kWrongDigest}, {SliceResult::kNoDigest, kNoDigest},
    {SliceResult::kNoSpace, kNoSpace},
};

int CodeOfSlice(SliceResult result) {
    for (const CodeRow& row : kCodes) {
        if (row.result == result) {
            return row.code;
        }
    }
    return kFailed;
}

Json::Value Progress(const std::string& id, unsigned long long offset) {
    Json::Value progress(Json::objectValue);
    progress["upload_id"] = id;
    progress["offset"] = static_cast<Json::UInt64>(offset);
    return progress;
}

Json::Value Answer(const std::string& id, const talo::SliceFile& file, unsigned long long offset) {
    Json::Value answer = Progress(id, offset);
    answer["length"] = static_cast<Json::UInt64>(file.length);
    answer["complete"] = file.complete;
    return answer;
}

// What would fail in the end had better fail before the bytes are sent: a folder
// that is not there, a file that may not be replaced.
bool MayBecomeAFile(const Target& target, bool overwrite, APIResponse* response) {
    talo::FileFacts facts;
    talo::Place folder;
    const std::vector<std::string> parts(target.parsed.parts.begin(),
                                         target.parsed.parts.end() - 1);
    if (AnswerError(response, folder.Open(target.share, parts), target.path) ||
        AnswerError(response, folder.Stat(&facts), target.path)) {
        return false;
    }
    if (facts.type != talo::FileType::kFolder) {
        const bool leadsOut = facts.type == talo::FileType::kLink;
        return !AnswerError(
            response, leadsOut ? talo::FileError::kLink : talo::FileError::kNotFolder, target.path);
    }
    if (target.place.Stat(&facts) != talo::FileError::kNone) {
        return true;
    }
    if (facts.type == talo::FileType::kFolder) {
        return !AnswerError(response, talo::FileError::kNotFile, target.path);
    }
    return overwrite || !AnswerError(response, talo::FileError::kExists, target.path);
}

bool Begin(const APIRequest& request, APIResponse* response, const SliceParameters& parameters,
           talo::SliceUpload* upload) {
    Target target;
    if (!OpenTarget(request, response, "path", Access::kChange, &target) ||
        !MayBecomeAFile(target, parameters.overwrite, response)) {
        return false;
    }
    SliceTarget kept;
    kept.path = target.path;
    kept.overwrite = parameters.overwrite;
    kept.mtime = parameters.mtime;
    talo::SliceFile file;
    file.owner = request.GetLoginUserName();
    file.length = parameters.length;
    file.digest = parameters.fileDigest;
    file.target = FormatSliceTarget(kept);
    const SliceResult result =
        parameters.bytes > file.length ? SliceResult::kTooLong : upload->Create(file);
    if (result != SliceResult::kDone) {
        response->SetError(CodeOfSlice(result), target.path);
    }
    return result == SliceResult::kDone;
}

// Who has lost the right to write meanwhile is told so before he sends more.
bool Resume(const APIRequest& request, APIResponse* response, const SliceParameters& parameters,
            talo::SliceUpload* upload) {
    const SliceResult result = upload->Open(parameters.uploadId, request.GetLoginUserName());
    if (result != SliceResult::kDone) {
        response->SetError(CodeOfSlice(result), parameters.uploadId);
        return false;
    }
    if (parameters.hasLength && parameters.length != upload->File().length) {
        response->SetError(kBadParameter, "length");
        return false;
    }
    SliceTarget kept;
    Target target;
    if (!ParseSliceTarget(upload->File().target, &kept)) {
        response->SetError(kNoSuchUpload, parameters.uploadId);
        return false;
    }
    return upload->File().complete ||
           OpenTargetAt(request, response, "path", kept.path, Access::kChange, &target);
}

// The file appears here, whole. Rights and place are looked up once more, since
// the last slice may have taken hours.
bool Finish(const APIRequest& request, APIResponse* response, bool overwrite,
            talo::SliceUpload* upload) {
    const std::string id = upload->Id();
    const SliceResult result = upload->Check();
    if (result != SliceResult::kDone) {
        response->SetError(
            result == SliceResult::kWrongDigest ? kWrongFileDigest : CodeOfSlice(result), id);
        return false;
    }
    SliceTarget kept;
    Target target;
    if (!ParseSliceTarget(upload->File().target, &kept) ||
        !OpenTargetAt(request, response, "path", kept.path, Access::kChange, &target) ||
        AnswerError(
            response,
            target.place.TakeIn(upload->DataPath(), overwrite || kept.overwrite, kept.mtime),
            target.path)) {
        return false;
    }
    // The file is there, also when this cannot be remembered.
    (void)upload->Complete();
    return true;
}

}  // namespace

void UploadSlice(APIRequest* request, APIResponse* response) {
    SliceParameters parameters;
    talo::SliceUpload upload;
    if (!ReadSliceParameters(*request, response, &parameters) ||
        !(parameters.uploadId.empty() ? Begin(*request, response, parameters, &upload)
                                      : Resume(*request, response, parameters, &upload))) {
        return;
    }
    const SliceResult result =
        upload.Append(parameters.offset, parameters.bytes, parameters.digest);
    if (result != SliceResult::kDone) {
        response->SetError(CodeOfSlice(result), Progress(upload.Id(), upload.Offset()));
        return;
    }
    talo::SliceFile file = upload.File();
    const bool isWhole = upload.Offset() == file.length;
    if (isWhole && !file.complete && !Finish(*request, response, parameters.overwrite, &upload)) {
        return;
    }
    file.complete = isWhole;
    response->SetSuccess(Answer(upload.Id(), file, upload.Offset()));
}

void UploadStatus(APIRequest* request, APIResponse* response) {
    const auto id = request->GetAndCheckString("upload_id", APIRequest::REQUIRED, nullptr);
    if (id.IsInvalid() || id.IsReset()) {
        response->SetError(kBadParameter, "upload_id");
        return;
    }
    talo::SliceFile file;
    unsigned long long offset = 0;
    const SliceResult result =
        talo::FindSliceUpload(id.Get(), request->GetLoginUserName(), &file, &offset);
    if (result != SliceResult::kDone) {
        response->SetError(CodeOfSlice(result), id.Get());
        return;
    }
    response->SetSuccess(Answer(id.Get(), file, offset));
}
