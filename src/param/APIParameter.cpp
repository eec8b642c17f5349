#include "webapi/APIParameter.h"

namespace TALO {

template <typename T>
class APIParameterPrivate {
  public:
    bool set = false;
    bool reset = false;
    bool invalid = false;
    T value = T();
};

namespace {

// One overload per type: whether the JSON value has the type and fits, and if so
// its value. A real number that is a whole one counts as an integer.

bool Parse(const Json::Value& json, Json::ValueType, int* out) {
    if (!json.isInt()) {
        return false;
    }
    *out = static_cast<int>(json.asInt64());
    return true;
}

bool Parse(const Json::Value& json, Json::ValueType, unsigned int* out) {
    if (!json.isUInt()) {
        return false;
    }
    *out = static_cast<unsigned int>(json.asUInt64());
    return true;
}

bool Parse(const Json::Value& json, Json::ValueType, long long* out) {
    if (!json.isInt64()) {
        return false;
    }
    *out = json.asInt64();
    return true;
}

bool Parse(const Json::Value& json, Json::ValueType, unsigned long long* out) {
    if (!json.isUInt64()) {
        return false;
    }
    *out = json.asUInt64();
    return true;
}

bool Parse(const Json::Value& json, Json::ValueType, bool* out) {
    if (!json.isBool()) {
        return false;
    }
    *out = json.asBool();
    return true;
}

bool Parse(const Json::Value& json, Json::ValueType, double* out) {
    if (!json.isNumeric()) {
        return false;
    }
    *out = json.asDouble();
    return true;
}

bool Parse(const Json::Value& json, Json::ValueType, std::string* out) {
    if (!json.isString()) {
        return false;
    }
    *out = json.asString();
    return true;
}

bool Parse(const Json::Value& json, Json::ValueType type, Json::Value* out) {
    if (json.type() != type) {
        return false;
    }
    *out = json;
    return true;
}

template <typename T>
APIParameter<T> ReadMember(const Json::Value& object, const std::string& name,
                           PARAM_NECESSITY necessity, Json::ValueType type,
                           typename APIParameter<T>::Validator validator) {
    APIParameter<T> parameter;
    if (!object.isObject()) {
        parameter.MarkInvalid();
    } else if (object.isMember(name)) {
        parameter.CheckValueTypeAndGet(object[name], type, validator);
    } else if (necessity == REQUIRED) {
        parameter.MarkInvalid();
    }
    return parameter;
}

}  // namespace

template <typename T>
APIParameter<T>::APIParameter() : d(new APIParameterPrivate<T>()) {}

template <typename T>
APIParameter<T>::APIParameter(const APIParameter& other)
    : d(new APIParameterPrivate<T>(*other.d)) {}

template <typename T>
APIParameter<T>& APIParameter<T>::operator=(const APIParameter& other) {
    *d = *other.d;
    return *this;
}

template <typename T>
APIParameter<T>::~APIParameter() {
    delete d;
}

template <typename T>
const T& APIParameter<T>::Get() const {
    return d->value;
}

template <typename T>
const T& APIParameter<T>::Get(const T& fallback) const {
    return d->set && !d->invalid ? d->value : fallback;
}

template <typename T>
bool APIParameter<T>::IsSet() const {
    return d->set;
}

template <typename T>
bool APIParameter<T>::IsReset() const {
    return d->reset;
}

template <typename T>
bool APIParameter<T>::IsInvalid() const {
    return d->invalid;
}

template <typename T>
void APIParameter<T>::MarkSet() {
    d->set = true;
}

template <typename T>
void APIParameter<T>::MarkReset() {
    d->reset = true;
}

template <typename T>
void APIParameter<T>::MarkInvalid() {
    d->invalid = true;
}

template <typename T>
bool APIParameter<T>::operator==(const T& value) const {
    return d->value == value;
}

template <typename T>
bool APIParameter<T>::operator!=(const T& value) const {
    return !(*this == value);
}

template <typename T>
bool APIParameter<T>::operator==(const APIParameter& other) const {
    return d->value == other.d->value;
}

template <typename T>
bool APIParameter<T>::operator!=(const APIParameter& other) const {
    return !(*this == other);
}

template <typename T>
bool APIParameter<T>::ParseValue(const Json::Value& value, Json::ValueType type) {
    return Parse(value, type, &d->value);
}

template <typename T>
void APIParameter<T>::CheckValueTypeAndGet(const Json::Value& value, Json::ValueType type,
                                           Validator validator) {
    MarkSet();
    if (value.isNull()) {
        MarkReset();
        return;
    }
    if (!ParseValue(value, type) || (validator != nullptr && !validator(d->value))) {
        MarkInvalid();
    }
}

template <typename T>
APIParameter<T> APIParameterFactoryBasicImpl<T>::FromJson(
    const Json::Value& object, const std::string& name, PARAM_NECESSITY necessity,
    typename APIParameter<T>::Validator validator) {
    return ReadMember<T>(object, name, necessity, Json::nullValue, validator);
}

APIParameter<Json::Value> APIParameterFactory::ObjectFromJson(
    const Json::Value& object, const std::string& name, PARAM_NECESSITY necessity,
    APIParameter<Json::Value>::Validator validator) {
    return ReadMember<Json::Value>(object, name, necessity, Json::objectValue, validator);
}

APIParameter<Json::Value> APIParameterFactory::ArrayFromJson(
    const Json::Value& object, const std::string& name, PARAM_NECESSITY necessity,
    APIParameter<Json::Value>::Validator validator) {
    return ReadMember<Json::Value>(object, name, necessity, Json::arrayValue, validator);
}

template class APIParameter<int>;
template class APIParameter<unsigned int>;
template class APIParameter<long long>;
template class APIParameter<unsigned long long>;
template class APIParameter<bool>;
template class APIParameter<double>;
template class APIParameter<std::string>;
template class APIParameter<Json::Value>;

template class APIParameterFactoryBasicImpl<int>;
template class APIParameterFactoryBasicImpl<unsigned int>;
template class APIParameterFactoryBasicImpl<long long>;
template class APIParameterFactoryBasicImpl<unsigned long long>;
template class APIParameterFactoryBasicImpl<bool>;
template class APIParameterFactoryBasicImpl<double>;
template class APIParameterFactoryBasicImpl<std::string>;

}  // namespace TALO
