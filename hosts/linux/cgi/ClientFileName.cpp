#include "hosts/linux/cgi/ClientFileName.h"

#include "hosts/linux/util/Utf8.h"

namespace host {

bool IsPlainText(const std::string& text) {
    for (size_t at = 0; at < text.size();) {
        const size_t bytes = Utf8Character(text, at);
        if (bytes == 0 || IsControlCharacter(text, at)) {
            return false;
        }
        at += bytes;
    }
    return true;
}

bool ClientFileName(const std::string& raw, std::string* name) {
    if (!IsPlainText(raw)) {
        return false;
    }
    const size_t separator = raw.find_last_of("/\\");
    const std::string last = separator == std::string::npos ? raw : raw.substr(separator + 1);
    if (last.empty() || last == "." || last == ".." || last.size() > kMaxClientFileName) {
        return false;
    }
    *name = last;
    return true;
}

}  // namespace host
