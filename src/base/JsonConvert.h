#ifndef TALO_SRC_BASE_JSONCONVERT_H
#define TALO_SRC_BASE_JSONCONVERT_H

#include <json/json.h>

#include <string>

namespace TALO {

// How a stored or received value reads as another type. The JSON library throws
// on most of these; none of the functions here does, except the Require pair.

// The member of an object, null when `value` is null or no object, or has no
// such member. Never inserts.
const Json::Value* FindMember(const Json::Value* value, const std::string& name);

// The same as a reference, to a JSON null when there is none.
const Json::Value& Member(const Json::Value& value, const std::string& name);

// Integers, whole or not (cut towards zero), booleans as 0 and 1, text that is
// one decimal integer, null as 0. Anything else, or out of range: the fallback.
int ToInt(const Json::Value& value, int fallback);
long long ToInt64(const Json::Value& value, long long fallback);

// An identifier of 32 bits; a negative number reads as its two's complement, so
// that -1 is "none" with all bits set.
unsigned int ToUInt(const Json::Value& value, unsigned int fallback);

// True for a non-empty text, a non-zero number, a non-empty array or object.
bool ToBool(const Json::Value& value);

// Numbers and booleans as the JSON library prints them; "" for null, arrays and objects.
std::string ToText(const Json::Value& value);

// The identity of a request must have the right type: these throw
// Json::LogicError for what is no integer, or no text, at all.
int RequireInt(const Json::Value& value);
std::string RequireText(const Json::Value& value);

// One decimal integer, an optional minus sign and nothing else, within range.
bool ParseInt64(const std::string& text, long long* out);

}  // namespace TALO

#endif
