#ifndef WEBAPI_APIPARAMETER_H
#define WEBAPI_APIPARAMETER_H

#include <json/json.h>

#include <string>

#include "webapi/APIExport.h"

namespace TALO {

template <typename T>
class APIParameterPrivate;

/// Whether a parameter must be there. Any value but REQUIRED counts as optional.
enum PARAM_NECESSITY : int { REQUIRED = 0, OPTIONAL = 1 };

/// A request parameter as a typed value that knows how it came about: absent,
/// missing though required, sent as JSON null, valid, or bad (wrong type, out of
/// range, refused by the validator). Text is never converted to a number or a
/// boolean: a parameter must have the right JSON type.
///
/// T is one of int, unsigned int, long long, unsigned long long, bool, double,
/// std::string and Json::Value. A value owns its record; copies are independent.
///
///     auto limit = request->GetAndCheckInt("limit", APIRequest::OPTIONAL, IsSmall);
///     if (limit.IsInvalid()) {
///         response->SetError(kBadLimit, Json::Value());
///         return;
///     }
///     Send(limit.Get(50));
template <typename T>
class WEBAPI_EXPORT APIParameter {
  public:
    /// Answers whether a parsed value is acceptable. Null accepts every value.
    typedef bool (*Validator)(const T& value);

    APIParameter();
    APIParameter(const APIParameter& other);
    APIParameter& operator=(const APIParameter& other);
    ~APIParameter();

    /// The stored value, whatever the flags: zero, false, empty or null until a
    /// parse succeeded. The reference lives as long as this object.
    const T& Get() const;

    /// The stored value when the parameter is set and not invalid, else
    /// `fallback`. A parameter sent as null counts as set and valid on purpose:
    /// it answers zero, false, empty or null, not `fallback`.
    const T& Get(const T& fallback) const;

    bool IsSet() const;      ///< a value was present, null included
    bool IsReset() const;    ///< the value was JSON null
    bool IsInvalid() const;  ///< missing though required, or refused

    /// Raise a flag. Nothing lowers one again.
    void MarkSet();
    void MarkReset();
    void MarkInvalid();

    /// Comparisons look at the stored values only, never at the flags.
    bool operator==(const T& value) const;
    bool operator!=(const T& value) const;
    bool operator==(const APIParameter& other) const;
    bool operator!=(const APIParameter& other) const;

    /// Takes the value when it has the right type and range; `type` matters for
    /// Json::Value only. False leaves the stored value as it was. Sets no flag.
    bool ParseValue(const Json::Value& value, Json::ValueType type);

    /// Moves an absent parameter to one of its other states.
    void CheckValueTypeAndGet(const Json::Value& value, Json::ValueType type, Validator validator);

  private:
    APIParameterPrivate<T>* d;
};

/// Typed parameters out of any JSON object, for the seven scalar types.
///
///     auto port = APIParameterFactoryBasicImpl<int>::FromJson(settings, "port", REQUIRED, IsPort);
///
/// A source that is no JSON object gives an invalid parameter, whatever the necessity.
template <typename T>
class WEBAPI_EXPORT APIParameterFactoryBasicImpl {
  public:
    static APIParameter<T> FromJson(const Json::Value& object, const std::string& name,
                                    PARAM_NECESSITY necessity,
                                    typename APIParameter<T>::Validator validator);
};

/// The same for members that must be a JSON object, or a JSON array.
///
///     auto rules = APIParameterFactory::ArrayFromJson(settings, "rules", OPTIONAL, nullptr);
class WEBAPI_EXPORT APIParameterFactory {
  public:
    static APIParameter<Json::Value> ObjectFromJson(const Json::Value& object,
                                                    const std::string& name,
                                                    PARAM_NECESSITY necessity,
                                                    APIParameter<Json::Value>::Validator validator);
    static APIParameter<Json::Value> ArrayFromJson(const Json::Value& object,
                                                   const std::string& name,
                                                   PARAM_NECESSITY necessity,
                                                   APIParameter<Json::Value>::Validator validator);
};

extern template class APIParameter<int>;
extern template class APIParameter<unsigned int>;
extern template class APIParameter<long long>;
extern template class APIParameter<unsigned long long>;
extern template class APIParameter<bool>;
extern template class APIParameter<double>;
extern template class APIParameter<std::string>;
extern template class APIParameter<Json::Value>;

extern template class APIParameterFactoryBasicImpl<int>;
extern template class APIParameterFactoryBasicImpl<unsigned int>;
extern template class APIParameterFactoryBasicImpl<long long>;
extern template class APIParameterFactoryBasicImpl<unsigned long long>;
extern template class APIParameterFactoryBasicImpl<bool>;
extern template class APIParameterFactoryBasicImpl<double>;
extern template class APIParameterFactoryBasicImpl<std::string>;

}  // namespace TALO

#endif
