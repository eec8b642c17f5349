#ifndef TALO_SRC_BASE_JSONTEXT_H
#define TALO_SRC_BASE_JSONTEXT_H

#include <json/json.h>

#include <string>

namespace TALO {

// The value as one compact line of JSON, fit to be sent as text/html: "<", ">",
// "&", U+2028 and U+2029 are written as \u escapes, so that no reply can carry
// markup. UTF-8 passes through; a byte that is no UTF-8 becomes U+FFFD. Integers
// are exact, doubles the shortest text that reads back as the same number (with
// ".0" when it would read as an integer), not-a-number and infinities null.
std::string toString(const Json::Value& value);

// The index of the first element equal to `wanted`, or Json::Value::maxUInt when
// there is none or `array` is no array.
Json::ArrayIndex searchArrayIndex(const Json::Value& array, const Json::Value& wanted);

}  // namespace TALO

#endif
