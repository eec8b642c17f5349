#ifndef TALO_HOSTS_LINUX_CGI_CONTENTDISPOSITION_H
#define TALO_HOSTS_LINUX_CGI_CONTENTDISPOSITION_H

#include <string>

namespace host {

// What a part says of itself.
struct ContentDisposition {
    std::string name;      // of the form field
    bool isFile = false;   // it has a file name, if only an empty one
    std::string fileName;  // the client's, its last component; "" where none was chosen
};

// Parses the value of a part's Content-Disposition header. "filename*" (RFC 5987,
// UTF-8 only) goes before "filename"; in another character set it is passed over
// where there is a "filename" too. False, and `out` untouched, for another type
// than form-data, for no name or an empty one, for a name or a file name that
// IsPlainText or ClientFileName refuses, and for a file name in numbered pieces.
bool ParseContentDisposition(const std::string& text, ContentDisposition* out);

}  // namespace host

#endif
