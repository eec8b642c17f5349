// Test.File: what the entry makes of uploads, read at once ("upload", "hold") or
// by the method ("deferred"), and files as answers ("download"). Files end up
// where the request says; a real API would never let it.
#include <signal.h>
#include <sys/resource.h>
#include <unistd.h>

#include <cstdio>
#include <fstream>
#include <string>

#include "webapi/APIDownload.h"
#include "webapi/APIExport.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"
#include "webapi/APIUpload.h"

namespace {

constexpr useconds_t kPause = 50 * 1000;
constexpr int kTries = 600;

std::string Text(const TALO::APIRequest* request, const char* name) {
    const Json::Value value = request->GetParam(name, "");
    return value.isString() ? value.asString() : std::string();
}

Json::Int64 PeakKibibytes() {
    struct rusage usage = {};
    (void)getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss;
}

// Answers all parameters, and which of them are paths of uploaded files. Those
// get another name in the folder "keep", if there is one: the name of their
// parameter.
void AnswerUpload(const TALO::APIUpload& upload, const Json::Value& params, const std::string& keep,
                  Json::Value* data) {
    (*data)["params"] = params;
    Json::Value& files = (*data)["files"] = Json::Value(Json::objectValue);
    for (const std::string& name : params.getMemberNames()) {
        if (!params[name].isString() || !upload.IsUploadedFile(params[name].asString())) {
            continue;
        }
        const std::string path = params[name].asString();
        files[name] = path;
        if (!keep.empty()) {
            (void)rename(path.c_str(), (keep + "/" + name).c_str());
        }
    }
    (*data)["peak"] = PeakKibibytes();
}

void Upload(TALO::APIRequest* request, TALO::APIResponse* response) {
    Json::Value data(Json::objectValue);
    AnswerUpload(TALO::APIUpload(request), request->GetParam("", Json::Value()),
                 Text(request, "keep"), &data);
    response->SetSuccess(data);
}

// Says by the file "started" that the upload is here, with the process's id, and
// waits for "finish" or half a minute.
void Hold(TALO::APIRequest* request, TALO::APIResponse* response) {
    std::ofstream(Text(request, "started")) << getpid() << std::endl;
    for (int index = 0; index < kTries && access(Text(request, "finish").c_str(), F_OK) != 0;
         ++index) {
        (void)usleep(kPause);
    }
    response->SetSuccess(Json::Value());
}

Json::Value progress;  // pairs of bytes done and in total

void Note(unsigned long long done, unsigned long long total) {
    Json::Value step(Json::arrayValue);
    step.append(static_cast<Json::UInt64>(done));
    step.append(static_cast<Json::UInt64>(total));
    progress.append(step);
}

// Reads all parts itself: "steps" has the result of each reading.
void Deferred(TALO::APIRequest* request, TALO::APIResponse* response) {
    progress = Json::Value(Json::arrayValue);
    TALO::APIUpload upload(request);
    upload.SetUploadCallback(Note);
    Json::Value data(Json::objectValue);
    Json::Value& steps = data["steps"] = Json::Value(Json::arrayValue);
    Json::Value params(Json::objectValue);
    Json::Value before(Json::objectValue);
    steps.append(upload.GetUploadParam(before));
    data["before"] = before;
    steps.append(upload.GetUploadFile(params));
    AnswerUpload(upload, params, Text(request, "keep"), &data);
    data["progress"] = progress;
    response->SetSuccess(data);
}

// What this process has written so far, to whatever.
long long BytesWritten() {
    std::ifstream counters("/proc/self/io");
    std::string name;
    long long bytes = -1;
    while (counters >> name >> bytes && name != "wchar:") {
    }
    return bytes;
}

// Sends the file "path": by its path, or by "open" from an open file. The
// parameters "type", "header" and "value" set what their names say; "own" keeps
// the server from sending. The file "note" gets the result of the sending and how
// much this process wrote for it.
void Download(TALO::APIRequest* request, TALO::APIResponse* response) {
    // Web servers end a program that has said all that they need.
    (void)signal(SIGTERM, SIG_IGN);
    response->SetEnableOutput(false);
    TALO::APIDownload download(response);
    if (request->HasParam("type")) {
        (void)response->RemoveHeader("Content-type");
        download.SetMimeType(Text(request, "type"));
    }
    if (request->HasParam("header")) {
        (void)download.SetHeader(Text(request, "header"), Text(request, "value"));
    }
    if (request->HasParam("own")) {
        (void)TALO::APIDownload::SetXSendFileDisabled();
    }
    const bool enabled = TALO::APIDownload::GetXSendFileEnabled();
    const long long before = BytesWritten();
    const std::string path = Text(request, "path");
    int result = -1;
    if (!request->HasParam("open")) {
        result = download.Output(path);
    } else if (FILE* file = fopen(path.c_str(), "re")) {
        result = download.Output(file);
        (void)fclose(file);
    }
    const long long written = BytesWritten() - before;
    if (request->HasParam("note")) {
        const std::string note = Text(request, "note");
        std::ofstream(note + ".new")
            << result << ' ' << enabled << ' ' << written << ' ' << PeakKibibytes() << std::endl;
        (void)rename((note + ".new").c_str(), note.c_str());
    }
    response->SetSuccess(Json::Value());
}

TALO::_tag_API_TABLE table[] = {
    {"Test.File", 1, "upload", Upload},     {"Test.File", 1, "hold", Hold},
    {"Test.File", 1, "deferred", Deferred}, {"Test.File", 1, "download", Download},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
