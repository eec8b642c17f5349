#include "Documents.h"
#include "Groups.h"
#include "Harness.h"
#include "src/base/JsonText.h"

namespace bench {

namespace {

// The compiler must not see that nobody reads the text.
volatile size_t sink;

std::string WithFastWriter(const Json::Value& document) {
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"
    Json::FastWriter writer;
    return writer.write(document);
#pragma GCC diagnostic pop
}

std::string WithStreamWriter(const Json::Value& document) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    return Json::writeString(builder, document);
}

}  // namespace

void JsonText() {
    for (const size_t kilobytes : {1, 100, 1000}) {
        const Json::Value document = Listing(kilobytes * 1000);
        const int runs = kilobytes > 10 ? static_cast<int>(2000 / kilobytes) : 500;
        Compare("Serialise a document of " + std::to_string(kilobytes) + " KB",
                {{"toString", [&] { sink = TALO::toString(document).size(); }},
                 {"FastWriter", [&] { sink = WithFastWriter(document).size(); }},
                 {"StreamWriter", [&] { sink = WithStreamWriter(document).size(); }}},
                21, runs);
    }
}

}  // namespace bench
