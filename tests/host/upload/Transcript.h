#ifndef TESTS_HOST_UPLOAD_TRANSCRIPT_H
#define TESTS_HOST_UPLOAD_TRANSCRIPT_H

#include <algorithm>
#include <string>

#include "hosts/linux/cgi/MultipartParser.h"

// Writes down what a parser tells: "{name=value}data;" for each part.
class Transcript : public host::MultipartSink {
  public:
    explicit Transcript(bool pausing = false) : pausing_(pausing) {}

    Answer OnPartBegin(const host::PartHeaders& headers) override {
        text += "{";
        for (const auto& header : headers) {
            text += header.first + "=" + header.second + ",";
        }
        text += "}";
        return Next();
    }
    Answer OnData(const char* data, size_t size) override {
        sawEmptyData = sawEmptyData || size == 0;
        text.append(data, size);
        return Next();
    }
    Answer OnPartEnd() override {
        text += ";";
        return Next();
    }

    std::string text;
    bool sawEmptyData = false;

  private:
    Answer Next() const {
        return pausing_ ? Answer::kPause : Answer::kGoOn;
    }
    const bool pausing_;
};

struct Told {
    host::MultipartParser::Result result;
    std::string text;
    unsigned long long offset;
};

// Reads a whole body in pieces of that size, each a copy of exactly that size.
inline Told ReadInPieces(const std::string& boundary, const std::string& body, size_t piece,
                         bool pausing = false, const host::MultipartLimits& limits = {}) {
    using Result = host::MultipartParser::Result;
    Transcript transcript(pausing);
    host::MultipartParser parser(boundary, limits, &transcript);
    Result result = Result::kMore;
    for (size_t at = 0; at < body.size();) {
        const size_t size = std::min(piece, body.size() - at);
        std::string copy(body, at, size);
        copy.shrink_to_fit();
        size_t used = 0;
        result = parser.Feed(copy.data(), copy.size(), &used);
        if (result != Result::kMore && result != Result::kPaused && result != Result::kEnd) {
            return {result, transcript.text, parser.Offset()};
        }
        at += used;
    }
    result = parser.Finish();
    return {result, transcript.text + (transcript.sawEmptyData ? "EMPTY DATA" : ""),
            parser.Offset()};
}

#endif
