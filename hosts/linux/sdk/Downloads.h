#ifndef TALO_HOSTS_LINUX_SDK_DOWNLOADS_H
#define TALO_HOSTS_LINUX_SDK_DOWNLOADS_H

#include <string>

#include "platform/Platform.h"

// What the header lines of an answer with a file say. Nothing throws.
namespace talo {

// The value of the header Content-Disposition for content to be saved under a
// name in UTF-8, whatever is in the name: one line of printable ASCII. "attachment"
// when there is no memory for more.
TALO_PLATFORM std::string AttachmentNamed(const std::string& name);

// The MIME type for a file's name, by its extension; "application/octet-stream"
// for one that is not known.
TALO_PLATFORM std::string MimeTypeOf(const std::string& name);

}  // namespace talo

#endif
