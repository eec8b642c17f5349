#ifndef TALO_HOSTS_LINUX_DOWNLOAD_RANGES_H
#define TALO_HOSTS_LINUX_DOWNLOAD_RANGES_H

#include <cstdint>
#include <string>
#include <vector>

namespace host {

// A piece of a content; its length is never 0.
struct ByteRange {
    uint64_t first;
    uint64_t length;
};

enum class RangeAnswer {
    Whole,          // the header says nothing that counts
    Parts,          // one piece or more
    Unsatisfiable,  // all of it lies behind the end
};

// A header that asks for more pieces gets the whole content: a hundred bytes of
// header for each byte of content would be sent to whoever asks for it.
constexpr size_t kMaxRanges = 64;

// What a Range header asks of a content of `size` bytes. A header of another
// unit, or one that is wrong anywhere, asks for the whole. Pieces that overlap or
// touch become one, so that no byte goes out twice; apart from that they keep
// their order. `parts` is changed only with the answer Parts.
RangeAnswer ReadRanges(const std::string& header, uint64_t size, std::vector<ByteRange>* parts);

}  // namespace host

#endif
