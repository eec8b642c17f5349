#include "hosts/linux/task/SecretParams.h"

namespace host {

namespace {

constexpr char kParam[] = "param";
constexpr char kMasked[] = "*****";

void Mask(const std::string& name, Json::Value* param) {
    if (param->isMember(name)) {
        (*param)[name] = kMasked;
    }
}

}  // namespace

Json::Value WithoutSecrets(const Json::Value& info, const Json::Value& names) {
    Json::Value masked = info;
    if (!masked.isObject() || !masked[kParam].isObject()) {
        return info;
    }
    Json::Value& param = masked[kParam];
    Mask("_sid", &param);
    Mask("passwd", &param);
    if (names.isArray()) {
        for (const Json::Value& name : names) {
            if (name.isString()) {
                Mask(name.asString(), &param);
            }
        }
    }
    return masked;
}

}  // namespace host
