#include "hosts/linux/download/Disposition.h"

#include "hosts/linux/util/Percent.h"
#include "hosts/linux/util/Utf8.h"

namespace host {

namespace {

// No file system has longer names; the bound keeps the header line short.
constexpr size_t kMaxNameBytes = 1024;

// The name twice: in full, and in what every client reads the same way. There
// "%" is out because some clients decode it, and "\" because some take it for a
// folder's end.
struct Names {
    std::string full;
    std::string plain;
};

Names Cleaned(const std::string& name) {
    Names names;
    for (size_t at = 0; at < name.size();) {
        const size_t bytes = Utf8Character(name, at);
        if (bytes == 0 || IsControlCharacter(name, at)) {
            names.full += '_';
            names.plain += '_';
            at += bytes == 0 ? 1 : bytes;
            continue;
        }
        if (names.full.size() + bytes > kMaxNameBytes) {
            break;
        }
        const char first = name[at];
        const bool plain = bytes == 1 && first != '"' && first != '\\' && first != '%';
        names.full.append(name, at, bytes);
        names.plain += plain ? first : '_';
        at += bytes;
    }
    return names;
}

}  // namespace

std::string AttachmentNamed(const std::string& fileName) {
    const size_t slash = fileName.rfind('/');
    Names names = Cleaned(slash == std::string::npos ? fileName : fileName.substr(slash + 1));
    if (names.full.empty() || names.full == "." || names.full == "..") {
        names.full = "download";
        names.plain = names.full;
    }
    std::string value = "attachment; filename=\"" + names.plain + "\"";
    if (names.full != names.plain) {
        value += "; filename*=UTF-8''" + PercentEncode(names.full);
    }
    return value;
}

}  // namespace host
