#ifndef TALO_SRC_RESPONSE_APIDOWNLOADPRIVATE_H
#define TALO_SRC_RESPONSE_APIDOWNLOADPRIVATE_H

#include <string>

#include "platform/HTTPFileOutputer.h"
#include "webapi/APIDownload.h"

namespace TALO {

class APIDownloadPrivate {
  public:
    APIDownloadPrivate(APIDownload* owner, APIResponse* response, bool ownsResponse);
    ~APIDownloadPrivate();
    APIDownloadPrivate(const APIDownloadPrivate&) = delete;
    APIDownloadPrivate& operator=(const APIDownloadPrivate&) = delete;

    // Header lines without the blank line: the outputer has more to add.
    void PrintHeader();

    APIDownload* owner;
    APIResponse* response;
    std::string mimeType;
    HTTPFileOutputer outputer;
    bool ownsResponse;
};

}  // namespace TALO

#endif
