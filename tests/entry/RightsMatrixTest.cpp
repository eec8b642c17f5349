#include "tests/entry/PermissionFixture.h"

namespace {

struct User {
    const char* name;
    bool admin;
    const char* userClass;
};

const User kUsers[] = {
    {"ann", false, "normal.local"},      {"DOM\\ann", false, "normal.domain"},
    {"ann@x", false, "normal.ldap"},     {"root", true, "admin.local"},
    {"DOM\\root", true, "admin.domain"}, {"root@x", true, "admin.ldap"},
};

// "OWN" and "OTHERS" stand for the user's class and for the five others.
struct List {
    const char* list;
    bool admits;
};

const List kLists[] = {
    {"\"(absent)\"", false}, {"[]", false},       {"OWN", false},
    {"[OWN]", true},         {"[OTHERS]", false}, {"[OTHERS, OWN]", true},
};

enum Level { kAlways, kLogin, kOptional };

struct LevelOf {
    const char* level;
    Level meaning;
};

const LevelOf kLevels[] = {
    {"\"(absent)\"", kLogin}, {"0", kAlways}, {"1", kLogin}, {"2", kOptional}};

struct Privilege {
    const char* privilege;
    bool held;
};

const Privilege kPrivileges[] = {
    {"\"(absent)\"", true}, {"\"Held\"", true}, {"\"Missing\"", false}};

struct Method {
    const char* name;
    bool allowsTimeout;
};

const Method kMethods[] = {{"who", false}, {"tolerant", true}};

struct Login {
    const char* name;
    const char* cookie;
    int result;
    int code;           // of the session check, timeout not allowed
    int toleratedCode;  // and allowed
};

const Login kLogins[] = {
    {"live", "id=s1", 1, 0, 0},
    {"timed out", "id=s1", -1, 106, 0},
    {"unknown", "id=other", 1, 105, 105},
    {"none", "", 1, 119, 119},
};

std::string ListFor(const User& user, const List& list) {
    std::string others;
    for (const User& other : kUsers) {
        if (other.name != user.name) {
            others += (others.empty() ? "\"" : ", \"") + std::string(other.userClass) + "\"";
        }
    }
    std::string text = list.list;
    for (const auto& [word, value] :
         {std::make_pair(std::string("OTHERS"), others),
          std::make_pair(std::string("OWN"), "\"" + std::string(user.userClass) + "\"")}) {
        const size_t at = text.find(word);
        if (at != std::string::npos) {
            text.replace(at, word.size(), value);
        }
    }
    return text;
}

class RightsMatrix : public rights::PermissionFixture {
  protected:
    // The code of a call of "Test.Rights" as it is described now.
    int Code(const Method& method, const Login& login) {
        EndRequest();
        Session().result = login.result;
        Call(method.name, "Test.Rights", login.cookie);
        return Run();
    }

    static int Expected(const List& list, const LevelOf& level, const Privilege& privilege,
                        const Method& method, const Login& login) {
        if (level.meaning != kLogin) {
            return 0;
        }
        const int session = method.allowsTimeout ? login.toleratedCode : login.code;
        return session != 0 ? session : list.admits && privilege.held ? 0 : 105;
    }
};

TEST_F(RightsMatrix, OfEveryUserListLevelPrivilegeMethodAndLogin) {
    int calls = 0;
    for (const User& user : kUsers) {
        Session().user = user.name;
        fake::Now().administrators.clear();
        if (user.admin) {
            fake::Now().administrators.insert(user.name);
        }
        fake::Now().privileges = {std::string(user.name) + "/Held"};
        for (const List& list : kLists) {
            for (const LevelOf& level : kLevels) {
                for (const Privilege& privilege : kPrivileges) {
                    const std::string description = R"({"allowUser": )" + ListFor(user, list) +
                                                    R"(, "authLevel": )" + level.level +
                                                    R"(, "appPriv": )" + privilege.privilege + "}";
                    Describe(description);
                    for (const Method& method : kMethods) {
                        for (const Login& login : kLogins) {
                            EXPECT_EQ(Code(method, login),
                                      Expected(list, level, privilege, method, login))
                                << user.name << " calls " << method.name << " with login "
                                << login.name << ": " << description;
                            ++calls;
                        }
                    }
                }
            }
        }
    }
    EXPECT_EQ(calls, 6 * 6 * 4 * 3 * 2 * 4);
}

}  // namespace
