#include <string.h>

#include "platform/Cgi.h"
#include "platform/CredRequest.h"
#include "tests/fake/FakePlatform.h"

namespace {

constexpr char kSealed[] = "sealed:";
constexpr char kKeyOf[] = "key of ";
constexpr size_t kKeyTextBytes = 32;
constexpr size_t kMaxTokenBytes = 4096;

bool Begins(const std::string& text, const std::string& prefix) {
    return text.compare(0, prefix.size(), prefix) == 0;
}

// In place: the line is shorter than what stands for it.
int OpenOnce(char* text) {
    if (!Begins(text, kSealed) || !fake::Now().sealedLinesSeen.insert(text).second) {
        return 0;
    }
    const char* line = text + strlen(kSealed);
    memmove(text, line, strlen(line) + 1);
    return fake::Now().cipherResult;
}

std::string KeyOf(const std::string& token) {
    return (kKeyOf + token).substr(0, kKeyTextBytes);
}

}  // namespace

extern "C" {

int TaloCgiDecryptParam(char* text) {
    fake::Now().decryptCalls.emplace_back(text != nullptr ? text : "(null)");
    return fake::Now().Called("TaloCgiDecryptParam") || text == nullptr ? 0 : OpenOnce(text);
}

int TaloCgiDetectAndDecryptParamLine(char* line) {
    fake::Now().detectCalls.emplace_back(line != nullptr ? line : "(null)");
    if (fake::Now().Called("TaloCgiDetectAndDecryptParamLine") || line == nullptr) {
        return 0;
    }
    return Begins(line, kSealed) ? OpenOnce(line) : 1;
}

int TALONdtokenGenerateToken(const char* token, char* key, size_t size) {
    if (token == nullptr || key == nullptr) {
        return -1;
    }
    fake::Now().keyCalls.push_back(
        {token, size, std::string(key, size).find_first_not_of('\0') == std::string::npos});
    const std::string text = KeyOf(token);
    if (fake::Now().Called("TALONdtokenGenerateToken") || *token == '\0' ||
        strlen(token) > kMaxTokenBytes || text.size() >= size) {
        return -1;
    }
    memcpy(key, text.c_str(), text.size() + 1);
    return fake::Now().keyResult;
}

}  // extern "C"

namespace TALO {

bool CredRequestUtil::GetDecryptAESString(const std::string& key, const std::string& text,
                                          std::string& out) {
    fake::Now().textCalls.emplace_back(key, text);
    const size_t end = text.find(':');
    const std::string under = "under ";
    if (fake::Now().Called("GetDecryptAESString") || !Begins(text, under) ||
        end == std::string::npos || KeyOf(text.substr(under.size(), end - under.size())) != key) {
        return false;
    }
    out = text.substr(end + 1);
    return true;
}

}  // namespace TALO
