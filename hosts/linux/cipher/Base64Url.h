#ifndef TALO_HOSTS_LINUX_CIPHER_BASE64URL_H
#define TALO_HOSTS_LINUX_CIPHER_BASE64URL_H

#include <cstddef>
#include <string>

namespace host {

// URL-safe base64 without padding: A-Z a-z 0-9 - _.
std::string ToBase64Url(const std::string& bytes);

// Back again. Only the one text that ToBase64Url gives for the bytes is taken: no
// padding, no blanks, and no bits left over that are not zero, so that a text
// cannot be altered without altering what it stands for.
bool FromBase64Url(const char* text, size_t size, std::string* bytes);

}  // namespace host

#endif
