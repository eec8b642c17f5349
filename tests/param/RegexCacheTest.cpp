#include <dlfcn.h>
#include <gtest/gtest.h>
#include <locale.h>
#include <syslog.h>

#include <string>

#include "src/param/APIValidatorPrivate.h"
#include "tests/support/Child.h"
#include "tests/support/LogCapture.h"
#include "webapi/APIValidator.h"

using TALO::APIValidator;
using TALO::APIValidatorPrivate;

namespace {

int compiled = 0;
int freed = 0;

}  // namespace

// Stand before the C library's, and count.
extern "C" int regcomp(regex_t* expression, const char* pattern, int flags) {
    typedef int (*Function)(regex_t*, const char*, int);
    static const Function real = reinterpret_cast<Function>(dlsym(RTLD_NEXT, "regcomp"));
    ++compiled;
    return real(expression, pattern, flags);
}

extern "C" void regfree(regex_t* expression) {
    typedef void (*Function)(regex_t*);
    static const Function real = reinterpret_cast<Function>(dlsym(RTLD_NEXT, "regfree"));
    ++freed;
    real(expression);
}

namespace {

const char kABC[] = "^[abc]+$";

class RegexCache : public ::testing::Test {
  protected:
    RegexCache() {
        compiled = 0;
        freed = 0;
    }
    APIValidatorPrivate cache;
};

TEST_F(RegexCache, CompilesAPatternOnce) {
    for (int round = 0; round < 10; ++round) {
        EXPECT_TRUE(cache.CheckRegex("abc", kABC));
        EXPECT_FALSE(cache.CheckRegex("abcd", kABC));
    }
    EXPECT_EQ(compiled, 1);
    EXPECT_EQ(cache.regexCache.size(), 1u);
}

TEST_F(RegexCache, AnswersTheSameExpressionAgain) {
    regex_t* first = nullptr;
    regex_t* second = nullptr;
    EXPECT_TRUE(cache.GetRegex(kABC, &first));
    EXPECT_TRUE(cache.GetRegex(kABC, &second));
    ASSERT_NE(first, nullptr);
    EXPECT_EQ(first, second);
    EXPECT_EQ(cache.regexCache.at(kABC), first);
}

TEST_F(RegexCache, KnowsAPatternByItsAddress) {
    const std::string copy = kABC;
    EXPECT_TRUE(cache.CheckRegex("abc", kABC));
    EXPECT_TRUE(cache.CheckRegex("abc", copy.c_str()));
    EXPECT_EQ(compiled, 2);
    regex_t* one = nullptr;
    regex_t* other = nullptr;
    EXPECT_TRUE(cache.GetRegex(kABC, &one));
    EXPECT_TRUE(cache.GetRegex(copy.c_str(), &other));
    EXPECT_NE(one, other);
    EXPECT_EQ(compiled, 2);
}

TEST_F(RegexCache, GoesOnWithTheOldTextOfAnAddress) {
    char pattern[] = "^[abc]+$";
    EXPECT_TRUE(cache.CheckRegex("abc", pattern));
    pattern[2] = 'x';
    EXPECT_TRUE(cache.CheckRegex("abc", pattern));
    EXPECT_EQ(compiled, 1);
}

TEST_F(RegexCache, FreesEveryExpression) {
    {
        APIValidatorPrivate own;
        EXPECT_TRUE(own.CheckRegex("abc", kABC));
        EXPECT_TRUE(own.CheckRegex("1", "^[0-9]$"));
        EXPECT_EQ(freed, 0);
    }
    EXPECT_EQ(freed, 2);
}

TEST_F(RegexCache, RefusesNull) {
    regex_t* expression = nullptr;
    EXPECT_FALSE(cache.GetRegex(nullptr, &expression));
    EXPECT_FALSE(cache.GetRegex(kABC, nullptr));
    EXPECT_FALSE(cache.GetRegex(nullptr, nullptr));
    EXPECT_FALSE(cache.CheckRegex("abc", nullptr));
    EXPECT_FALSE(APIValidator::CheckRegex("abc", nullptr));
    EXPECT_EQ(expression, nullptr);
    EXPECT_EQ(compiled, 0);
    EXPECT_TRUE(cache.regexCache.empty());
}

TEST_F(RegexCache, LogsAnInvalidPatternAndDoesNotKeepIt) {
    const char* const patterns[] = {"[", "(", "a{2,1}", "[[:none:]]", "*\\"};
    for (const char* pattern : patterns) {
        const support::LogCapture log;
        regex_t untouched;
        regex_t* expression = &untouched;
        EXPECT_FALSE(cache.GetRegex(pattern, &expression)) << pattern;
        EXPECT_EQ(expression, &untouched) << pattern;
        EXPECT_TRUE(log.Has("APIValidator.cpp", "Invalid pattern")) << pattern;
        ASSERT_EQ(log.Lines().size(), 1u) << pattern;
        EXPECT_EQ(log.Lines()[0].priority, LOG_ERR) << pattern;
        EXPECT_FALSE(cache.CheckRegex("a", pattern)) << pattern;
        EXPECT_EQ(log.Lines().size(), 2u) << pattern;
    }
    EXPECT_TRUE(cache.regexCache.empty());
}

TEST_F(RegexCache, LogsNothingForAValueThatFails) {
    const support::LogCapture log;
    EXPECT_FALSE(cache.CheckRegex("xyz", kABC));
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(RegexCache, ReadsExtendedSyntax) {
    const struct {
        const char* name;
        const char* pattern;
        const char* value;
        bool matches;
    } rows[] = {
        {"plus repeats", "^a+$", "aaa", true},
        {"braces count", "^a{2}$", "aa", true},
        {"braces count, one more", "^a{2}$", "aaa", false},
        {"either", "^(a|b)$", "b", true},
        {"no anchor", "b", "abc", true},
        {"upper and lower case differ", "^a$", "A", false},
        {"empty pattern", "", "anything", true},
        {"empty value", "^$", "", true},
        {"a dot is an end of line too", "^a.b$", "a\nb", true},
        {"the end is the end of all", "^a$", "a\nb", false},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(cache.CheckRegex(row.value, row.pattern), row.matches) << row.name;
    }
}

TEST_F(RegexCache, LooksAtBytesWhateverTheLocale) {
    const support::ChildResult result = support::InChild([this] {
        EXPECT_TRUE(cache.CheckRegex("\xFF", "^[^a]$"));
        EXPECT_NE(setlocale(LC_ALL, "C.UTF-8"), nullptr);
        APIValidatorPrivate later;
        for (APIValidatorPrivate* each : {&cache, &later}) {
            EXPECT_TRUE(each->CheckRegex("\xFF", "[^a]"));
            EXPECT_TRUE(each->CheckRegex("\xC3\xA9", "^[^a]{2}$"));
            EXPECT_FALSE(each->CheckRegex("\xC3\xA9", "^[[:alpha:]]$"));
        }
        EXPECT_STREQ(setlocale(LC_ALL, nullptr), "C.UTF-8");
        EXPECT_EQ(MB_CUR_MAX, 6u);
        return 0;
    });
    EXPECT_EQ(result.status, 0);
}

TEST_F(RegexCache, CompilesEachPatternOfTheValidatorOnce) {
    const auto testAll = [] {
        EXPECT_TRUE(APIValidator::IsReachNetId("box"));
        EXPECT_TRUE(APIValidator::IsDigit("12"));
        EXPECT_TRUE(APIValidator::IsWorkGroup("GROUP"));
        EXPECT_TRUE(APIValidator::IsNetbios("box"));
        EXPECT_TRUE(APIValidator::IsEMail("me@example.org"));
        EXPECT_TRUE(APIValidator::CheckRegex("abc", kABC));
    };
    testAll();
    // Other tests may have had some of them compiled before.
    EXPECT_LE(compiled, 6);
    compiled = 0;
    for (int round = 0; round < 10; ++round) {
        testAll();
    }
    EXPECT_EQ(compiled, 0);
}

TEST_F(RegexCache, CompilesNothingForWhatIsRefusedBefore) {
    // Tells in a process of its own, where nothing is compiled yet.
    (void)APIValidator::IsWorkGroup("");
    (void)APIValidator::IsNetbios("");
    (void)APIValidator::IsEMail("");
    EXPECT_EQ(compiled, 0);
}

}  // namespace
