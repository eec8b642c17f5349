#include "Parameters.h"

#include "apis/common/TextParameter.h"
#include "webapi/APIRequest.h"

namespace {

constexpr size_t kMaxDigits = 18;  // fit a long long whatever they are

bool ReadDigits(const std::string& text, long long* out) {
    if (text.empty() || text.size() > kMaxDigits) {
        return false;
    }
    long long number = 0;
    for (const char byte : text) {
        if (byte < '0' || byte > '9') {
            return false;
        }
        number = number * 10 + (byte - '0');
    }
    *out = number;
    return true;
}

}  // namespace

bool ReadFlag(const TALO::APIRequest& request, const std::string& name, bool* out) {
    std::string text;
    if (!request.HasParam(name)) {
        return true;
    }
    if (!ReadTypedText(request, name, &text) || (text != "true" && text != "false")) {
        return false;
    }
    *out = text == "true";
    return true;
}

bool ReadNumber(const TALO::APIRequest& request, const std::string& name, long long least,
                long long most, long long* out) {
    std::string text;
    long long number = 0;
    if (!request.HasParam(name)) {
        return true;
    }
    if (!ReadTypedText(request, name, &text) || !ReadDigits(text, &number) || number < least ||
        number > most) {
        return false;
    }
    *out = number;
    return true;
}
