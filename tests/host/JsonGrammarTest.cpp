#include "hosts/linux/util/JsonGrammar.h"

#include <gtest/gtest.h>

#include <exception>
#include <memory>
#include <string>
#include <thread>

namespace {

constexpr size_t kDepth = 64;

bool Parse(const std::string& text, Json::Value* out, host::JsonError* error,
           size_t depth = kDepth) {
    return host::ParseJson(text.data(), text.data() + text.size(), depth, out, error);
}

// The library's reader as strict as it goes, apart from the root's type.
Json::Value ByTheLibrary(const std::string& text) {
    Json::CharReaderBuilder builder;
    Json::CharReaderBuilder::strictMode(&builder.settings_);
    builder["strictRoot"] = false;
    builder["rejectDupKeys"] = false;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    Json::Value value("not parsed");
    EXPECT_TRUE(reader->parse(text.data(), text.data() + text.size(), &value, nullptr)) << text;
    return value;
}

TEST(JsonGrammar, ReadsWhatTheLibraryReads) {
    const std::string rows[] = {
        "null",
        "true",
        "false",
        "0",
        "-0",
        "1",
        "-1",
        "12345",
        "2147483648",
        "9223372036854775807",
        "-9223372036854775808",
        "18446744073709551615",
        "18446744073709551616",
        "0.5",
        "-0.5",
        "1.0",
        "1e2",
        "1E+2",
        "1e-2",
        "0e0",
        "1.25e10",
        R"("")",
        R"("a")",
        R"("\"\\\/\b\f\n\r\t")",
        R"("\u0000")",
        R"("\u00e9\u20AC")",
        R"("\ud83d\ude00")",
        "\"\x7F\"",
        "\"\xC3\xA9\"",
        "\"\xFF\xFE\"",
        "[]",
        "{}",
        "[ ]",
        "{ }",
        "[1]",
        "[1,2 , 3]",
        "[[],[[]],{}]",
        R"({"a":1})",
        R"({ "a" : [ 1 , { "b" : null } ] })",
        R"({"":""})",
        R"({"a":1,"a":2})",
        R"({"\u0000":1})",
        " 1 ",
        "\t\r\n[\n]\n ",
    };
    for (const std::string& text : rows) {
        Json::Value value;
        host::JsonError error;
        EXPECT_TRUE(Parse(text, &value, &error)) << text << ": " << error.reason;
        EXPECT_EQ(value, ByTheLibrary(text)) << text;
    }
}

TEST(JsonGrammar, RefusesEverythingElseAndSaysWhere) {
    const char kValue[] = "expected a value";
    const char kBehind[] = "text behind the value";
    const char kEscape[] = "unknown escape";
    const char kControl[] = "control character in a string";
    const char kEnd[] = "string without an end";
    const char kName[] = "expected a member's name";
    const char kColon[] = "expected \":\"";
    const char kList[] = "expected \",\" or \"]\"";
    const char kMember[] = "expected \",\" or \"}\"";
    const char kRange[] = "number out of range or half a surrogate pair";
    const struct {
        std::string text;
        const char* reason;
        size_t offset;
    } rows[] = {
        {"", kValue, 0},
        {"  ", kValue, 2},
        {std::string(1, '\0'), kValue, 0},
        {std::string("1\0", 2), kBehind, 1},
        {std::string("[\0]", 3), kValue, 1},
        {"tru", kValue, 0},
        {"True", kValue, 0},
        {"nul", kValue, 0},
        {"truetrue", kBehind, 4},
        {"NaN", kValue, 0},
        {"Infinity", kValue, 0},
        {"-Infinity", kValue, 1},
        {"'a'", kValue, 0},
        {"// c\n1", kValue, 0},
        {"1 /* c */", kBehind, 2},
        {"\xEF\xBB\xBF[]", kValue, 0},
        {"\v1", kValue, 0},
        {"1\f", kBehind, 1},
        {"1 2", kBehind, 2},
        {"[] x", kBehind, 3},
        {"{}{}", kBehind, 2},
        {"]", kValue, 0},
        {"-", kValue, 1},
        {"+1", kValue, 0},
        {"01", kBehind, 1},
        {"007", kBehind, 1},
        {"-01", kBehind, 2},
        {".5", kValue, 0},
        {"1.", kValue, 2},
        {"1.e2", kValue, 2},
        {"1e", kValue, 2},
        {"1e+", kValue, 3},
        {"0x10", kBehind, 1},
        {"1_000", kBehind, 1},
        {"1e999", kRange, 0},
        {"\"", kEnd, 1},
        {"\"abc", kEnd, 4},
        {"\"\\", kEscape, 2},
        {"\"\\\"", kEnd, 3},
        {R"("\x")", kEscape, 2},
        {std::string("\"\\\0\"", 4), kEscape, 2},
        {R"("\u12")", kEscape, 5},
        {R"("\u12G4")", kEscape, 5},
        {R"("\ud800")", kRange, 0},
        {R"("\ud800x")", kRange, 0},
        {"\"a\nb\"", kControl, 2},
        {"\"a\tb\"", kControl, 2},
        {std::string("\"a\0b\"", 5), kControl, 2},
        {"[", kValue, 1},
        {"[1", kList, 2},
        {"[1,", kValue, 3},
        {"[1,]", kValue, 3},
        {"[,1]", kValue, 1},
        {"[1 2]", kList, 3},
        {"[1}", kList, 2},
        {"{", kName, 1},
        {"{a:1}", kName, 1},
        {"{1:1}", kName, 1},
        {"{\"a\"", kColon, 4},
        {"{\"a\" 1}", kColon, 5},
        {"{\"a\":", kValue, 5},
        {"{\"a\":}", kValue, 5},
        {"{\"a\":1", kMember, 6},
        {"{\"a\":1,}", kName, 7},
        {"{\"a\":1]", kMember, 6},
        {"{\"a\":1 \"b\":2}", kMember, 7},
        {"{\"a", kEnd, 3},
    };
    for (const auto& row : rows) {
        Json::Value value("untouched");
        host::JsonError error;
        EXPECT_FALSE(Parse(row.text, &value, &error)) << row.text;
        EXPECT_STREQ(error.reason, row.reason) << row.text;
        EXPECT_EQ(error.offset, row.offset) << row.text;
        EXPECT_EQ(value, "untouched") << row.text;
    }
}

