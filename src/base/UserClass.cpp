#include "src/base/UserClass.h"

#include "src/base/JsonText.h"

namespace TALO {

namespace {

struct ClassRow {
    const char* name;
    int bit;
};

const ClassRow kClasses[] = {
    {"admin.local", 1},  {"admin.domain", 2},   {"admin.ldap", 4},
    {"normal.local", 8}, {"normal.domain", 16}, {"normal.ldap", 32},
};

}  // namespace

int UserClassBit(const std::string& name) {
    for (const ClassRow& row : kClasses) {
        if (name == row.name) {
            return row.bit;
        }
    }
    return 0;
}

std::string UserClass(const std::string& userName, bool administrator) {
    const std::string rank = administrator ? "admin." : "normal.";
    if (userName.find('\\') != std::string::npos) {
        return rank + "domain";
    }
    return rank + (userName.find('@') != std::string::npos ? "ldap" : "local");
}

bool ListAdmits(const Json::Value& list, const char* userName, bool administrator) {
    return list.isArray() && userName != nullptr &&
           searchArrayIndex(list, UserClass(userName, administrator)) != Json::Value::maxUInt;
}

}  // namespace TALO
