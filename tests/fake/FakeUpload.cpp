#include <string.h>

#include "hosts/linux/conf/KeyValueText.h"
#include "hosts/linux/util/SzHash.h"
#include "platform/Cgi.h"
#include "platform/System.h"
#include "platform/WebAPIUtil.h"
#include "tests/fake/FakePlatform.h"

namespace {

void Fill(TALOSZHASH** hash, const std::map<std::string, std::string>& entries) {
    if (*hash == nullptr) {
        *hash = TLIBCSzHashAlloc(0);
    }
    for (const auto& entry : entries) {
        (void)host::HashSet(*hash, entry.first, entry.second);
    }
}

bool Copies(const std::string& text, char* buffer, size_t size) {
    if (text.size() >= size) {
        return false;
    }
    memcpy(buffer, text.c_str(), text.size() + 1);
    return true;
}

// The platform tells of the progress of what it reads.
void Report(TALOCGIPROGRESS progress) {
    const fake::UploadScript& script = fake::Now().upload;
    if (progress != nullptr) {
        progress(script.counters.second, script.counters.first);
    }
}

}  // namespace

extern "C" {

TALOSZHASH* TLIBCSzHashAlloc(int capacity) {
    fake::Now().hashCapacities.push_back(capacity);
    TALOSZHASH* hash = fake::Now().Called("TLIBCSzHashAlloc") ? nullptr : host::NewHash(capacity);
    fake::Now().openHashes += hash != nullptr ? 1 : 0;
    return hash;
}

void TLIBCSzHashFree(TALOSZHASH* hash) {
    fake::Now().openHashes -= hash != nullptr ? 1 : 0;
    delete hash;
}

void TLIBCHashRemoveAll(TALOSZHASH* hash) {
    fake::Now().journal.push_back("TLIBCHashRemoveAll");
    host::HashClear(hash);
}

int TLIBCSzHashNext(const TALOSZHASH* hash, size_t* position, const char** key,
                    const char** value) {
    return host::HashNext(hash, position, key, value);
}

int TaloCgiLoadUploadAll(TALOSZHASH** params, TALOSZHASH** files, const char* dir, int flags) {
    const fake::UploadScript& script = fake::Now().upload;
    fake::Now().uploadCalls.push_back({"TaloCgiLoadUploadAll", dir, flags, "", "", "", false});
    if (fake::Now().Called("TaloCgiLoadUploadAll")) {
        return TALO_UPLOAD_GONE;
    }
    // Also what a failed reading leaves is for a test to say.
    Fill(params, script.params);
    Fill(files, script.files);
    for (const auto& file : script.files) {
        fake::Now().files[file.second] = "content of " + file.first;
    }
    return script.allResult;
}

int TaloCgiLoadUploadParams(TALOCGI* ctx, TALOCGIPROGRESS progress, TALOCGIUPLOAD* upload,
                            char* fileName, size_t fileNameSize, char* fieldName,
                            size_t fieldNameSize, char* fieldValue, size_t fieldValueSize) {
    const fake::UploadScript& script = fake::Now().upload;
    fake::Now().uploadCalls.push_back({"TaloCgiLoadUploadParams", "", 0,
                                       std::to_string(fileNameSize), std::to_string(fieldNameSize),
                                       std::to_string(fieldValueSize), progress != nullptr});
    if (fake::Now().Called("TaloCgiLoadUploadParams")) {
        upload->status = TALO_UPLOAD_GONE;
        return upload->status;
    }
    upload->partSize = script.partSize;
    upload->status = script.paramsStatus;
    if (!Copies(script.fileName, fileName, fileNameSize) ||
        !Copies(script.fieldName, fieldName, fieldNameSize) ||
        !Copies(script.fieldValue, fieldValue, fieldValueSize)) {
        upload->status = TALO_UPLOAD_LIMIT;
        return upload->status;
    }
    Report(progress);
    if (script.paramsResult > 0) {
        Fill(&ctx->paramHash, script.params);
    }
    return script.paramsResult;
}

int TaloCgiLoadUploadFileToDir(TALOCGI* ctx, const char* dir, TALOCGIPROGRESS progress,
                               TALOCGIUPLOAD* upload, const char* fileName, const char* fieldName,
                               const char* fieldValue) {
    const fake::UploadScript& script = fake::Now().upload;
    fake::Now().uploadCalls.push_back({"TaloCgiLoadUploadFileToDir", dir, 0, fileName, fieldName,
                                       fieldValue, progress != nullptr});
    if (fake::Now().Called("TaloCgiLoadUploadFileToDir")) {
        upload->status = TALO_UPLOAD_STORE;
        return upload->status;
    }
    Report(progress);
    upload->status = script.fileResult;
    if (script.fileResult > 0) {
        Fill(&ctx->paramHash, script.stored);
    }
    return script.fileResult;
}

int TaloCgiLoadUploadNumParams(TALOSZHASH** params, int count, int flags,
                               TALOCGIUPLOADCOUNTERS* counters, char* name, size_t nameSize) {
    const fake::UploadScript& script = fake::Now().upload;
    fake::Now().uploadCalls.push_back({"TaloCgiLoadUploadNumParams", "", flags,
                                       std::to_string(count), std::to_string(nameSize), "", false});
    if (fake::Now().Called("TaloCgiLoadUploadNumParams")) {
        return TALO_UPLOAD_MALFORMED;
    }
    Fill(params, script.firstFields);
    counters->total = script.counters.first;
    counters->consumed = script.counters.second;
    (void)Copies("", name, nameSize);
    return static_cast<int>(script.firstFields.size());
}

int VolumeAvailGet(unsigned long long size, TALOVOLUME* volume, int* status, int flags) {
    const TALOVOLUME zero = {};
    fake::Now().volumeCalls.push_back(
        {size, *status, flags, memcmp(volume, &zero, sizeof zero) == 0});
    if (fake::Now().Called("VolumeAvailGet") || fake::Now().volume.empty()) {
        *status = TALO_VOLUME_NONE;
        return -1;
    }
    if (size > fake::Now().volumeFree) {
        *status = TALO_VOLUME_FULL;
        return 0;
    }
    volume->freeBytes = fake::Now().volumeFree;
    *status = 0;
    return Copies(fake::Now().volume, volume->mountPath, sizeof volume->mountPath)
               ? fake::Now().volumeAnswer
               : -1;
}

void TLIBCErrSet(int code) {
    fake::Now().errors.push_back(code);
}

int TLIBCErrGet(void) {
    return fake::Now().errors.empty() ? 0 : fake::Now().errors.back();
}

int TLIBCFileCheckKeyValue(const char* file, const char* key, const char* value, int) {
    const auto found = fake::Now().files.find(file);
    return !fake::Now().Called("TLIBCFileCheckKeyValue") && found != fake::Now().files.end() &&
                   host::HasKeyValue(found->second, key, value)
               ? 1
               : 0;
}

int TALOFSMkdirP(const char* path, int flags, int parents, int uid, int gid, mode_t mode) {
    fake::Now().foldersMade.push_back({path, flags, parents, uid, gid, mode});
    return fake::Now().Called("TALOFSMkdirP") ? -1 : 0;
}

}  // extern "C"

namespace TALO {

bool WebAPIUtil::SzHashToJsonObj(const TALOSZHASH* hash, Json::Value& out) {
    return !fake::Now().Called("SzHashToJsonObj") && host::HashToJson(hash, out);
}

}  // namespace TALO
