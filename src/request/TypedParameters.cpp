#include "src/request/APIRequestPrivate.h"
#include "webapi/APIRequest.h"

namespace TALO {

APIParameter<int> APIRequest::GetAndCheckInt(const std::string& name, PARAM_NECESSITY necessity,
                                             APIParameter<int>::Validator validator) const {
    return d->GetAndCheckParam<int>(name, necessity == REQUIRED, Json::intValue, validator);
}

APIParameter<bool> APIRequest::GetAndCheckBool(const std::string& name, PARAM_NECESSITY necessity,
                                               APIParameter<bool>::Validator validator) const {
    return d->GetAndCheckParam<bool>(name, necessity == REQUIRED, Json::booleanValue, validator);
}

APIParameter<double> APIRequest::GetAndCheckReal(const std::string& name, PARAM_NECESSITY necessity,
                                                 APIParameter<double>::Validator validator) const {
    return d->GetAndCheckParam<double>(name, necessity == REQUIRED, Json::realValue, validator);
}

APIParameter<std::string> APIRequest::GetAndCheckString(
    const std::string& name, PARAM_NECESSITY necessity,
    APIParameter<std::string>::Validator validator) const {
    return d->GetAndCheckParam<std::string>(name, necessity == REQUIRED, Json::stringValue,
                                            validator);
}

APIParameter<Json::Value> APIRequest::GetAndCheckObject(
    const std::string& name, PARAM_NECESSITY necessity,
    APIParameter<Json::Value>::Validator validator) const {
    return d->GetAndCheckParam<Json::Value>(name, necessity == REQUIRED, Json::objectValue,
                                            validator);
}

APIParameter<Json::Value> APIRequest::GetAndCheckArray(
    const std::string& name, PARAM_NECESSITY necessity,
    APIParameter<Json::Value>::Validator validator) const {
    return d->GetAndCheckParam<Json::Value>(name, necessity == REQUIRED, Json::arrayValue,
                                            validator);
}

APIParameter<Json::Value> APIRequest::GetAndCheckUnitArray(
    const std::string& name, PARAM_NECESSITY necessity,
    APIParameter<Json::Value>::Validator validator) const {
    return d->GetAndCheckUnitArrayParam(name, necessity == REQUIRED, validator);
}

template <typename T>
APIParameter<T> APIRequest::GetAndCheckIntegral(
    const std::string& name, PARAM_NECESSITY necessity,
    typename APIParameter<T>::Validator validator) const {
    return d->GetAndCheckParam<T>(name, necessity == REQUIRED, Json::intValue, validator);
}

template WEBAPI_EXPORT APIParameter<unsigned int> APIRequest::GetAndCheckIntegral(
    const std::string&, PARAM_NECESSITY, APIParameter<unsigned int>::Validator) const;
template WEBAPI_EXPORT APIParameter<long long> APIRequest::GetAndCheckIntegral(
    const std::string&, PARAM_NECESSITY, APIParameter<long long>::Validator) const;
template WEBAPI_EXPORT APIParameter<unsigned long long> APIRequest::GetAndCheckIntegral(
    const std::string&, PARAM_NECESSITY, APIParameter<unsigned long long>::Validator) const;

}  // namespace TALO
