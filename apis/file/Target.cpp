#include "Target.h"

#include "File.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIRequest;
using TALO::APIResponse;

const std::string& Target::Name() const {
    return parsed.parts.empty() ? parsed.share : parsed.parts.back();
}

bool OpenTarget(const APIRequest& request, APIResponse* response, const std::string& parameter,
                Access access, Target* target) {
    const auto path = request.GetAndCheckString(parameter, APIRequest::REQUIRED, nullptr);
    if (path.IsInvalid()) {
        response->SetError(kBadParameter, parameter);
        return false;
    }
    return OpenTargetAt(request, response, parameter, path.Get(), access, target);
}

bool OpenTargetAt(const APIRequest& request, APIResponse* response, const std::string& parameter,
                  const std::string& path, Access access, Target* target) {
    target->path = path;
    if (!talo::ParseVirtualPath(path, &target->parsed) || target->parsed.share.empty() ||
        (access == Access::kChange && target->parsed.parts.empty())) {
        response->SetError(kBadParameter, parameter);
        return false;
    }
    talo::ShareUser user;
    if (!talo::FindShareUser(request.GetLoginUserName(), &user) ||
        !talo::FindShare(target->parsed.share, &target->share) ||
        !talo::MayRead(user, target->share)) {
        response->SetError(kNoSuchFile, path);
        return false;
    }
    target->writable = talo::MayWrite(user, target->share);
    if (access != Access::kRead && !target->writable) {
        response->SetError(kNoRight, path);
        return false;
    }
    return !AnswerError(response, target->place.Open(target->share, target->parsed.parts), path);
}
