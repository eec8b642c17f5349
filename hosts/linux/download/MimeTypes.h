#ifndef TALO_HOSTS_LINUX_DOWNLOAD_MIMETYPES_H
#define TALO_HOSTS_LINUX_DOWNLOAD_MIMETYPES_H

#include <string>

namespace host {

// The system's table: a type and its extensions, one type a line.
extern const char kMimeTable[];

// What a content is when nobody knows better.
extern const char kAnyType[];

// The type of a file by its name's extension, without regard to case: as the
// table says, as a small built-in one says, or kAnyType. Only the last component
// of a path counts, and the dot of a hidden file begins no extension.
std::string MimeTypeOf(const std::string& fileName, const char* table);

// The text itself when it can be the value of Content-Type: a type, a slash, a
// subtype, perhaps parameters, all of it printable ASCII. kAnyType otherwise.
std::string CheckedMimeType(const char* text);

}  // namespace host

#endif
