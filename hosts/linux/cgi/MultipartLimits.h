#ifndef TALO_HOSTS_LINUX_CGI_MULTIPARTLIMITS_H
#define TALO_HOSTS_LINUX_CGI_MULTIPARTLIMITS_H

#include <cstddef>

namespace host {

// What one body may ask for. Each is the largest that is still accepted, and a
// key of the host's configuration, given behind it.
struct MultipartLimits {
    // Parts, fields and files together: each costs memory, each file a directory
    // entry. "upload_parts"
    size_t parts = 1000;
    // The header lines of one part with their line ends: they are held in memory.
    // "upload_header_bytes"
    size_t headerBytes = 8192;
    // Text before the first boundary, which nobody needs: a body that never comes
    // to a boundary ends here. "upload_preamble_bytes"
    size_t preambleBytes = 4096;
    // One field's text, and all of a body together: they are held in memory.
    // "upload_field_bytes", "upload_fields_bytes"
    size_t fieldBytes = 1u << 20;
    size_t allFieldsBytes = 4u << 20;
    // The whole body, files and all, for a disk that is not to be filled by one
    // client. "upload_total_bytes"
    unsigned long long totalBytes = 1ull << 42;
};

// A boundary's length as RFC 2046 has it.
constexpr size_t kMaxBoundary = 70;
// Blanks behind a boundary, which some gateways add.
constexpr size_t kMaxBoundaryPadding = 256;

// The configured limits. A value that is no positive decimal number is passed
// over, and so is one beyond what the memory of a request bears: 10,000 parts,
// 1 MiB of headers or preamble, 16 MiB of fields.
MultipartLimits ConfiguredMultipartLimits();

}  // namespace host

#endif
