#include "src/param/APIValidatorPrivate.h"

#include <locale.h>

#include <cstdlib>

#include "src/base/Log.h"

namespace TALO {

namespace {

constexpr char kSource[] = "APIValidator.cpp";

// An API library may have set a locale. There, ranges are read in another order,
// and a byte that is no character matches nothing.
class PlainLocale {
  public:
    PlainLocale() : before_(uselocale(Plain())) {}
    ~PlainLocale() {
        uselocale(before_);
    }
    PlainLocale(const PlainLocale&) = delete;
    PlainLocale& operator=(const PlainLocale&) = delete;

  private:
    static locale_t Plain() {
        static const locale_t plain = newlocale(LC_ALL_MASK, "C", nullptr);
        return plain;
    }

    const locale_t before_;
};

}  // namespace

APIValidatorPrivate::~APIValidatorPrivate() {
    for (const auto& entry : regexCache) {
        regfree(entry.second);
        std::free(entry.second);
    }
    regexCache.clear();
}

bool APIValidatorPrivate::GetRegex(const char* pattern, regex_t** out) {
    if (pattern == nullptr || out == nullptr) {
        return false;
    }
    const auto known = regexCache.find(pattern);
    if (known != regexCache.end()) {
        *out = known->second;
        return true;
    }
    const PlainLocale plain;
    auto* expression = static_cast<regex_t*>(std::calloc(1, sizeof(regex_t)));
    if (expression == nullptr || regcomp(expression, pattern, REG_EXTENDED | REG_NOSUB) != 0) {
        LOG_ERROR("Invalid pattern");
        std::free(expression);
        return false;
    }
    regexCache[pattern] = expression;
    *out = expression;
    return true;
}

// The matcher reads up to a NUL: what hides behind one was never tested.
bool APIValidatorPrivate::CheckRegex(const std::string& value, const char* pattern) {
    const PlainLocale plain;
    regex_t* expression = nullptr;
    return GetRegex(pattern, &expression) && value.find('\0') == std::string::npos &&
           regexec(expression, value.c_str(), 0, nullptr, 0) == 0;
}

}  // namespace TALO
