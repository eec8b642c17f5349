#ifndef WEBAPI_APIVALIDATOR_H
#define WEBAPI_APIVALIDATOR_H

#include <json/json.h>

#include <string>

#include "webapi/APIExport.h"
#include "webapi/APIParameter.h"

namespace TALO {

class APIValidatorPrivate;

/// Tests of values, for methods to apply to their parameters. Most take a plain
/// value and fit as the validator of a typed parameter; the others take the
/// parameter itself, and an invalid one never passes.
///
///     const auto port = request->GetAndCheckInt("port", APIRequest::REQUIRED,
///                                               APIValidator::IsPort);
///     const auto mode = request->GetAndCheckString("mode", APIRequest::REQUIRED, nullptr);
///     if (port.IsInvalid() || !APIValidator::IsBelong(mode, modes)) {
///         response->SetError(kBadParameter, Json::Value());
///         return;
///     }
///
/// A parameter that is absent though optional, or sent as null, is tested by the
/// value that it holds: zero, empty or null.
///
/// The one instance keeps compiled expressions, each for the life of the process.
/// It is made on first use, safely from several threads; the tests themselves are
/// for one thread.
class WEBAPI_EXPORT APIValidator {
  public:
    static APIValidator* GetInstance();
    ~APIValidator();
    APIValidator(const APIValidator&) = delete;
    APIValidator& operator=(const APIValidator&) = delete;

    /// Whether a POSIX extended expression matches (somewhere in the value, unless
    /// it is anchored). A pattern is known by its address: pass a constant, the
    /// same one each time. False, and logged, for a pattern that does not compile.
    static bool CheckRegex(const std::string& value, const char* pattern);

    /// 0 to 65535.
    static bool IsPort(const int& port);

    /// Less than, greater than, or between two bounds that count as inside.
    static bool IsLess(const APIParameter<int>& parameter, int bound);
    static bool IsGreater(const APIParameter<int>& parameter, int bound);
    static bool IsBetween(const APIParameter<int>& parameter, int low, int high);

    /// Whether an array has the text, or each element of the value. False when
    /// `list` is no array.
    static bool IsBelong(const APIParameter<std::string>& parameter, const Json::Value& list);
    static bool IsBelong(const APIParameter<Json::Value>& parameter, const Json::Value& list);

    /// Whether the value is exactly this text. False for null.
    static bool IsEqual(const APIParameter<std::string>& parameter, const char* text);

    /// Addresses and names, by the platform's rules. None is empty, and none has a
    /// NUL in it.
    static bool IsIPv4(const std::string& value);
    static bool IsIPv6(const std::string& value);
    static bool IsIP(const std::string& value);
    static bool IsDomain(const std::string& value);
    static bool IsHostname(const std::string& value);

    /// Letters, digits and "-"; digits; a letter and up to 254 letters, digits,
    /// "_" and "-".
    static bool IsReachNetId(const std::string& value);
    static bool IsDigit(const std::string& value);
    static bool IsNetbios(const std::string& value);

    /// Whether some character is none of ] [ ; : " < > * + \ / | ? and comma. One is
    /// enough: names with some of these in them are in use.
    static bool IsWorkGroup(const std::string& value);

    /// Something, "@", something. No more than a first look: ASCII only, without
    /// blanks, but another "@" may be on either side.
    static bool IsEMail(const std::string& value);

  private:
    APIValidator();

    APIValidatorPrivate* d;
};

}  // namespace TALO

#endif
