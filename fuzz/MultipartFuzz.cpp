#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>

#include "hosts/linux/cgi/ClientFileName.h"
#include "hosts/linux/cgi/ContentDisposition.h"
#include "hosts/linux/cgi/MultipartParser.h"

// A multipart body with the boundary "B", whole and in pieces: the parser tells
// the same of it, and what it tells is no more than the body.

namespace {

using host::MultipartParser;

void Require(bool condition) {
    if (!condition) {
        abort();
    }
}

struct Sink : host::MultipartSink {
    explicit Sink(bool pauses) : pausing(pauses) {}

    Answer OnPartBegin(const host::PartHeaders& headers) override {
        Require(!inPart);
        inPart = true;
        std::string disposition;
        host::ContentDisposition part;
        if (host::OnlyHeader(headers, "content-disposition", &disposition) &&
            host::ParseContentDisposition(disposition, &part)) {
            Require(!part.name.empty() && host::IsPlainText(part.name));
            Require(part.fileName.find_first_of(std::string("/\\\0\r\n", 5)) == std::string::npos);
            Require(part.fileName != "." && part.fileName != "..");
            told += part.name + "|" + part.fileName;
        }
        for (const auto& header : headers) {
            told += "<" + header.first + ":" + header.second + ">";
        }
        return Next();
    }
    Answer OnData(const char* data, size_t size) override {
        Require(inPart && size > 0);
        told.append(data, size);
        bytes += size;
        return Next();
    }
    Answer OnPartEnd() override {
        Require(inPart);
        inPart = false;
        told += ";";
        return Next();
    }
    Answer Next() const {
        return pausing ? Answer::kPause : Answer::kGoOn;
    }

    const bool pausing;
    bool inPart = false;
    std::string told;
    size_t bytes = 0;
};

host::MultipartLimits SmallLimits() {
    host::MultipartLimits limits;
    limits.parts = 5;
    limits.headerBytes = 200;
    limits.preambleBytes = 50;
    limits.totalBytes = 4096;
    return limits;
}

MultipartParser::Result Read(const std::string& body, size_t piece, Sink* sink) {
    MultipartParser parser("B", SmallLimits(), sink);
    for (size_t at = 0; at < body.size();) {
        const std::string copy = body.substr(at, piece);
        size_t used = 0;
        const auto result = parser.Feed(copy.data(), copy.size(), &used);
        if (result != MultipartParser::Result::kMore && result != MultipartParser::Result::kEnd &&
            result != MultipartParser::Result::kPaused) {
            return result;
        }
        Require(used == copy.size() || result == MultipartParser::Result::kPaused);
        at += used;
        Require(parser.Offset() == at && parser.BoundaryEnd() <= at);
    }
    return parser.Finish();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string body(reinterpret_cast<const char*>(data), size);
    Sink whole(false);
    const auto result = Read(body, body.size() + 1, &whole);
    Require(whole.bytes <= size);
    Require(result != MultipartParser::Result::kEnd || !whole.inPart);
    // The limit on the whole is met earlier in a piece that goes beyond it.
    if (size > SmallLimits().totalBytes) {
        Require(result == MultipartParser::Result::kLimit);
        return 0;
    }
    for (const size_t piece : {size_t{1}, size_t{2}, size_t{7}, size + 1}) {
        Sink pieces(piece == size + 1 || piece == 2);
        Require(Read(body, piece, &pieces) == result);
        Require(pieces.told == whole.told);
    }
    return 0;
}
