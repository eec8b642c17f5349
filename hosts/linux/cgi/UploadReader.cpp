#include "hosts/linux/cgi/UploadReader.h"

#include <errno.h>
#include <fcntl.h>
#include <poll.h>
#include <stdlib.h>
#include <unistd.h>

#include <algorithm>
#include <charconv>

#include "hosts/linux/cgi/EndSignal.h"
#include "hosts/linux/cgi/HeaderParameters.h"
#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {

constexpr char kSource[] = "UploadReader.cpp";
constexpr size_t kBlock = 256u << 10;
// Fields are small: whoever asks for three of them has not read far.
constexpr size_t kFieldBlock = 4u << 10;
constexpr int kPipeSize = 1 << 20;
constexpr std::chrono::milliseconds kReportEvery{250};

std::string Environment(const char* name) {
    const char* value = getenv(name);
    return value != nullptr ? value : "";
}

bool ReadLength(const std::string& text, unsigned long long* length) {
    unsigned long long value = 0;
    const char* end = text.data() + text.size();
    const auto result = std::from_chars(text.data(), end, value);
    if (text.empty() || result.ec != std::errc() || result.ptr != end) {
        return false;
    }
    *length = value;
    return true;
}

bool ReadBoundary(const std::string& contentType, std::string* boundary) {
    ParametrizedValue type;
    if (!ParseParametrizedValue(contentType, &type) || type.value != "multipart/form-data" ||
        !MultipartParser::IsBoundary(type.parameters["boundary"])) {
        return false;
    }
    *boundary = type.parameters["boundary"];
    return true;
}

// Standard input may have been made non-blocking by whoever shares it.
ssize_t ReadInput(char* buffer, size_t size) {
    while (!EndSignal::HasCome()) {
        const ssize_t got = read(STDIN_FILENO, buffer, size);
        if (got >= 0 || (errno != EINTR && errno != EAGAIN)) {
            return got;
        }
        if (errno == EAGAIN) {
            struct pollfd input = {STDIN_FILENO, POLLIN, 0};
            (void)poll(&input, 1, -1);
        }
    }
    return -1;
}

}  // namespace

std::unique_ptr<UploadReader>& UploadReader::Current() {
    static std::unique_ptr<UploadReader> reader;
    return reader;
}

UploadReader& UploadReader::OfProcess() {
    if (Current() == nullptr) {
        Current().reset(new UploadReader);
    }
    return *Current();
}

void UploadReader::Forget() {
    Current().reset();
}

UploadReader::UploadReader() : limits_(ConfiguredMultipartLimits()), form_(limits_) {
    std::string reason;
    if (!Begin(&reason)) {
        (void)Fail(TALO_UPLOAD_MALFORMED, reason);
    } else if (total_ > limits_.totalBytes) {
        (void)Fail(TALO_UPLOAD_LIMIT, "a body of " + std::to_string(total_) + " bytes");
    }
}

bool UploadReader::Begin(std::string* reason) {
    std::string boundary;
    const bool typed = ReadBoundary(Environment("CONTENT_TYPE"), &boundary);
    parser_ = std::make_unique<MultipartParser>(boundary, limits_, &form_);
    if (!typed || !ReadLength(Environment("CONTENT_LENGTH"), &total_)) {
        *reason = typed ? "no length of the body" : "no multipart/form-data with a boundary";
        return false;
    }
    block_.reset(new char[kBlock]);
    // Larger steps where the web server's pipe allows it.
    if (total_ > kBlock) {
        (void)fcntl(STDIN_FILENO, F_SETPIPE_SZ, kPipeSize);
    }
    return true;
}

int UploadReader::Fail(int result, const std::string& reason) {
    HOST_LOG("upload refused: %s", reason.c_str());
    form_.Discard();
    result_ = result;
    return result;
}

int UploadReader::Read(TALOCGIPROGRESS progress) {
    const EndSignal noticed;
    if (result_ == TALO_UPLOAD_OK && ReadBlocks(progress) == TALO_UPLOAD_OK &&
        progress != nullptr) {
        progress(Offset(), total_);
    }
    return result_;
}

int UploadReader::ReadBlocks(TALOCGIPROGRESS progress) {
    for (;;) {
        if (at_ < filled_) {
            size_t used = 0;
            const auto result = parser_->Feed(block_.get() + at_, filled_ - at_, &used);
            at_ += used;
            if (result == MultipartParser::Result::kPaused) {
                return TALO_UPLOAD_OK;
            }
            if (result != MultipartParser::Result::kMore &&
                result != MultipartParser::Result::kEnd) {
                return FailAs(result);
            }
            Report(progress);
        } else if (received_ == total_) {
            const auto result = parser_->Finish();
            return result == MultipartParser::Result::kEnd ? TALO_UPLOAD_OK : FailAs(result);
        } else if (!Fill()) {
            // What is missing behind the last boundary is missed by nobody.
            size_t used = 0;
            return parser_->Feed(nullptr, 0, &used) == MultipartParser::Result::kEnd
                       ? TALO_UPLOAD_OK
                       : Fail(TALO_UPLOAD_GONE, "the body breaks off");
        }
    }
}

bool UploadReader::Fill() {
    const size_t step = form_.IsStoring() ? kBlock : kFieldBlock;
    const auto size =
        static_cast<size_t>(std::min(static_cast<unsigned long long>(step), total_ - received_));
    const ssize_t got = ReadInput(block_.get(), size);
    at_ = 0;
    filled_ = static_cast<size_t>(std::max(got, ssize_t{0}));
    received_ += filled_;
    return got > 0;
}

int UploadReader::FailAs(MultipartParser::Result why) {
    switch (why) {
        case MultipartParser::Result::kRefused:
            return Fail(form_.Problem(), form_.Reason());
        case MultipartParser::Result::kLimit:
            return Fail(TALO_UPLOAD_LIMIT, "beyond a limit of parts or headers");
        default:
            return Fail(TALO_UPLOAD_MALFORMED, "no well-formed multipart body");
    }
}

void UploadReader::Report(TALOCGIPROGRESS progress) {
    if (progress == nullptr) {
        return;
    }
    const auto now = std::chrono::steady_clock::now();
    if (now - reported_ >= kReportEvery) {
        reported_ = now;
        progress(Offset(), total_);
    }
}

}  // namespace host
