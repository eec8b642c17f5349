#include "hosts/linux/task/PropertyText.h"

#include <memory>
#include <sstream>

#include "hosts/linux/util/JsonGrammar.h"

namespace host {

namespace {

constexpr size_t kMaxDepth = 128;
constexpr size_t kMaxBytes = size_t{64} << 20;

}  // namespace

bool WriteProperty(const Json::Value& value, std::string* text) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["commentStyle"] = "None";
    builder["emitUTF8"] = true;
    const std::unique_ptr<Json::StreamWriter> writer(builder.newStreamWriter());
    std::ostringstream stream;
    (void)writer->write(value, &stream);
    std::string written = stream.str();
    JsonError error;
    if (written.size() > kMaxBytes ||
        !AcceptJson(written.data(), written.data() + written.size(), kMaxDepth, &error)) {
        return false;
    }
    text->swap(written);
    return true;
}

bool ReadProperty(const char* text, size_t size, Json::Value* out) {
    JsonError error;
    return size <= kMaxBytes && ParseJson(text, text + size, kMaxDepth, out, &error);
}

}  // namespace host
