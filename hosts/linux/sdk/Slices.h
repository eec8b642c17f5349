#ifndef TALO_HOSTS_LINUX_SDK_SLICES_H
#define TALO_HOSTS_LINUX_SDK_SLICES_H

#include <string>

#include "platform/Platform.h"

// Uploads that arrive in slices, each by a request of its own. What has arrived
// lies in a folder that only the web API's user may enter, until it is whole; an
// upload that nobody goes on with is swept away. Nothing throws; outputs stay
// untouched on failure.
namespace talo {

enum class SliceResult {
    kDone,
    kNotFound,     // no upload of that id and owner; it may have expired
    kBusy,         // another process holds it: a slice is arriving
    kWrongOffset,  // nothing was read; the upload's Offset is the expected one
    kTooLong,      // beyond the file's length, or the file beyond the host's limit
    kTooMany,      // the owner has as many unfinished uploads as he may have
    kCut,          // the client went away; what arrived is kept
    kWrongDigest,  // what arrived is not what was sent; it is not kept
    kNoDigest,     // digests cannot be computed here; nothing was read
    kNoSpace,      // what arrived until then is kept
    kFailed        // anything else; logged
};

// What an upload is to become.
struct SliceFile {
    std::string owner;              // 1 to 100 bytes
    unsigned long long length = 0;  // bytes of the whole
    std::string digest;             // SHA-256 of the whole in hexadecimal, "" for unchecked
    std::string target;             // the creator's own text, at most 16,384 bytes of UTF-8
    long long created = 0;          // seconds since the epoch; made here
    bool complete = false;          // taken away by its creator; made here
};

// Whether a text has the form of an id: it may then be a part of a path.
TALO_PLATFORM bool IsSliceId(const std::string& id);

// Whether a text has the form of a SHA-256 digest: 64 hexadecimal digits.
TALO_PLATFORM bool IsSliceDigest(const std::string& text);

// One upload, held by this object alone: no other process appends to it or
// sweeps it meanwhile. It is let go, not ended, when the object goes.
//
//     talo::SliceUpload upload;
//     if (upload.Open(id, user) == talo::SliceResult::kDone &&
//         upload.Append(offset, bytes, "") == talo::SliceResult::kDone &&
//         upload.Offset() == upload.File().length &&
//         upload.Check() == talo::SliceResult::kDone && Take(upload.DataPath())) {
//         (void)upload.Complete();
//     }
class TALO_PLATFORM SliceUpload {
  public:
    SliceUpload();
    ~SliceUpload();
    SliceUpload(const SliceUpload&) = delete;
    SliceUpload& operator=(const SliceUpload&) = delete;

    // Begins an upload and holds it. kTooLong, kTooMany, kNoSpace (not even now is
    // there room for the whole), kFailed.
    SliceResult Create(const SliceFile& file);

    // kNotFound, kBusy, kFailed. One that is complete is found, too, as long as it
    // is remembered, and is held by nobody.
    SliceResult Open(const std::string& id, const std::string& owner);

    // Of the upload that is held.
    const std::string& Id() const;
    const SliceFile& File() const;
    unsigned long long Offset() const;  // bytes that have arrived

    // Appends `bytes` bytes of standard input, of which nothing more is read. What
    // has been appended is on the disk when this answers kDone. With a `digest`,
    // of these bytes, a slice that differs is taken back; one that is cut off or
    // meets a full disk cannot be compared and is kept as far as it came.
    SliceResult Append(unsigned long long offset, unsigned long long bytes,
                       const std::string& digest);

    // Compares a whole upload with its digest, if it has one. One that differs is
    // abandoned: kWrongDigest.
    SliceResult Check();

    // The file with what has arrived, to be moved away when it is whole.
    std::string DataPath() const;

    // Remembers that the data were moved away, for a client that missed the last
    // answer. False when that cannot be done; the upload is unknown then.
    bool Complete();

    // Ends the upload and deletes what arrived.
    bool Abandon();

  private:
    SliceResult Hold(const std::string& folder, const std::string& id);
    void LetGo();
    void Close();
    std::string folder_;
    std::string id_;
    SliceFile file_;
    unsigned long long offset_;
    int record_;  // open and locked, -1 when nothing is held
    int data_;    // open, -1 when nothing is held
};

// How far an upload has come, also while a slice is arriving or the whole is being
// moved away. kNotFound, kFailed.
TALO_PLATFORM SliceResult FindSliceUpload(const std::string& id, const std::string& owner,
                                          SliceFile* file, unsigned long long* offset);

// Removes what has gone unused for too long, unless it did so within the last
// hour. Creating and opening do this on the way.
TALO_PLATFORM void SweepSliceUploads();

}  // namespace talo

#endif
