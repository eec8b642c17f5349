#include "JsonFile.h"

#include <fcntl.h>
#include <unistd.h>

#include <memory>

bool ReadJson(const std::string& path, Json::Value* document) {
    const int file = open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW);
    if (file < 0) {
        return false;
    }
    std::string text;
    char block[4096];
    ssize_t got = 0;
    while ((got = read(file, block, sizeof block)) > 0) {
        text.append(block, static_cast<size_t>(got));
    }
    (void)close(file);
    static const Json::CharReaderBuilder builder;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    Json::Value parsed;
    if (got < 0 || !reader->parse(text.data(), text.data() + text.size(), &parsed, nullptr)) {
        return false;
    }
    document->swap(parsed);
    return true;
}
