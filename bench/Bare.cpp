#include <json/json.h>

#include <cstdio>
#include <string>

int main() {
    Json::Value document(Json::objectValue);
    document["success"] = true;
    const std::string text = Json::writeString(Json::StreamWriterBuilder(), document);
    (void)std::fwrite(text.data(), 1, text.size(), stdout);
    return 0;
}
