#ifndef TALO_SRC_PARAM_APIVALIDATORPRIVATE_H
#define TALO_SRC_PARAM_APIVALIDATORPRIVATE_H

#include <regex.h>

#include <map>
#include <string>

namespace TALO {

// Compiled expressions by the address of their pattern: finding one costs no look
// at its text.
class APIValidatorPrivate {
  public:
    APIValidatorPrivate() = default;
    ~APIValidatorPrivate();
    APIValidatorPrivate(const APIValidatorPrivate&) = delete;
    APIValidatorPrivate& operator=(const APIValidatorPrivate&) = delete;

    // The expression stays the cache's.
    bool GetRegex(const char* pattern, regex_t** out);
    bool CheckRegex(const std::string& value, const char* pattern);

    std::map<const char*, regex_t*> regexCache;
};

}  // namespace TALO

#endif
