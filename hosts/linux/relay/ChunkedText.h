#ifndef TALO_HOSTS_LINUX_RELAY_CHUNKEDTEXT_H
#define TALO_HOSTS_LINUX_RELAY_CHUNKEDTEXT_H

#include <cstddef>

namespace host {

// An answer in chunks ("Transfer-Encoding: chunked"), out of pieces as they come.
// libcurl reads such answers too, but does not tell when one is whole before the
// request is.
class ChunkedText {
  public:
    // Goes on from `at` to the next bytes of the content, which may be none at the
    // end of the piece. False for a text that is none of that form.
    bool Next(const char** at, const char* end, const char** content, size_t* size);

    bool IsWhole() const {
        return place_ == Place::kEnd;
    }

  private:
    enum class Place { kSize, kExtension, kData, kDataEnd, kTrailer, kEnd };

    bool Step(char byte);
    void EndSizeLine();

    Place place_ = Place::kSize;
    unsigned long long left_ = 0;  // of the chunk
    int digits_ = 0;
    bool lineIsEmpty_ = true;
};

}  // namespace host

#endif
