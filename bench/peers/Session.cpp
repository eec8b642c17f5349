#include "Session.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <time.h>

#include "JsonFile.h"

namespace {

constexpr size_t kIdSize = 44;
constexpr time_t kTimeoutSeconds = 1800;

bool IsId(const std::string& id) {
    constexpr char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_";
    return id.size() == kIdSize && id.find_first_not_of(kAlphabet) == std::string::npos;
}

}  // namespace

bool CheckSession(const std::string& folder, const std::string& id, const std::string& address) {
    if (!IsId(id)) {
        return false;
    }
    const std::string path = folder + "/" + id;
    struct stat facts = {};
    Json::Value session;
    if (stat(path.c_str(), &facts) != 0 || !ReadJson(path, &session) || !session.isObject()) {
        return false;
    }
    const time_t now = time(nullptr);
    if (session["address"] != address || now - facts.st_mtime > kTimeoutSeconds) {
        return false;
    }
    return facts.st_mtime == now || utimensat(AT_FDCWD, path.c_str(), nullptr, 0) == 0;
}
