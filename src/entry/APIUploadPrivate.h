#ifndef TALO_SRC_ENTRY_APIUPLOADPRIVATE_H
#define TALO_SRC_ENTRY_APIUPLOADPRIVATE_H

#include <string>

#include "platform/Cgi.h"
#include "webapi/APIUpload.h"

namespace TALO {

// Results of a reading; the platform's reader has more.
enum UploadResult {
    kUploadDone = 1,
    kUploadNoSpace = -2,
    kUploadNothing = -6,
    kUploadNotPending = -8,
    kUploadNoMemory = -9,
};

class APIUploadPrivate {
  public:
    APIUploadPrivate(APIUpload* owner, APIRequest* request);
    ~APIUploadPrivate();
    APIUploadPrivate(const APIUploadPrivate&) = delete;
    APIUploadPrivate& operator=(const APIUploadPrivate&) = delete;

    int GetUploadAll(Json::Value& params, Json::Value* fileList);
    int GetUploadParam(Json::Value& params);
    int GetUploadFile(Json::Value& params);
    bool IsUploadedFile(const std::string& path) const;

    APIUpload* owner;
    APIRequest* request;
    APIUpload::Progress progress = nullptr;
    TALOCGIUPLOAD state;
    char fileName[256] = "";
    char fieldName[64] = "";
    char fieldValue[491] = "";
    TALOCGI cgi;

  private:
    bool CopyContextHash(Json::Value& params) const;
    void RememberStored();
    void Remember(const char* path);
};

}  // namespace TALO

#endif
