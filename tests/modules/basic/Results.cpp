#include <cstdio>
#include <set>
#include <stdexcept>
#include <string>
#include <tuple>

#include "Methods.h"

namespace basic {

namespace {

struct Note {
    std::string file;
    std::string text;
    bool operator<(const Note& other) const {
        return std::tie(file, text) < std::tie(other.file, other.text);
    }
};

void Append(void* argument) {
    const Note* note = static_cast<const Note*>(argument);
    if (FILE* file = fopen(note->file.c_str(), "a")) {
        (void)fputs(note->text.c_str(), file);
        (void)fclose(file);
    }
}

std::string Text(const APIRequest* request, const char* name) {
    const Json::Value value = request->GetParam(name, "");
    return value.isString() ? value.asString() : "";
}

int Number(const APIRequest* request, const char* name, int fallback) {
    const Json::Value value = request->GetParam(name, fallback);
    return value.isInt() ? value.asInt() : fallback;
}

}  // namespace

void Ok(APIRequest*, APIResponse* response) {
    response->SetSuccess(Json::Value());
}

void Echo(APIRequest* request, APIResponse* response) {
    response->SetSuccess(request->GetParam("", Json::Value()));
}

void Fail(APIRequest* request, APIResponse* response) {
    response->SetError(Number(request, "code", 400), request->GetParam("details", Json::Value()));
}

void Nothing(APIRequest*, APIResponse*) {}

void ThrowException(APIRequest*, APIResponse*) {
    throw std::runtime_error("the method gave up");
}

void ThrowNumber(APIRequest*, APIResponse*) {
    throw 7;
}

void ThrowAfterSuccess(APIRequest*, APIResponse* response) {
    response->SetSuccess("half done");
    throw std::runtime_error("the method gave up late");
}

void Status(APIRequest* request, APIResponse* response) {
    const int code = Number(request, "code", 404);
    response->SetStatus(static_cast<TALO::_tag_HTTP_STATUS_CODE>(code), Text(request, "message"));
    response->SetSuccess(Json::Value());
}

void Header(APIRequest* request, APIResponse* response) {
    response->SetHeader(Text(request, "name"), Text(request, "value"));
    response->SetSuccess(Json::Value());
}

void ServerError(APIRequest* request, APIResponse* response) {
    response->SetServerError(Text(request, "text"));
    response->SetSuccess(Json::Value());
}

void Restart(APIRequest*, APIResponse* response) {
    response->SetHttpdRestart(true);
    response->SetSuccess(Json::Value());
}

// The notes outlive the call: the work runs when the reply has left.
void Later(APIRequest* request, APIResponse* response) {
    static std::set<Note> notes;
    const Note& note = *notes.insert({Text(request, "file"), Text(request, "text")}).first;
    response->SetCallbackFunc(Append, const_cast<Note*>(&note));
    response->SetSuccess(Json::Value());
}

}  // namespace basic
