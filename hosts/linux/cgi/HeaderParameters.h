#ifndef TALO_HOSTS_LINUX_CGI_HEADERPARAMETERS_H
#define TALO_HOSTS_LINUX_CGI_HEADERPARAMETERS_H

#include <map>
#include <string>

namespace host {

// A header value of the form  value; name=token; name="quoted text".
struct ParametrizedValue {
    std::string value;                              // in lower case
    std::map<std::string, std::string> parameters;  // names in lower case, texts unquoted
};

// False, and `out` untouched, for anything else, and for a name that comes twice.
// Within quotes a backslash stands before a quote or a backslash; before any
// other character it is itself, since some clients send a path of theirs.
bool ParseParametrizedValue(const std::string& text, ParametrizedValue* out);

// Whether a text is a token of RFC 7230: not empty, no blank, no separator.
bool IsToken(const std::string& text);

// ASCII only, whatever the locale.
std::string LowerCase(std::string text);

}  // namespace host

#endif
