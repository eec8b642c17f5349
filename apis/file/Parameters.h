#ifndef APIS_FILE_PARAMETERS_H
#define APIS_FILE_PARAMETERS_H

#include <string>

namespace TALO {
class APIRequest;
}

// Parameters that come typed in an ordinary call and as texts in an upload, whose
// form carries no types. Absent ones leave `out` as it is. False for a value of
// another kind, and `out` stays untouched.
bool ReadFlag(const TALO::APIRequest& request, const std::string& name, bool* out);
bool ReadNumber(const TALO::APIRequest& request, const std::string& name, long long least,
                long long most, long long* out);

#endif
