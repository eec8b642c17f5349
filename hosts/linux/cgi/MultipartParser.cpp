#include "hosts/linux/cgi/MultipartParser.h"

#include <string.h>

#include <algorithm>

namespace host {

namespace {

// Within this many bytes behind a CR more of them are expected.
constexpr size_t kWindow = 4096;

// The first delimiter in a text, null for none. A search for CR is the fastest
// where there is none, and the library's search for a longer text where there are
// many; each is slow on what suits the other (texts of nothing but CR, boundaries
// of nothing but dashes).
const char* FindDelimiter(const char* at, const char* end, const std::string& delimiter) {
    while (at < end) {
        const auto left = static_cast<size_t>(end - at);
        const auto* start = static_cast<const char*>(memchr(at, '\r', left));
        if (start == nullptr) {
            return nullptr;
        }
        const size_t window =
            std::min(static_cast<size_t>(end - start), kWindow + delimiter.size() - 1);
        const void* found = memmem(start, window, delimiter.data(), delimiter.size());
        if (found != nullptr) {
            return static_cast<const char*>(found);
        }
        at = start + std::min(window, kWindow);
    }
    return nullptr;
}

// Where the begin of a delimiter may stand at the end of a text: only at its last
// CR, since a delimiter has no other. `end` for nowhere.
const char* FindBegunDelimiter(const char* at, const char* end, const std::string& delimiter) {
    const size_t tail = std::min(static_cast<size_t>(end - at), delimiter.size() - 1);
    const auto* start = static_cast<const char*>(memrchr(end - tail, '\r', tail));
    const bool begun =
        start != nullptr && memcmp(start, delimiter.data(), static_cast<size_t>(end - start)) == 0;
    return begun ? start : end;
}

}  // namespace

MultipartParser::MultipartParser(const std::string& boundary, const MultipartLimits& limits,
                                 MultipartSink* sink)
    : delimiter_("\r\n--" + boundary), limits_(limits), sink_(sink) {
    if (!IsBoundary(boundary)) {
        Fail(Result::kMalformed);
    }
}

bool MultipartParser::IsBoundary(const std::string& text) {
    const auto allowed = [](char byte) {
        return (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z') ||
               (byte >= '0' && byte <= '9') ||
               (byte != '\0' && strchr("'()+_,-./:=? ", byte) != nullptr);
    };
    return !text.empty() && text.size() <= kMaxBoundary && text.back() != ' ' &&
           std::all_of(text.begin(), text.end(), allowed);
}

MultipartParser::Result MultipartParser::Feed(const char* data, size_t size, size_t* used) {
    *used = 0;
    if (state_ == State::kFailed) {
        return result_;
    }
    if (size > limits_.totalBytes - offset_) {
        Fail(Result::kLimit);
        return result_;
    }
    result_ = Result::kMore;
    const unsigned long long base = offset_;
    const char* const end = data + size;
    for (const char* at = data; at < end && result_ == Result::kMore;) {
        at = Step(at, end);
        offset_ = base + static_cast<unsigned long long>(at - data);
        if (state_ == State::kFailed) {
            return result_;
        }
    }
    *used = static_cast<size_t>(offset_ - base);
    return result_ == Result::kMore && state_ == State::kEpilogue ? Result::kEnd : result_;
}

MultipartParser::Result MultipartParser::Finish() {
    if (state_ == State::kEpilogue) {
        return Result::kEnd;
    }
    if (state_ != State::kFailed) {
        Fail(Result::kMalformed);
    }
    return result_;
}

// Reads at least one byte, or moves on to another state, or stops.
const char* MultipartParser::Step(const char* at, const char* end) {
    switch (state_) {
        case State::kText:
            return matched_ > 0 ? ReadMatch(at, end) : ReadText(at, end);
        case State::kBoundary:
        case State::kDash:
        case State::kLineEnd:
            return ReadBehindBoundary(at);
        case State::kPadding:
        case State::kPaddedEnd:
            ReadPadding(*at);
            return at + 1;
        case State::kHeaders:
            return ReadHeaders(at, end);
        case State::kEpilogue:
        case State::kFailed:
            break;
    }
    return end;
}

const char* MultipartParser::ReadText(const char* at, const char* end) {
    const char* found = FindDelimiter(at, end, delimiter_);
    const char* begun = found != nullptr ? found : FindBegunDelimiter(at, end, delimiter_);
    EmitText(at, static_cast<size_t>(begun - at));
    // A sink that pauses gets the delimiter looked at when it goes on.
    if (result_ != Result::kMore) {
        return begun;
    }
    if (found != nullptr) {
        state_ = State::kBoundary;
        return found + delimiter_.size();
    }
    matched_ = static_cast<size_t>(end - begun);
    return end;
}

// Goes on with a delimiter that has begun. No other can begin within it.
const char* MultipartParser::ReadMatch(const char* at, const char* end) {
    while (at < end && matched_ < delimiter_.size() && *at == delimiter_[matched_]) {
        ++at;
        ++matched_;
    }
    if (matched_ == delimiter_.size()) {
        state_ = State::kBoundary;
    } else if (at < end) {
        const char* held = delimiter_.data() + assumed_;
        const size_t size = matched_ - assumed_;
        matched_ = 0;
        assumed_ = 0;
        EmitText(held, size);
    }
    return at;
}

// What turns out to be data goes to the sink before this byte is read.
const char* MultipartParser::ReadBehindBoundary(const char* at) {
    switch (state_) {
        case State::kBoundary:
            if (*at == ' ' || *at == '\t') {
                state_ = State::kPadding;
                padding_ = 1;
                return at + 1;
            }
            if (*at == '-' || *at == '\r') {
                state_ = *at == '-' ? State::kDash : State::kLineEnd;
                return at + 1;
            }
            TakeBack("");
            return at;
        case State::kDash:
            if (*at == '-') {
                EndBoundaryLine(true);
                return at + 1;
            }
            TakeBack("-");
            return at;
        default:
            if (*at == '\n') {
                EndBoundaryLine(false);
                return at + 1;
            }
            TakeBack("\r");
            return at;
    }
}

void MultipartParser::ReadPadding(char byte) {
    if (state_ == State::kPaddedEnd) {
        if (byte == '\n') {
            EndBoundaryLine(false);
        } else {
            Fail(Result::kMalformed);
        }
    } else if (byte == '\r') {
        state_ = State::kPaddedEnd;
    } else if (byte != ' ' && byte != '\t') {
        Fail(Result::kMalformed);
    } else if (++padding_ > kMaxBoundaryPadding) {
        Fail(Result::kLimit);
    }
}

const char* MultipartParser::ReadHeaders(const char* at, const char* end) {
    while (at < end) {
        const char byte = *at++;
        const bool behindCarriageReturn = !headers_.empty() && headers_.back() == '\r';
        if (byte == '\0' || behindCarriageReturn != (byte == '\n')) {
            Fail(Result::kMalformed);
            return at;
        }
        // The blank line that ends them does not count.
        if (headers_.size() == limits_.headerBytes + 2) {
            Fail(Result::kLimit);
            return at;
        }
        headers_.push_back(byte);
        const size_t size = headers_.size();
        if (byte == '\n' && (size == 2 || headers_.compare(size - 3, 1, "\n") == 0)) {
            BeginPart();
            return at;
        }
    }
    return at;
}

void MultipartParser::BeginPart() {
    headers_.resize(headers_.size() - 2);
    PartHeaders headers;
    if (!ParsePartHeaders(headers_, &headers)) {
        Fail(Result::kMalformed);
        return;
    }
    headers_.clear();
    state_ = State::kText;
    // The blank line's end also begins a boundary line: the part is empty then.
    matched_ = 2;
    assumed_ = 2;
    Heed(sink_->OnPartBegin(headers));
}

void MultipartParser::EndBoundaryLine(bool last) {
    boundaryEnd_ = offset_ + 1;
    matched_ = 0;
    assumed_ = 0;
    state_ = last ? State::kEpilogue : State::kHeaders;
    if (!inPreamble_) {
        Heed(sink_->OnPartEnd());
    }
    inPreamble_ = false;
    if (!last && ++parts_ > limits_.parts) {
        Fail(Result::kLimit);
    }
}

// A boundary line that turned out to be none.
void MultipartParser::TakeBack(const char* more) {
    lookAlike_ = delimiter_.substr(assumed_) + more;
    matched_ = 0;
    assumed_ = 0;
    state_ = State::kText;
    EmitText(lookAlike_.data(), lookAlike_.size());
}

void MultipartParser::EmitText(const char* data, size_t size) {
    if (size == 0) {
        return;
    }
    if (!inPreamble_) {
        Heed(sink_->OnData(data, size));
        return;
    }
    preamble_ += size;
    if (preamble_ > limits_.preambleBytes) {
        Fail(Result::kLimit);
    }
}

void MultipartParser::Heed(MultipartSink::Answer answer) {
    if (answer == MultipartSink::Answer::kRefuse) {
        Fail(Result::kRefused);
    } else if (answer == MultipartSink::Answer::kPause) {
        result_ = Result::kPaused;
    }
}

void MultipartParser::Fail(Result why) {
    result_ = why;
    state_ = State::kFailed;
}

}  // namespace host
