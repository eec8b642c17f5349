#ifndef TALO_HOSTS_LINUX_UTIL_UTF8_H
#define TALO_HOSTS_LINUX_UTIL_UTF8_H

#include <cstddef>
#include <string>

namespace host {

// The number of bytes of the character that begins at a place within the text; 0
// when the bytes there are no UTF-8. Overlong forms, surrogates and what lies
// above U+10FFFF are none.
size_t Utf8Character(const std::string& text, size_t at);

// Whether the character at a place is a control character: of ASCII, or U+0080 to
// U+009F.
bool IsControlCharacter(const std::string& text, size_t at);

}  // namespace host

#endif
