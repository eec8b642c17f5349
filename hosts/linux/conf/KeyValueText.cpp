#include "hosts/linux/conf/KeyValueText.h"

#include <algorithm>

namespace host {

namespace {

std::string Trimmed(const std::string& text) {
    const size_t first = text.find_first_not_of(" \t\r");
    return first == std::string::npos
               ? std::string()
               : text.substr(first, text.find_last_not_of(" \t\r") - first + 1);
}

std::string Unquoted(const std::string& text) {
    const bool quoted = text.size() >= 2 && text.front() == '"' && text.back() == '"';
    return quoted ? text.substr(1, text.size() - 2) : text;
}

}  // namespace

bool FindKey(const std::string& content, const std::string& key, std::string* value) {
    bool found = false;
    for (size_t start = 0; start < content.size();) {
        const size_t end = std::min(content.find('\n', start), content.size());
        const std::string line = Trimmed(content.substr(start, end - start));
        const size_t equals = line.find('=');
        if (!line.empty() && line[0] != '#' && equals != std::string::npos &&
            Trimmed(line.substr(0, equals)) == key) {
            *value = Unquoted(Trimmed(line.substr(equals + 1)));
            found = true;
        }
        start = end + 1;
    }
    return found;
}

bool HasKeyValue(const std::string& content, const std::string& key, const std::string& value) {
    std::string found;
    return FindKey(content, key, &found) && found == value;
}

}  // namespace host
