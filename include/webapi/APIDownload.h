#ifndef WEBAPI_APIDOWNLOAD_H
#define WEBAPI_APIDOWNLOAD_H

#include <json/json.h>

#include <cstdio>
#include <string>

#include "webapi/APIExport.h"

namespace TALO {

class APIDownloadPrivate;
class APIResponse;

/// Answers a request with a file instead of JSON: prints the response's header
/// lines and hands the file to the platform, which adds the content headers,
/// ends the header block and sends the content (the whole, the ranges that the
/// client asked for, or nothing where its copy is still good).
///
///     void GetReport(APIRequest* request, APIResponse* response) {
///         response->SetEnableOutput(false);   // no JSON behind the file
///         response->RemoveHeader("Content-type");   // that of the JSON
///         APIDownload download(response);
///         download.SetMimeType("application/pdf");
///         (void)download.Output("/var/lib/acme/report.pdf");
///     }
///
/// The method's description needs "allowDownload": without it standard output is
/// not connected. The response's own header "Content-type" is printed like any
/// other, beside the one of the content: take it out, under exactly this name, so
/// that the client gets one.
class WEBAPI_EXPORT APIDownload {
  public:
    /// Prints the headers of the given response, which stays the caller's.
    explicit APIDownload(APIResponse* response);
    /// Makes a response of its own, with the default headers.
    APIDownload();
    ~APIDownload();
    APIDownload(const APIDownload&) = delete;
    APIDownload& operator=(const APIDownload&) = delete;

    /// Whether the web server may be asked to send the file itself: the
    /// environment's MOD_X_SENDFILE_ENABLED is "yes", in any letter case.
    static bool GetXSendFileEnabled();

    /// Takes that variable out of the environment, for this process. 0 also when
    /// it was not there, -1 on failure.
    static int SetXSendFileDisabled();

    /// The content's type, as given or by a file's name. Unset, a path gives its
    /// type by its name and a stream counts as "application/octet-stream".
    void SetMimeType(const std::string& type);
    void SetMimeTypeFromFileName(const std::string& fileName);

    /// Sets a header of the response. False when there is no response or the name
    /// is empty. Values are printed as they stand: never pass a client's text that
    /// may have a line end in it.
    bool SetHeader(const std::string& name, const std::string& value);

    /// Sets the members that are texts, in their order; others are skipped. False
    /// at the first that fails; those before it stay.
    bool SetHeader(const Json::Value& headers);

    /// Prints headers and content. 0 on success, else the platform's negative
    /// result; the answer has begun by then. The caller keeps the stream.
    int Output(FILE* file);
    int Output(const std::string& path);

  private:
    APIDownloadPrivate* d;
};

}  // namespace TALO

#endif
