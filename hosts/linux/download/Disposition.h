#ifndef TALO_HOSTS_LINUX_DOWNLOAD_DISPOSITION_H
#define TALO_HOSTS_LINUX_DOWNLOAD_DISPOSITION_H

#include <string>

namespace host {

// The value of Content-Disposition that has a client save the content under this
// name, in UTF-8: "attachment", a plain name for old clients, and where that is
// not all of it the full name besides. Whatever the name, the value is one line
// of printable ASCII in which nothing ends the quotes: of a path the last
// component counts, control characters, quotes' like and bytes that are no UTF-8
// become "_", and a name of which nothing is left becomes "download".
std::string AttachmentNamed(const std::string& fileName);

}  // namespace host

#endif
