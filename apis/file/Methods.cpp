#include "Entry.h"
#include "File.h"
#include "Parameters.h"
#include "Target.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

void AnswerFacts(const Target& target, APIResponse* response) {
    talo::FileFacts facts;
    if (!AnswerError(response, target.place.Stat(&facts), target.path)) {
        response->SetSuccess(EntryAt(target, facts));
    }
}

}  // namespace

void Stat(APIRequest* request, APIResponse* response) {
    Target target;
    if (OpenTarget(*request, response, "path", Access::kRead, &target)) {
        AnswerFacts(target, response);
    }
}

void MakeFolder(APIRequest* request, APIResponse* response) {
    Target target;
    if (OpenTarget(*request, response, "path", Access::kChange, &target) &&
        !AnswerError(response, target.place.MakeFolder(), target.path)) {
        AnswerFacts(target, response);
    }
}

void Rename(APIRequest* request, APIResponse* response) {
    Target from;
    Target to;
    bool overwrite = false;
    if (!ReadFlag(*request, "overwrite", &overwrite)) {
        response->SetError(kBadParameter, "overwrite");
        return;
    }
    if (!OpenTarget(*request, response, "path", Access::kChange, &from) ||
        !OpenTarget(*request, response, "to", Access::kChange, &to)) {
        return;
    }
    const talo::FileError result = from.place.Rename(to.place, overwrite);
    // The path that is in the way, or the one that is not there.
    const bool isAboutTarget =
        result == talo::FileError::kExists || result == talo::FileError::kNotEmpty;
    if (!AnswerError(response, result, isAboutTarget ? to.path : from.path)) {
        AnswerFacts(to, response);
    }
}
