#ifndef APIS_COMMON_TEXTPARAMETER_H
#define APIS_COMMON_TEXTPARAMETER_H

#include <string>

namespace TALO {
class APIRequest;
}

// Reads a text that a person types, such as a password. A form sends no types:
// the password 12345 arrives as a number and true as a boolean. Both are read as
// they were typed. A number with a fraction or an exponent is refused, since its
// spelling is lost; a client sends such a text as a JSON string. False also when
// the parameter is missing; `out` stays untouched then.
bool ReadTypedText(const TALO::APIRequest& request, const std::string& name, std::string* out);

#endif
