#ifndef TESTS_SUPPORT_JSON_H
#define TESTS_SUPPORT_JSON_H

#include <json/json.h>

#include <stdexcept>
#include <string>

namespace support {

// A JSON value out of a text in the test's source.
inline Json::Value Parse(const std::string& text) {
    Json::Value value;
    std::string errors;
    Json::CharReaderBuilder builder;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    if (!reader->parse(text.data(), text.data() + text.size(), &value, &errors)) {
        throw std::runtime_error(errors);
    }
    return value;
}

}  // namespace support

#endif
