#ifndef TALO_SRC_REQUEST_CARRIERS_H
#define TALO_SRC_REQUEST_CARRIERS_H

#include <json/json.h>

#include <string>

namespace TALO {

// The parameters that carry enciphered ones. The mixed case keeps them apart
// from any parameter that an API would name.
extern const char kCipherText[];    // a line under the appliance's own cipher
extern const char kCipherToken[];   // goes with it inside a nested "webapi" object
extern const char kAESText[];       // a line under the key of a token
extern const char kAESToken[];      // that token
extern const char kNestedObject[];  // the parameters of an inner request

// Takes a carrier out of an object, so that it never reaches a method, whatever
// becomes of it. `text` receives its value as a text: "" for an array or an
// object. False, with both untouched, when there is none.
bool TakeCarrier(Json::Value& params, const char* name, std::string* text);

// The nested object, or null when there is none: a "webapi" of another type is
// an ordinary parameter.
Json::Value* NestedObject(Json::Value& params);

// Has the platform decipher a copy of the text in place and merges the pairs of
// the line that it leaves. False when either fails; pairs merged so far stay.
bool MergeDeciphered(const std::string& text, int (*decipher)(char*), Json::Value& params);

// The step for a line under the key of a token, alike on the request and on the
// entry: nothing to do is a success; once both carriers are there, they are
// removed in any case.
bool DecryptAESCarriers(Json::Value& params);

}  // namespace TALO

#endif
