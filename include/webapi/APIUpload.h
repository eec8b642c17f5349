#ifndef WEBAPI_APIUPLOAD_H
#define WEBAPI_APIUPLOAD_H

#include <json/json.h>

#include <string>

#include "webapi/APIExport.h"

namespace TALO {

class APIRequest;
class APIUploadPrivate;

/// Reads the body of an upload (multipart form data) into temporary files. The
/// entry does so for every method that allows uploads and does not defer them;
/// its files arrive as parameters and are deleted when the request ends. A method
/// whose description says "deferUpload" reads the body itself, part by part:
///
///     APIUpload upload(request);
///     Json::Value fields;
///     if (upload.GetUploadParam(fields) < 1 || upload.GetUploadFile(fields) < 1) {
///         response->SetError(kUploadFailed, Json::Value());
///         return;
///     }
///     Keep(fields["file"].asString());
///
/// For a file in the form field "file", the parameter "file" is the path of the
/// temporary file, "file_filename" the name that the client gave it, and
/// "file_size" its size. A client can write any text into a field: ask
/// IsUploadedFile before a path is trusted.
///
/// One object serves one reading. The request must outlive it.
///
/// Results: 1 success; -2 no folder has enough free space (the size and 5 MiB);
/// -6 nothing to read: no content length, or an empty file part; -8 no file part
/// is pending; -9 memory or conversion failed; other values are those of the
/// platform's reader. A client whose upload the entry refuses gets error 108 with
/// the result as "upload_err".
class WEBAPI_EXPORT APIUpload {
  public:
    /// Called now and then while the body is read: bytes done, bytes in total.
    typedef void (*Progress)(unsigned long long done, unsigned long long total);

    explicit APIUpload(APIRequest* request);
    ~APIUpload();
    APIUpload(const APIUpload&) = delete;
    APIUpload& operator=(const APIUpload&) = delete;

    /// Null ends the calls. GetUploadAll makes none.
    void SetUploadCallback(Progress progress);

    /// Reads the whole body. Fields and the paths of files become members of
    /// `params`; the paths are also appended to `fileList` (may be null), whatever
    /// the result, for the caller to delete.
    int GetUploadAll(Json::Value& params, Json::Value* fileList);

    /// Reads the fields before the first file part; of that part, the field's
    /// name with the client's file name.
    int GetUploadParam(Json::Value& params);

    /// Stores the pending file part in a temporary file, which is the caller's to
    /// delete or to move.
    int GetUploadFile(Json::Value& params);

    /// Whether a reading of this request made the file of this path, as opposed to
    /// a text that the client wrote.
    bool IsUploadedFile(const std::string& path) const;

  private:
    APIUploadPrivate* d;
};

}  // namespace TALO

#endif
