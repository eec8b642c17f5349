#include "src/entry/Environment.h"

#include <stdlib.h>

namespace TALO {

void SetForRequest(Json::Value* changes, const char* name, const std::string& value) {
    Json::Value& change = (*changes)[name];
    if (change.isNull()) {
        const char* before = getenv(name);
        change["before"] = before != nullptr ? Json::Value(before) : Json::Value();
    }
    change["now"] = value;
    (void)setenv(name, value.c_str(), 1);
}

void EndEnvironment(const Json::Value& changes) {
    for (auto change = changes.begin(); change != changes.end(); ++change) {
        const std::string name = change.name();
        const char* now = getenv(name.c_str());
        if (now == nullptr || (*change)["now"] != Json::Value(now)) {
            continue;
        }
        const Json::Value& before = (*change)["before"];
        (void)(before.isString() ? setenv(name.c_str(), before.asCString(), 1)
                                 : unsetenv(name.c_str()));
    }
}

}  // namespace TALO