TEST(JsonGrammar, RefusesEveryBeginningOfADocument) {
    const std::string whole = R"({"a":[1,-2.5e3,"x\u00e9\n",true,null,{"b":[[]]}]})";
    for (size_t length = 0; length < whole.size(); ++length) {
        Json::Value value;
        host::JsonError error;
        EXPECT_FALSE(Parse(whole.substr(0, length), &value, &error)) << length;
        EXPECT_LE(error.offset, length);
    }
}

TEST(JsonGrammar, NestsAsDeepAsAllowed) {
    const struct {
        size_t depth;
        bool accepted;
    } rows[] = {{1, true}, {63, true}, {64, true}, {65, false}, {100000, false}};
    for (const auto& row : rows) {
        std::string objects;
        for (size_t level = 0; level < row.depth; ++level) {
            objects += "{\"a\":";
        }
        const std::string arrays = std::string(row.depth, '[') + std::string(row.depth, ']');
        objects += "1" + std::string(row.depth, '}');
        for (const std::string& text : {arrays, objects}) {
            Json::Value value;
            host::JsonError error;
            EXPECT_EQ(Parse(text, &value, &error), row.accepted) << row.depth;
            if (!row.accepted) {
                EXPECT_STREQ(error.reason, "nested too deep");
                EXPECT_EQ(error.offset, text[0] == '[' ? kDepth : kDepth * 5);
            }
        }
    }
}

TEST(JsonGrammar, CountsTheLevelsThatAreOpenOnly) {
    std::string text = "[";
    for (int element = 0; element < 1000; ++element) {
        text += "[{}],";
    }
    Json::Value value;
    host::JsonError error;
    EXPECT_TRUE(Parse(text + "[]]", &value, &error, 3)) << error.reason;
    EXPECT_FALSE(Parse(text + "[]]", &value, &error, 2));
}

TEST(JsonGrammar, TakesAsManyValuesAsAllowed) {
    std::string text = "[";
    for (size_t value = 0; value + 2 < host::kMaxJsonValues; ++value) {
        text += "0,";
    }
    Json::Value value;
    host::JsonError error;
    EXPECT_TRUE(Parse(text + "0]", &value, &error)) << error.reason;
    EXPECT_EQ(value.size() + 1, host::kMaxJsonValues);
    EXPECT_FALSE(Parse(text + "0,0]", &value, &error));
    EXPECT_STREQ(error.reason, "too many values");
}

TEST(JsonGrammar, TakesTheValuesOfSeveralTextsOffOneBudget) {
    size_t budget = 5;
    Json::Value value;
    host::JsonError error;
    const auto parse = [&](const std::string& text) {
        return host::ParseJson(text.data(), text.data() + text.size(), kDepth, &value, &error,
                               &budget);
    };
    EXPECT_TRUE(parse("[1,2]"));
    EXPECT_EQ(budget, 2u);
    EXPECT_FALSE(parse("[1,2]"));
    EXPECT_FALSE(parse("x"));
    EXPECT_EQ(budget, 2u);
    EXPECT_TRUE(parse("{\"a\":1}"));
    EXPECT_FALSE(parse("1"));
    EXPECT_EQ(budget, 0u);
}

TEST(JsonGrammar, LooksAtNothingBehindTheEnd) {
    const std::string text = "[1]]";
    Json::Value value;
    host::JsonError error;
    EXPECT_TRUE(host::ParseJson(text.data(), text.data() + 3, kDepth, &value, &error));
    EXPECT_TRUE(host::AcceptJson(text.data() + 1, text.data() + 2, kDepth, &error));
}

// A background task's progress is written beside its result.
TEST(JsonGrammar, ReadsInTwoThreadsAtOnce) {
    const std::string text = R"({"list":[1,{"a":"b"},[[]],{}],"text":"x","more":{"n":{"m":1}}})";
    const auto read = [&](int* wrong) {
        for (int round = 0; round < 5000; ++round) {
            Json::Value value;
            host::JsonError error;
            try {
                *wrong += Parse(text, &value, &error) && value["more"]["n"]["m"] == 1 ? 0 : 1;
            } catch (const std::exception&) {
                ++*wrong;
            }
        }
    };
    int wrong[2] = {};
    std::thread other(read, &wrong[0]);
    read(&wrong[1]);
    other.join();
    EXPECT_EQ(wrong[0] + wrong[1], 0);
}

}  // namespace
