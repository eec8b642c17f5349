#include "apis/common/SafeHeader.h"

#include "webapi/APIResponse.h"

namespace {

bool IsOneLine(const std::string& text) {
    return text.find_first_of(std::string("\r\n\0", 3)) == std::string::npos;
}

}  // namespace

bool SetSafeHeader(TALO::APIResponse* response, const std::string& name, const std::string& value) {
    return IsOneLine(name) && IsOneLine(value) && response->SetHeader(name, value);
}
