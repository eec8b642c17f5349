#include <json/json.h>

#include <limits>
#include <memory>

#include "File.h"
#include "Parameters.h"
#include "Slices.h"
#include "hosts/linux/sdk/Slices.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

constexpr int kPost = 2;
constexpr long long kMostBytes = std::numeric_limits<long long>::max();
constexpr long long kLatestTime = 253402300799;  // the end of the year 9999

// A slice is the body as it stands. A form would end up in the file with its
// boundaries.
bool IsSlice(const APIRequest& request) {
    const Json::Value type = request.GetEnv("CONTENT_TYPE", "");
    return request.GetRequestMethod() == kPost && request.IsSliceUploadRequest() &&
           type.isString() && type.asString().find("multipart/") == std::string::npos;
}

// Bytes of the body. No length is an empty body, except for one that comes in
// chunks: how long that is, nobody says.
bool ReadBodyLength(const APIRequest& request, unsigned long long* bytes) {
    const Json::Value text = request.GetEnv("CONTENT_LENGTH", "");
    if (!text.isString() || text.asString().empty()) {
        return text.isString() && !request.HasEnv("HTTP_TRANSFER_ENCODING");
    }
    unsigned long long length = 0;
    for (const char byte : text.asString()) {
        if (byte < '0' || byte > '9' || length > kMostBytes / 10 - 1) {
            return false;
        }
        length = length * 10 + static_cast<unsigned long long>(byte - '0');
    }
    *bytes = length;
    return true;
}

// A count of bytes. An absent one leaves `out` as it is, unless it is required.
bool ReadBytes(const APIRequest& request, const std::string& name, bool required,
               unsigned long long* out) {
    long long number = 0;
    if (required && !request.HasParam(name)) {
        return false;
    }
    if (!ReadNumber(request, name, 0, kMostBytes, &number)) {
        return false;
    }
    *out = static_cast<unsigned long long>(number);
    return true;
}

bool ReadDigest(const APIRequest& request, const std::string& name, std::string* out) {
    const auto digest = request.GetAndCheckString(name, APIRequest::OPTIONAL, talo::IsSliceDigest);
    if (digest.IsInvalid() || digest.IsReset()) {
        return false;
    }
    *out = digest.Get();
    return true;
}

bool ReadUploadId(const APIRequest& request, std::string* out) {
    const auto id = request.GetAndCheckString("upload_id", APIRequest::OPTIONAL, talo::IsSliceId);
    if (id.IsInvalid() || id.IsReset()) {
        return false;
    }
    *out = id.Get();
    return true;
}

// The name of the first parameter that is wrong, null when all are right.
const char* ReadAll(const APIRequest& request, SliceParameters* out) {
    if (!ReadBodyLength(request, &out->bytes)) {
        return "CONTENT_LENGTH";
    }
    if (!ReadUploadId(request, &out->uploadId)) {
        return "upload_id";
    }
    const bool begins = out->uploadId.empty();
    if (!ReadBytes(request, "offset", !begins, &out->offset) || (begins && out->offset != 0)) {
        return "offset";
    }
    out->hasLength = request.HasParam("length");
    if (!ReadBytes(request, "length", begins, &out->length)) {
        return "length";
    }
    if (!ReadDigest(request, "digest", &out->digest)) {
        return "digest";
    }
    if (!ReadDigest(request, "file_digest", &out->fileDigest)) {
        return "file_digest";
    }
    if (!ReadFlag(request, "overwrite", &out->overwrite)) {
        return "overwrite";
    }
    return ReadNumber(request, "mtime", 0, kLatestTime, &out->mtime) ? nullptr : "mtime";
}

}  // namespace

bool ReadSliceParameters(const APIRequest& request, APIResponse* response,
                         SliceParameters* parameters) {
    if (!IsSlice(request)) {
        response->SetError(kNotUploaded, Json::Value());
        return false;
    }
    SliceParameters read;
    const char* wrong = ReadAll(request, &read);
    if (wrong != nullptr) {
        response->SetError(kBadParameter, wrong);
        return false;
    }
    *parameters = read;
    return true;
}

std::string FormatSliceTarget(const SliceTarget& target) {
    Json::Value value(Json::objectValue);
    value["path"] = target.path;
    value["overwrite"] = target.overwrite;
    value["mtime"] = static_cast<Json::Int64>(target.mtime);
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    return Json::writeString(builder, value);
}

bool ParseSliceTarget(const std::string& text, SliceTarget* target) {
    Json::Value value;
    const std::unique_ptr<Json::CharReader> reader(Json::CharReaderBuilder().newCharReader());
    if (!reader->parse(text.data(), text.data() + text.size(), &value, nullptr) ||
        !value.isObject() || !value["path"].isString() || !value["overwrite"].isBool() ||
        !value["mtime"].isInt64()) {
        return false;
    }
    target->path = value["path"].asString();
    target->overwrite = value["overwrite"].asBool();
    target->mtime = value["mtime"].asInt64();
    return true;
}
