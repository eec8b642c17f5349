#include "webapi/APIDownload.h"

#include <stdlib.h>
#include <strings.h>

#include <iostream>

#include "src/response/APIDownloadPrivate.h"
#include "webapi/APIResponse.h"

namespace TALO {

namespace {

const char kXSendFileVariable[] = "MOD_X_SENDFILE_ENABLED";
const char kUnknownType[] = "application/octet-stream";

}  // namespace

APIDownloadPrivate::APIDownloadPrivate(APIDownload* owner, APIResponse* response, bool ownsResponse)
    : owner(owner), response(response), ownsResponse(ownsResponse) {}

APIDownloadPrivate::~APIDownloadPrivate() {
    if (ownsResponse) {
        delete response;
    }
}

// The outputer may write past both buffers, so neither keeps anything back.
void APIDownloadPrivate::PrintHeader() {
    std::string lines;
    if (response != nullptr) {
        const Json::Value headers = response->GetHeaders();
        for (auto header = headers.begin(); header != headers.end(); ++header) {
            if (header->isString()) {
                lines += header.name() + ": " + header->asString() + "\r\n";
            }
        }
    }
    std::cout.flush();
    (void)std::fwrite(lines.data(), 1, lines.size(), stdout);
    (void)std::fflush(stdout);
}

APIDownload::APIDownload(APIResponse* response)
    : d(new APIDownloadPrivate(this, response, false)) {}

APIDownload::APIDownload() : d(new APIDownloadPrivate(this, new APIResponse(nullptr), true)) {}

APIDownload::~APIDownload() {
    delete d;
}

bool APIDownload::GetXSendFileEnabled() {
    const char* enabled = getenv(kXSendFileVariable);
    return enabled != nullptr && strcasecmp(enabled, "yes") == 0;
}

int APIDownload::SetXSendFileDisabled() {
    return getenv(kXSendFileVariable) != nullptr ? unsetenv(kXSendFileVariable) : 0;
}

void APIDownload::SetMimeType(const std::string& type) {
    d->mimeType = type;
}

void APIDownload::SetMimeTypeFromFileName(const std::string& fileName) {
    d->mimeType = HTTPFileOutputer::GetMimeType(fileName.c_str());
}

bool APIDownload::SetHeader(const std::string& name, const std::string& value) {
    return d->response != nullptr && d->response->SetHeader(name, value);
}

bool APIDownload::SetHeader(const Json::Value& headers) {
    if (!headers.isObject()) {
        return true;
    }
    for (auto header = headers.begin(); header != headers.end(); ++header) {
        if (header->isString() && !SetHeader(header.name(), header->asString())) {
            return false;
        }
    }
    return true;
}

int APIDownload::Output(FILE* file) {
    d->PrintHeader();
    if (d->mimeType.empty()) {
        d->mimeType = kUnknownType;
    }
    return d->outputer.Output(file, "", d->mimeType.c_str());
}

int APIDownload::Output(const std::string& path) {
    d->PrintHeader();
    if (d->mimeType.empty()) {
        d->mimeType = HTTPFileOutputer::GetMimeType(path.c_str());
    }
    return d->outputer.Output(path.c_str(), d->mimeType.c_str());
}

}  // namespace TALO
