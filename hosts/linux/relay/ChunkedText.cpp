#include "hosts/linux/relay/ChunkedText.h"

#include <algorithm>

#include "hosts/linux/util/HexDigit.h"

namespace host {

namespace {

constexpr int kMostDigits = 15;

}  // namespace

bool ChunkedText::Next(const char** at, const char* end, const char** content, size_t* size) {
    *size = 0;
    while (*at < end && !IsWhole()) {
        if (place_ == Place::kData) {
            *content = *at;
            *size =
                static_cast<size_t>(std::min(left_, static_cast<unsigned long long>(end - *at)));
            *at += *size;
            left_ -= *size;
            place_ = left_ > 0 ? Place::kData : Place::kDataEnd;
            return true;
        }
        if (!Step(*(*at)++)) {
            return false;
        }
    }
    return true;
}

bool ChunkedText::Step(char byte) {
    switch (place_) {
        case Place::kSize: {
            const int value = HexValue(byte);
            if (value >= 0) {
                left_ = left_ * 16 + static_cast<unsigned long long>(value);
                return ++digits_ <= kMostDigits;
            }
            place_ = Place::kExtension;
            if (byte == '\n') {
                EndSizeLine();
            }
            return digits_ > 0;
        }
        case Place::kExtension:
            if (byte == '\n') {
                EndSizeLine();
            }
            return true;
        case Place::kDataEnd:
            if (byte == '\n') {
                place_ = Place::kSize;
                digits_ = 0;
            }
            return byte == '\n' || byte == '\r';
        case Place::kTrailer:
            if (byte == '\n' && lineIsEmpty_) {
                place_ = Place::kEnd;
            }
            lineIsEmpty_ = byte == '\n' || (byte == '\r' && lineIsEmpty_);
            return true;
        case Place::kData:
        case Place::kEnd:
            break;
    }
    return true;
}

// The last chunk is the one without content.
void ChunkedText::EndSizeLine() {
    place_ = left_ > 0 ? Place::kData : Place::kTrailer;
}

}  // namespace host
