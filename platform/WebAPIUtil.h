#ifndef TALO_PLATFORM_WEBAPIUTIL_H
#define TALO_PLATFORM_WEBAPIUTIL_H

#include <json/json.h>

#include <cstddef>
#include <string>

#include "platform/Platform.h"
#include "platform/System.h"

namespace TALO {

// Text in and out of JSON: description files, percent encoding, parameter
// lines. All text is hostile. Nothing throws; outputs stay untouched on
// failure, except that pairs merged before a failing one stay.
class TALO_PLATFORM WebAPIUtil {
  public:
    // A description or parameter nested deeper than this is refused.
    static constexpr size_t kMaxJsonDepth = 64;
    // A larger description file is refused.
    static constexpr size_t kMaxJsonFileBytes = 4u << 20;
    // A line with more pairs is refused: each costs a node of memory.
    static constexpr size_t kMaxPairs = 10000;

    // Reads a file that holds exactly one JSON object or array: strict JSON, no
    // NUL, nothing behind it but white space. The reason of a refusal is logged.
    static bool ReadJsonFile(Json::Value& out, const char* path);

    // Percent-decodes once; with `plusIsBlank` a plus sign becomes a blank. A
    // percent sign without two hexadecimal digits stays as it is.
    static std::string URLDecode(const std::string& text, bool plusIsBlank);

    // Percent-encodes every byte but ASCII letters, digits, "-", "_", "." and "~".
    static std::string URLEncode(const std::string& text);

    // Splits at each occurrence of the separator into an array of texts, blanks
    // around each piece removed. An empty text, or separator, gives one piece.
    static Json::Value ParseToArray(const std::string& text, const std::string& separator);

    // Adds the pairs of a line ("name=value", separated by "&") to `out`, a JSON
    // object or null; a later pair replaces an earlier one and what `out` had.
    // `decode` percent-decodes names and values once (a plus is a blank). With
    // `parseJson` a value that is one complete, strict JSON value at most
    // kMaxJsonDepth deep is stored as that value, and a line that is itself one
    // JSON object adds its members; all else is stored as text, and so is what goes
    // beyond a port's bound on the JSON values of one line. Empty pieces and
    // pairs with an empty name add nothing; a piece without "=" is a name with an
    // empty text. False for more than kMaxPairs pairs or when `out` is something
    // else than an object or null.
    static bool strPairToJsonObj(const std::string& line, Json::Value& out, bool decode,
                                 bool parseJson);

    // Copies each entry of a hash as a text member. False for a null hash or when
    // `out` is something else than an object or null.
    static bool SzHashToJsonObj(const TALOSZHASH* hash, Json::Value& out);
};

}  // namespace TALO

#endif
