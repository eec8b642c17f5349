#ifndef TALO_HOSTS_LINUX_CGI_CLIENTFILENAME_H
#define TALO_HOSTS_LINUX_CGI_CLIENTFILENAME_H

#include <cstddef>
#include <string>

namespace host {

// Longer names fit no file system.
constexpr size_t kMaxClientFileName = 255;

// Whether a text is UTF-8 (shortest forms, no surrogates) without control
// characters, U+0080 to U+009F among them.
bool IsPlainText(const std::string& text);

// The last component of what a client calls a file, behind any "/" or "\". False,
// and `name` untouched, when `raw` is no plain text or the component is empty,
// ".", ".." or longer than kMaxClientFileName bytes.
bool ClientFileName(const std::string& raw, std::string* name);

}  // namespace host

#endif
