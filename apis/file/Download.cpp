#include <string.h>
#include <unistd.h>

#include <cstdio>

#include "File.h"
#include "Target.h"
#include "Zip.h"
#include "apis/common/SafeHeader.h"
#include "hosts/linux/sdk/Downloads.h"
#include "webapi/APIDownload.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

constexpr Json::ArrayIndex kMaxPaths = 1000;
constexpr int kHeadRequest = 3;  // as APIRequest::GetRequestMethod answers it

using Targets = std::vector<std::unique_ptr<Target>>;

// One content type goes out, that of the content itself, whatever a browser guesses.
void SendFile(const Target& target, int file, APIResponse* response) {
    FILE* stream = fdopen(file, "rb");
    if (stream == nullptr) {
        (void)close(file);
        response->SetError(kFailed, target.path);
        return;
    }
    response->SetEnableOutput(false);
    (void)response->RemoveHeader("Content-type");
    (void)SetSafeHeader(response, "Content-Disposition", talo::AttachmentNamed(target.Name()));
    (void)SetSafeHeader(response, "X-Content-Type-Options", "nosniff");
    (void)SetSafeHeader(response, "Cache-Control", "private, no-cache");
    TALO::APIDownload download(response);
    download.SetMimeType(talo::MimeTypeOf(target.Name()));
    (void)download.Output(stream);
    (void)fclose(stream);
}

// "path" or "paths", not both: the parameter's name, null for neither or both.
const char* WhichParameter(const APIRequest& request) {
    const bool one = request.HasParam("path");
    const bool several = request.HasParam("paths");
    return one == several ? nullptr : one ? "path" : "paths";
}

bool OpenOne(const APIRequest& request, APIResponse* response, const char* parameter,
             const std::string& path, Targets* targets) {
    targets->push_back(std::make_unique<Target>());
    return OpenTargetAt(request, response, parameter, path, Access::kRead, targets->back().get());
}

bool OpenAll(const APIRequest& request, APIResponse* response, Targets* targets) {
    const char* parameter = WhichParameter(request);
    if (parameter == nullptr) {
        response->SetError(kBadParameter, "path");
        return false;
    }
    const Json::Value value = request.GetParam(parameter, Json::Value());
    if (value.isString() && strcmp(parameter, "path") == 0) {
        return OpenOne(request, response, parameter, value.asString(), targets);
    }
    bool valid = value.isArray() && strcmp(parameter, "paths") == 0 && !value.empty() &&
                 value.size() <= kMaxPaths;
    for (Json::ArrayIndex index = 0; valid && index < value.size(); ++index) {
        valid = value[index].isString();
    }
    if (!valid) {
        response->SetError(kBadParameter, parameter);
        return false;
    }
    for (const Json::Value& path : value) {
        if (!OpenOne(request, response, parameter, path.asString(), targets)) {
            return false;
        }
    }
    return true;
}

// Whether all is there, before an answer begins that can tell no more.
bool AreThere(const Targets& targets, APIResponse* response, bool* isFile) {
    for (const auto& target : targets) {
        talo::FileFacts facts;
        if (AnswerError(response, target->place.Stat(&facts), target->path)) {
            return false;
        }
        if (facts.type == talo::FileType::kLink || facts.type == talo::FileType::kOther) {
            const bool isLink = facts.type == talo::FileType::kLink;
            response->SetError(isLink ? kLeadsOut : kNotFile, target->path);
            return false;
        }
        *isFile = facts.type == talo::FileType::kFile;
    }
    return true;
}

}  // namespace

void Download(APIRequest* request, APIResponse* response) {
    Targets targets;
    bool isFile = false;
    if (!OpenAll(*request, response, &targets) || !AreThere(targets, response, &isFile)) {
        return;
    }
    if (targets.size() == 1 && isFile) {
        int file = -1;
        if (!AnswerError(response, targets[0]->place.OpenFile(&file), targets[0]->path)) {
            SendFile(*targets[0], file, response);
        }
        return;
    }
    if (SendZip(targets, request->GetRequestMethod() == kHeadRequest)) {
        response->SetEnableOutput(false);
    } else {
        response->SetError(kFailed, targets[0]->path);
    }
}
