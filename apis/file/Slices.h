#ifndef APIS_FILE_SLICES_H
#define APIS_FILE_SLICES_H

#include <string>

namespace TALO {
class APIRequest;
class APIResponse;
}  // namespace TALO

// What a slice's request says in its query. The body is the slice's bytes alone.
struct SliceParameters {
    std::string uploadId;  // "" to begin an upload
    unsigned long long offset = 0;
    unsigned long long bytes = 0;  // of this slice
    std::string digest;            // of this slice, "" for none
    bool overwrite = false;

    // What the upload is to become; all but the length only when it begins.
    bool hasLength = false;
    unsigned long long length = 0;
    std::string fileDigest;  // "" for none
    long long mtime = -1;
};

// False with the error set on the response.
bool ReadSliceParameters(const TALO::APIRequest& request, TALO::APIResponse* response,
                         SliceParameters* parameters);

// Where an upload goes when it is whole, as the text that is kept with it, and
// back. False for a text that is none of these.
struct SliceTarget {
    std::string path;
    bool overwrite = false;
    long long mtime = -1;  // negative for the time of the upload
};
std::string FormatSliceTarget(const SliceTarget& target);
bool ParseSliceTarget(const std::string& text, SliceTarget* target);

#endif
