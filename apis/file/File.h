#ifndef APIS_FILE_FILE_H
#define APIS_FILE_FILE_H

#include <string>

#include "hosts/linux/sdk/Places.h"

namespace TALO {
class APIRequest;
class APIResponse;
}  // namespace TALO

// Codes of TALO.File and TALO.File.Checksum. "errors" is the path that it is
// about, unless said otherwise.
enum FileCode {
    kBadParameter = 400,     // "errors" names the parameter
    kNoSuchFile = 401,       // nothing there, or in a share that the caller may not read
    kNoRight = 402,          // the caller may read, not write
    kExists = 403,           // something is there already
    kNotFolder = 404,        // a part of the path is no folder
    kNotFile = 405,          // a folder, or something that has no content
    kLeadsOut = 406,         // a link that leads out of the share
    kNotEmpty = 407,         // the folder that would be replaced is not empty
    kNoSpace = 408,          // the disk is full, or the quota used up
    kOtherFileSystem = 409,  // a rename from one file system to another
    kIntoItself = 410,       // a folder cannot become a part of itself
    kTooManyNames = 411,     // more names in a folder than can be read
    kRefusedBySystem = 412,  // read only, in use, or not permitted to the web API
    kFailed = 413,           // the disk fails; the system log says more
    kNotUploaded = 414,      // no file came in the field "file", or the body is no slice
    kStopped = 415,          // the task was stopped; "errors" says how far it had come

    // Of uploads in slices; "errors" is the upload's id until the upload is open, and
    // from then on {"upload_id", "offset"} with the bytes that have arrived.
    kNoSuchUpload = 416,     // or it is another user's, or has expired
    kUploadBusy = 417,       // another slice of it is arriving
    kWrongOffset = 418,      // the slice does not begin where the last one ended
    kTooLong = 419,          // the slice ends behind the file, or the file is too long
    kTooManyUploads = 420,   // unfinished ones of the caller
    kCutOff = 421,           // the slice ended early; what arrived is kept
    kWrongDigest = 422,      // the slice is not kept
    kNoDigest = 423,         // digests cannot be computed here; nothing was read
    kWrongFileDigest = 424,  // the upload is gone
};

// The code for what an operation on a share's file answers; 0 for a success.
int CodeOf(talo::FileError error);

// Sets the error that an operation has answered. False for kNone, which sets
// nothing.
bool AnswerError(TALO::APIResponse* response, talo::FileError error, const std::string& path);

// The methods of TALO.File.
void List(TALO::APIRequest* request, TALO::APIResponse* response);
void Stat(TALO::APIRequest* request, TALO::APIResponse* response);
void MakeFolder(TALO::APIRequest* request, TALO::APIResponse* response);
void Rename(TALO::APIRequest* request, TALO::APIResponse* response);
void Remove(TALO::APIRequest* request, TALO::APIResponse* response);
void Upload(TALO::APIRequest* request, TALO::APIResponse* response);
void UploadSlice(TALO::APIRequest* request, TALO::APIResponse* response);
void UploadStatus(TALO::APIRequest* request, TALO::APIResponse* response);
void Download(TALO::APIRequest* request, TALO::APIResponse* response);

// The method of TALO.File.Checksum.
void StartChecksum(TALO::APIRequest* request, TALO::APIResponse* response);

#endif
