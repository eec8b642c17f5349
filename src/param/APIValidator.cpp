#include "webapi/APIValidator.h"

#include <atomic>
#include <mutex>
#include <new>

#include "platform/System.h"
#include "src/base/JsonText.h"
#include "src/param/APIValidatorPrivate.h"

namespace TALO {

namespace {

// Byte for byte as clients and stored settings expect them. The one of a work
// group has no anchors on purpose. In the one of a mail address "+-\" is a range
// on both sides of the "@": it holds the capital letters, and another "@".
const char kReachNetId[] = "^([a-zA-Z0-9-]+)$";
const char kDigit[] = "^([0-9]+)$";
const char kWorkGroup[] = "[^][;:\"<>*+\\/|?,]";
const char kNetbios[] = "^[a-zA-Z][_a-zA-Z0-9-]{0,254}$";
const char kEMail[] = "^[a-zA-Z0-9!#$%&'*+-\\/?^_`{|}~\\.\",()<=>]+@([a-zA-Z0-9_&%!#+-\\.]+)$";

constexpr int kFamilyIPv4 = 2;
constexpr int kFamilyIPv6 = 10;

std::atomic<APIValidator*> instance(nullptr);
std::mutex creation;

bool IsInList(const Json::Value& list, const Json::Value& value) {
    return searchArrayIndex(list, value) != Json::Value::maxUInt;
}

// The platform reads up to a NUL, so a text with one in it is no address or name.
bool IsPlain(const std::string& value) {
    return !value.empty() && value.find('\0') == std::string::npos;
}

int AddressFamily(const std::string& value) {
    return IsPlain(value) ? TALONetGetAddrType(value.c_str()) : 0;
}

}  // namespace

APIValidator::APIValidator() : d(new APIValidatorPrivate) {}

APIValidator::~APIValidator() {
    delete d;
}

APIValidator* APIValidator::GetInstance() {
    APIValidator* made = instance.load(std::memory_order_acquire);
    if (made == nullptr) {
        const std::lock_guard<std::mutex> lock(creation);
        made = instance.load(std::memory_order_relaxed);
        if (made == nullptr) {
            made = new (std::nothrow) APIValidator;
            instance.store(made, std::memory_order_release);
        }
    }
    return made;
}

bool APIValidator::CheckRegex(const std::string& value, const char* pattern) {
    APIValidator* validator = GetInstance();
    return validator != nullptr && validator->d->CheckRegex(value, pattern);
}

bool APIValidator::IsPort(const int& port) {
    return static_cast<unsigned int>(port) <= 65535U;
}

bool APIValidator::IsLess(const APIParameter<int>& parameter, int bound) {
    return !parameter.IsInvalid() && parameter.Get() < bound;
}

bool APIValidator::IsGreater(const APIParameter<int>& parameter, int bound) {
    return !parameter.IsInvalid() && parameter.Get() > bound;
}

bool APIValidator::IsBetween(const APIParameter<int>& parameter, int low, int high) {
    return !parameter.IsInvalid() && low <= parameter.Get() && parameter.Get() <= high;
}

bool APIValidator::IsBelong(const APIParameter<std::string>& parameter, const Json::Value& list) {
    return !parameter.IsInvalid() && list.isArray() && IsInList(list, parameter.Get());
}

bool APIValidator::IsBelong(const APIParameter<Json::Value>& parameter, const Json::Value& list) {
    if (parameter.IsInvalid() || !list.isArray()) {
        return false;
    }
    for (const Json::Value& element : parameter.Get()) {
        if (!IsInList(list, element)) {
            return false;
        }
    }
    return true;
}

bool APIValidator::IsEqual(const APIParameter<std::string>& parameter, const char* text) {
    return !parameter.IsInvalid() && text != nullptr && parameter.Get() == text;
}

bool APIValidator::IsIPv4(const std::string& value) {
    return AddressFamily(value) == kFamilyIPv4;
}

bool APIValidator::IsIPv6(const std::string& value) {
    return AddressFamily(value) == kFamilyIPv6;
}

bool APIValidator::IsIP(const std::string& value) {
    return AddressFamily(value) != 0;
}

bool APIValidator::IsDomain(const std::string& value) {
    return IsPlain(value) && BlTLIBIsDomain(value.c_str()) != 0;
}

bool APIValidator::IsHostname(const std::string& value) {
    return IsPlain(value) && BlTLIBIsHostname(value.c_str()) != 0;
}

bool APIValidator::IsReachNetId(const std::string& value) {
    return CheckRegex(value, kReachNetId);
}

bool APIValidator::IsDigit(const std::string& value) {
    return CheckRegex(value, kDigit);
}

bool APIValidator::IsWorkGroup(const std::string& value) {
    return !value.empty() && CheckRegex(value, kWorkGroup);
}

bool APIValidator::IsNetbios(const std::string& value) {
    return !value.empty() && CheckRegex(value, kNetbios);
}

bool APIValidator::IsEMail(const std::string& value) {
    return !value.empty() && CheckRegex(value, kEMail);
}

}  // namespace TALO
