#include "hosts/linux/download/Conditions.h"

#include <gtest/gtest.h>

namespace {

using host::Condition;
using host::ConditionHeaders;

constexpr time_t kModified = 784111777;
constexpr time_t kNow = kModified + 3600;
const char kThen[] = "Sun, 06 Nov 1994 08:49:37 GMT";
const char kBefore[] = "Sun, 06 Nov 1994 08:49:36 GMT";
const char kAfter[] = "Sun, 06 Nov 1994 08:49:38 GMT";

const host::Validators kContent = {"\"a-1\"", kModified};

std::string Word(Condition condition) {
    return condition == Condition::Met           ? "met"
           : condition == Condition::NotModified ? "not modified"
                                                 : "failed";
}

struct Row {
    const char* what;
    std::string header;
    const char* verdict;
};

void ExpectRows(std::optional<std::string> ConditionHeaders::*member,
                const std::vector<Row>& rows) {
    for (const Row& row : rows) {
        ConditionHeaders headers;
        headers.*member = row.header;
        EXPECT_EQ(Word(host::CheckConditions(headers, kContent, kNow)), row.verdict) << row.what;
    }
}

TEST(Conditions, AreMetWithoutHeaders) {
    EXPECT_EQ(Word(host::CheckConditions({}, kContent, kNow)), "met");
}

TEST(Conditions, NameTheTagThatTheClientHas) {
    ExpectRows(&ConditionHeaders::ifNoneMatch,
               {
                   {"the tag", "\"a-1\"", "not modified"},
                   {"the tag, weak", "W/\"a-1\"", "not modified"},
                   {"any", "*", "not modified"},
                   {"any, with blanks", " * ", "not modified"},
                   {"another", "\"a-2\"", "met"},
                   {"in capitals", "\"A-1\"", "met"},
                   {"first of some", "\"a-1\", \"b\"", "not modified"},
                   {"last of some", "\"b\" ,W/\"c\",\t\"a-1\"", "not modified"},
                   {"among empty members", ",, ,\"a-1\",", "not modified"},
                   {"with a comma in another", "\"x,\\\", \"a-1\"", "not modified"},
                   {"within another", "\"x\"a-1\"", "met"},
                   {"without quotes", "a-1", "met"},
                   {"half quoted", "\"a-1", "met"},
                   {"weak in small letters", "w/\"a-1\"", "met"},
                   {"behind what is wrong", "b, \"a-1\"", "met"},
                   {"without a comma", "\"b\" \"a-1\"", "met"},
                   {"before what is wrong", "\"a-1\", b", "not modified"},
                   {"glued to what is wrong", "\"a-1\"b", "met"},
                   {"any among some", "\"b\", *", "met"},
                   {"nothing", "", "met"},
                   {"a blank in the tag", "\"a-1 \"", "met"},
                   {"very long", std::string(100000, ',') + "\"a-1\"", "not modified"},
               });
}

TEST(Conditions, NameTheTagThatTheClientExpects) {
    ExpectRows(&ConditionHeaders::ifMatch, {
                                               {"the tag", "\"a-1\"", "met"},
                                               {"the tag, weak", "W/\"a-1\"", "failed"},
                                               {"any", "*", "met"},
                                               {"another", "\"b\"", "failed"},
                                               {"among some", "\"b\", \"a-1\"", "met"},
                                               {"nothing", "", "failed"},
                                           });
}

TEST(Conditions, NameTheTimeThatTheClientHas) {
    ExpectRows(&ConditionHeaders::ifModifiedSince,
               {
                   {"the time", kThen, "not modified"},
                   {"the time, in its old form", "Sunday, 06-Nov-94 08:49:37 GMT", "not modified"},
                   {"a second before", kBefore, "met"},
                   {"a second after", kAfter, "not modified"},
                   {"no time", "yesterday", "met"},
                   {"with blanks", std::string(" ") + kThen + "\t", "not modified"},
               });
    ExpectRows(&ConditionHeaders::ifUnmodifiedSince, {
                                                         {"the time", kThen, "met"},
                                                         {"a second before", kBefore, "failed"},
                                                         {"a second after", kAfter, "met"},
                                                         {"no time", "yesterday", "met"},
                                                     });
}

TEST(Conditions, LetATagBeatADate) {
    ConditionHeaders headers;
    headers.ifNoneMatch = "\"b\"";
    headers.ifModifiedSince = kAfter;
    EXPECT_EQ(Word(host::CheckConditions(headers, kContent, kNow)), "met");
    headers = {};
    headers.ifMatch = "\"a-1\"";
    headers.ifUnmodifiedSince = kBefore;
    EXPECT_EQ(Word(host::CheckConditions(headers, kContent, kNow)), "met");
    headers.ifMatch = "\"b\"";
    headers.ifNoneMatch = "\"a-1\"";
    EXPECT_EQ(Word(host::CheckConditions(headers, kContent, kNow)), "failed");
}

TEST(Conditions, IgnoreDatesForATimeThatNoHeaderCanCarry) {
    const host::Validators farAway = {"\"a-1\"", -99999999999999};
    ConditionHeaders headers;
    headers.ifModifiedSince = kAfter;
    EXPECT_EQ(Word(host::CheckConditions(headers, farAway, kNow)), "met");
}

TEST(RangeCondition, CountsForExactlyThisState) {
    struct RangeRow {
        const char* what;
        std::string header;
        bool counts;
    };
    for (const RangeRow& row : {
             RangeRow{"the tag", "\"a-1\"", true},
             RangeRow{"with blanks", " \"a-1\" ", true},
             RangeRow{"the tag, weak", "W/\"a-1\"", false},
             RangeRow{"another", "\"b\"", false},
             RangeRow{"a list", "\"a-1\", \"b\"", false},
             RangeRow{"any", "*", false},
             RangeRow{"the time", kThen, true},
             RangeRow{"a second before", kBefore, false},
             RangeRow{"a second after", kAfter, false},
             RangeRow{"no time", "yesterday", false},
             RangeRow{"nothing", "", false},
         }) {
        ConditionHeaders headers;
        headers.ifRange = row.header;
        EXPECT_EQ(host::RangeCounts(headers, kContent, kNow), row.counts) << row.what;
    }
    EXPECT_TRUE(host::RangeCounts({}, kContent, kNow));
}

TEST(RangeCondition, TakesNoDateForAContentThatChangedInThisSecond) {
    ConditionHeaders headers;
    headers.ifRange = kThen;
    EXPECT_FALSE(host::RangeCounts(headers, kContent, kModified));
    EXPECT_TRUE(host::RangeCounts(headers, kContent, kModified + 1));
    EXPECT_FALSE(host::RangeCounts(headers, kContent, kModified - 3600));
}

}  // namespace
