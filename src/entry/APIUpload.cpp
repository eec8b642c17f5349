#include "webapi/APIUpload.h"

#include <cstdint>
#include <cstring>

#include "platform/System.h"
#include "platform/WebAPIUtil.h"
#include "src/base/JsonConvert.h"
#include "src/base/Log.h"
#include "src/entry/APIUploadPrivate.h"
#include "src/entry/UploadFolder.h"
#include "webapi/APIRequest.h"

namespace TALO {

namespace {

constexpr char kSource[] = "APIUpload.cpp";
constexpr int kHashCapacity = 256;

// What this request's readings made. Attributes are out of a client's reach.
const char kFilesAttribute[] = "uploaded_files";

// The reader takes the address of the pointer: it may put another hash there.
class Hash {
  public:
    Hash() : hash_(TLIBCSzHashAlloc(kHashCapacity)) {}
    ~Hash() {
        TLIBCSzHashFree(hash_);
    }
    Hash(const Hash&) = delete;
    Hash& operator=(const Hash&) = delete;
    TALOSZHASH** Address() {
        return &hash_;
    }
    const TALOSZHASH* Get() const {
        return hash_;
    }

  private:
    TALOSZHASH* hash_;
};

// Digits and nothing else; what is no such number counts as no length.
unsigned long long ContentLength(const APIRequest& request) {
    const std::string text = ToText(request.GetEnv("CONTENT_LENGTH", ""));
    unsigned long long length = 0;
    for (const char byte : text) {
        if (byte < '0' || byte > '9') {
            return 0;
        }
        const unsigned long long digit = static_cast<unsigned long long>(byte - '0');
        if (length > (UINT64_MAX - digit) / 10) {
            return 0;
        }
        length = length * 10 + digit;
    }
    return length;
}

bool FindFolder(std::string* dir, unsigned long long size) {
    return FindUploadTmpDir(
        dir, size > UINT64_MAX - kUploadReserve ? UINT64_MAX : size + kUploadReserve);
}

}  // namespace

APIUploadPrivate::APIUploadPrivate(APIUpload* owner, APIRequest* request)
    : owner(owner), request(request), state(), cgi() {
    (void)TaloCgiInit("", &cgi);
}

APIUploadPrivate::~APIUploadPrivate() {
    TaloCgiFree(&cgi);
}

bool APIUploadPrivate::CopyContextHash(Json::Value& params) const {
    return WebAPIUtil::SzHashToJsonObj(cgi.paramHash, params);
}

// From the reader's own entries: the caller's object has the client's texts.
void APIUploadPrivate::RememberStored() {
    size_t position = 0;
    const char* key = nullptr;
    const char* path = nullptr;
    while (TLIBCSzHashNext(cgi.paramHash, &position, &key, &path) != 0) {
        if (path != nullptr && strcmp(key, fieldName) == 0) {
            Remember(path);
        }
    }
}

void APIUploadPrivate::Remember(const char* path) {
    Json::Value files = request->GetAttr(kFilesAttribute, Json::Value(Json::arrayValue));
    files.append(path);
    (void)request->SetAttr(kFilesAttribute, files);
}

bool APIUploadPrivate::IsUploadedFile(const std::string& path) const {
    const Json::Value files = request->GetAttr(kFilesAttribute, Json::Value(Json::arrayValue));
    for (const Json::Value& file : files) {
        if (file.isString() && file.asString() == path) {
            return true;
        }
    }
    return false;
}

int APIUploadPrivate::GetUploadAll(Json::Value& params, Json::Value* fileList) {
    const unsigned long long length = ContentLength(*request);
    if (length == 0) {
        return kUploadNothing;
    }
    std::string dir;
    if (!FindFolder(&dir, length)) {
        return kUploadNoSpace;
    }
    Hash fields;
    Hash files;
    if (fields.Get() == nullptr || files.Get() == nullptr) {
        LOG_ERROR("cannot alloc memory for hash!");
        return kUploadNoMemory;
    }
    const int result = TaloCgiLoadUploadAll(fields.Address(), files.Address(), dir.c_str(), 0);

    // Files of a failed reading are the caller's to delete like all others.
    size_t position = 0;
    const char* key = nullptr;
    const char* path = nullptr;
    while (TLIBCSzHashNext(files.Get(), &position, &key, &path) != 0) {
        if (path == nullptr) {
            continue;
        }
        Remember(path);
        if (fileList != nullptr) {
            fileList->append(path);
        }
    }
    if (result == kUploadDone && (!WebAPIUtil::SzHashToJsonObj(fields.Get(), params) ||
                                  !WebAPIUtil::SzHashToJsonObj(files.Get(), params))) {
        LOG_ERROR("cannot convert hash to Json object!");
        return kUploadNoMemory;
    }
    return result;
}

int APIUploadPrivate::GetUploadParam(Json::Value& params) {
    if (TaloCgiLoadUploadParams(&cgi, progress, &state, fileName, sizeof fileName, fieldName,
                                sizeof fieldName, fieldValue, sizeof fieldValue) > 0) {
        (void)CopyContextHash(params);
    }
    if (fieldName[0] != '\0' && fieldValue[0] != '\0' && (params.isObject() || params.isNull())) {
        params[fieldName] = fieldValue;
    }
    return state.status;
}

int APIUploadPrivate::GetUploadFile(Json::Value& params) {
    std::string dir;
    if (fileName[0] == '\0' || fieldName[0] == '\0' || fieldValue[0] == '\0') {
        state.status = kUploadNotPending;
    } else if (state.partSize == 0) {
        state.status = kUploadNothing;
    } else if (!FindFolder(&dir, state.partSize)) {
        state.status = kUploadNoSpace;
    } else if (TaloCgiLoadUploadFileToDir(&cgi, dir.c_str(), progress, &state, fileName, fieldName,
                                          fieldValue) > 0) {
        RememberStored();
        (void)CopyContextHash(params);
    }
    return state.status;
}

APIUpload::APIUpload(APIRequest* request) : d(new APIUploadPrivate(this, request)) {}

APIUpload::~APIUpload() {
    delete d;
}

void APIUpload::SetUploadCallback(Progress progress) {
    d->progress = progress;
}

int APIUpload::GetUploadAll(Json::Value& params, Json::Value* fileList) {
    return d->GetUploadAll(params, fileList);
}

int APIUpload::GetUploadParam(Json::Value& params) {
    return d->GetUploadParam(params);
}

int APIUpload::GetUploadFile(Json::Value& params) {
    return d->GetUploadFile(params);
}

bool APIUpload::IsUploadedFile(const std::string& path) const {
    return d->IsUploadedFile(path);
}

}  // namespace TALO
