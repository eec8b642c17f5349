#include "webapi/APIBase.h"

#include <gtest/gtest.h>

#include "tests/support/Json.h"

using support::Parse;

namespace {

class Sections : public TALO::APIBase {
  public:
    Sections() {
        store["known"] = Json::Value(Json::objectValue);
        store["other"] = Json::Value(Json::objectValue);
        store["list"] = Json::Value(Json::arrayValue);
    }
    virtual ~Sections() {}

    const Json::Value& Everything() const {
        return store;
    }
    Json::Value Known() {
        return GetData("known", "", Json::Value("no such section"));
    }
};

class KeyedStore : public ::testing::Test {
  protected:
    Sections sections;
    const Json::Value untouched = sections.Everything();
};

TEST_F(KeyedStore, StartsAsAnEmptyObject) {
    class Bare : public TALO::APIBase {
      public:
        virtual ~Bare() {}
        const Json::Value& Everything() const {
            return store;
        }
    };
    EXPECT_EQ(Bare().Everything(), Json::Value(Json::objectValue));
}

TEST_F(KeyedStore, RefusesAKeyInASectionThatWasNeverCreated) {
    EXPECT_FALSE(sections.SetData("unknown", "key", 1, false));
    EXPECT_FALSE(sections.HasData("unknown", "key"));
    EXPECT_EQ(sections.GetData("unknown", "", Json::Value("none")), Json::Value("none"));
    EXPECT_EQ(sections.Everything(), untouched);
}

TEST_F(KeyedStore, RefusesAnEmptyKeyOrSection) {
    EXPECT_FALSE(sections.SetData("known", "", "text", false));
    EXPECT_FALSE(sections.SetData("", "key", "text", false));
    EXPECT_EQ(sections.Everything(), untouched);
}

TEST_F(KeyedStore, StoresEveryJsonTypeUnderAKey) {
    const Json::Value values = Parse(R"([null, true, -1, 1.5, "text", [1], {"a": 1}, [], {}])");
    for (const Json::Value& value : values) {
        EXPECT_TRUE(sections.SetData("known", "key", value, false));
        EXPECT_EQ(sections.GetData("known", "key", Json::Value("none")), value);
    }
    EXPECT_EQ(sections.Known().size(), 1u);
    EXPECT_TRUE(sections.GetData("other", "", Json::Value()).empty());
}

TEST_F(KeyedStore, StoresOnlyATextUnderAKeyWhenAskedTo) {
    for (const Json::Value& value : Parse(R"([null, true, 1, 1.5, ["text"], {"a": "text"}])")) {
        EXPECT_FALSE(sections.SetData("known", "key", value, true));
        EXPECT_FALSE(sections.HasData("known", "key"));
    }
    EXPECT_TRUE(sections.SetData("known", "key", "", true));
    EXPECT_EQ(sections.GetData("known", "key", Json::Value()), Json::Value(""));
}

TEST_F(KeyedStore, KeepsTheEarlierValueWhenANewOneIsRefused) {
    ASSERT_TRUE(sections.SetData("known", "key", "text", true));
    EXPECT_FALSE(sections.SetData("known", "key", 5, true));
    EXPECT_EQ(sections.GetData("known", "key", Json::Value()), Json::Value("text"));
}

TEST_F(KeyedStore, MergesMembersOfEveryType) {
    ASSERT_TRUE(sections.SetData("known", Parse(R"({"a": 1, "b": "old"})"), false));
    EXPECT_TRUE(sections.SetData("known", Parse(R"({"b": [2], "c": null})"), false));
    EXPECT_EQ(sections.Known(), Parse(R"({"a": 1, "b": [2], "c": null})"));
}

TEST_F(KeyedStore, MergesOnlyTextsWhenAskedTo) {
    EXPECT_TRUE(sections.SetData("known", Parse(R"({"n": 7, "s": "text"})"), true));
    EXPECT_EQ(sections.Known(), Parse(R"({"s": "text"})"));
}

TEST_F(KeyedStore, SkipsAMemberThatIsNoTextWithoutReplacingTheEarlierOne) {
    ASSERT_TRUE(sections.SetData("known", "n", "kept", true));
    EXPECT_TRUE(sections.SetData("known", Parse(R"({"n": 7})"), true));
    EXPECT_EQ(sections.Known(), Parse(R"({"n": "kept"})"));
}

TEST_F(KeyedStore, SucceedsWhenEveryMergedMemberWasSkipped) {
    EXPECT_TRUE(sections.SetData("known", Parse(R"({"n": 7, "l": []})"), true));
    EXPECT_EQ(sections.Everything(), untouched);
}

TEST_F(KeyedStore, RefusesToMergeAnythingButAFilledObject) {
    for (const Json::Value& members : Parse(R"([{}, [], ["text"], "text", 1, 1.5, true, null])")) {
        EXPECT_FALSE(sections.SetData("known", members, false)) << members;
        EXPECT_FALSE(sections.SetData("known", members, true)) << members;
    }
    EXPECT_EQ(sections.Everything(), untouched);
}

TEST_F(KeyedStore, RefusesToMergeIntoASectionThatWasNeverCreated) {
    EXPECT_FALSE(sections.SetData("unknown", Parse(R"({"a": 1})"), false));
    EXPECT_EQ(sections.Everything(), untouched);
}

TEST_F(KeyedStore, KeepsNamesWithAZeroByteApart) {
    const std::string zero("a\0b", 3);
    Json::Value members(Json::objectValue);
    members[zero] = "long";
    members["a"] = "short";
    ASSERT_TRUE(sections.SetData("known", members, true));
    EXPECT_EQ(sections.GetData("known", zero, Json::Value()), Json::Value("long"));
    EXPECT_EQ(sections.GetData("known", "a", Json::Value()), Json::Value("short"));
    EXPECT_TRUE(sections.ClearData("known", zero));
    EXPECT_FALSE(sections.HasData("known", zero));
    EXPECT_TRUE(sections.HasData("known", "a"));
}

TEST_F(KeyedStore, AnswersAKeyTheWholeSectionOrTheFallback) {
    const Json::Value fallback("none");
    ASSERT_TRUE(sections.SetData("known", "key", 5, false));
    EXPECT_EQ(sections.GetData("known", "key", fallback), Json::Value(5));
    EXPECT_EQ(sections.GetData("known", "", fallback), Parse(R"({"key": 5})"));
    EXPECT_EQ(&sections.GetData("known", "missing", fallback), &fallback);
    EXPECT_EQ(&sections.GetData("unknown", "key", fallback), &fallback);
    EXPECT_EQ(&sections.GetData("unknown", "", fallback), &fallback);
    EXPECT_EQ(&sections.GetData("", "", fallback), &fallback);
    EXPECT_EQ(&sections.GetData("known", "key", fallback), &sections.Everything()["known"]["key"]);
}

TEST_F(KeyedStore, CountsAStoredNullAsPresent) {
    ASSERT_TRUE(sections.SetData("known", "key", Json::Value(), false));
    EXPECT_TRUE(sections.HasData("known", "key"));
    EXPECT_EQ(sections.GetData("known", "key", Json::Value("none")), Json::Value());
}

TEST_F(KeyedStore, NeverCountsAnEmptyKeyAsPresent) {
    ASSERT_TRUE(sections.SetData("known", Parse(R"({"": "nameless", "key": 1})"), false));
    EXPECT_FALSE(sections.HasData("known", ""));
    EXPECT_TRUE(sections.HasData("known", "key"));
    EXPECT_FALSE(sections.HasData("known", "missing"));
    EXPECT_FALSE(sections.HasData("", "key"));
    EXPECT_FALSE(sections.HasData("other", "key"));
}

TEST_F(KeyedStore, RemovesOneKey) {
    ASSERT_TRUE(sections.SetData("known", Parse(R"({"a": 1, "b": 2})"), false));
    EXPECT_TRUE(sections.ClearData("known", "a"));
    EXPECT_EQ(sections.Known(), Parse(R"({"b": 2})"));
    EXPECT_FALSE(sections.ClearData("known", "a"));
    EXPECT_EQ(sections.Known(), Parse(R"({"b": 2})"));
}

TEST_F(KeyedStore, EmptiesASectionThatCanBeWrittenAgain) {
    ASSERT_TRUE(sections.SetData("known", Parse(R"({"a": 1, "b": 2})"), false));
    EXPECT_TRUE(sections.ClearData("known", ""));
    EXPECT_EQ(sections.Everything(), untouched);
    EXPECT_FALSE(sections.HasData("known", "a"));
    EXPECT_TRUE(sections.ClearData("known", ""));
    EXPECT_TRUE(sections.SetData("known", "a", 3, false));
    EXPECT_EQ(sections.Known(), Parse(R"({"a": 3})"));
}

TEST_F(KeyedStore, RefusesToClearWhatIsNotThere) {
    ASSERT_TRUE(sections.SetData("known", "key", 1, false));
    const Json::Value before = sections.Everything();
    EXPECT_FALSE(sections.ClearData("", ""));
    EXPECT_FALSE(sections.ClearData("", "key"));
    EXPECT_FALSE(sections.ClearData("unknown", ""));
    EXPECT_FALSE(sections.ClearData("unknown", "key"));
    EXPECT_FALSE(sections.ClearData("known", "missing"));
    EXPECT_EQ(sections.Everything(), before);
}

TEST_F(KeyedStore, NeverClearsASectionWithoutAName) {
    class Nameless : public TALO::APIBase {
      public:
        Nameless() {
            store[""]["key"] = 1;
        }
        virtual ~Nameless() {}
    };
    Nameless nameless;
    EXPECT_FALSE(nameless.ClearData("", ""));
    EXPECT_FALSE(nameless.ClearData("", "key"));
    EXPECT_TRUE(nameless.HasData("", "key"));
}

TEST_F(KeyedStore, AnswersTheFallbackForKeysOfASectionThatIsAnArray) {
    const Json::Value fallback("none");
    EXPECT_FALSE(sections.HasData("list", "key"));
    EXPECT_EQ(&sections.GetData("list", "key", fallback), &fallback);
    EXPECT_FALSE(sections.SetData("list", "key", "text", false));
    EXPECT_FALSE(sections.SetData("list", Parse(R"({"a": 1})"), false));
    EXPECT_FALSE(sections.ClearData("list", "key"));
    EXPECT_EQ(sections.Everything(), untouched);
    EXPECT_EQ(sections.GetData("list", "", fallback), Json::Value(Json::arrayValue));
    EXPECT_TRUE(sections.ClearData("list", ""));
}

TEST_F(KeyedStore, MergesAPartOfItselfThatTheMergeReplaces) {
    ASSERT_TRUE(sections.SetData("known", Parse(R"({"a": {"a": 1, "b": 2, "c": 3}})"), false));
    EXPECT_TRUE(sections.SetData("known", sections.GetData("known", "a", Json::Value()), false));
    EXPECT_EQ(sections.Known(), Parse(R"({"a": 1, "b": 2, "c": 3})"));
}

TEST_F(KeyedStore, SetsAKeyToAPartOfItself) {
    ASSERT_TRUE(sections.SetData("known", Parse(R"({"a": {"b": {"c": 3}}})"), false));
    const Json::Value& part = sections.GetData("known", "a", Json::Value())["b"];
    EXPECT_TRUE(sections.SetData("known", "a", part, false));
    EXPECT_EQ(sections.Known(), Parse(R"({"a": {"c": 3}})"));
}

TEST_F(KeyedStore, TakesMembersAsItSetsThem) {
    ASSERT_TRUE(sections.SetData("known", Parse(R"({"a": 1, "b": 2})"), false));
    Json::Value members = Parse(R"({"b": "new", "c": [3]})");
    EXPECT_TRUE(sections.TakeData("known", &members, false));
    EXPECT_EQ(sections.Known(), Parse(R"({"a": 1, "b": "new", "c": [3]})"));
    members = Parse(R"({"c": 4, "d": "text"})");
    EXPECT_TRUE(sections.TakeData("known", &members, true));
    EXPECT_EQ(sections.Known(), Parse(R"({"a": 1, "b": "new", "c": [3], "d": "text"})"));
}

TEST_F(KeyedStore, TakesWithoutACopy) {
    Json::Value members(Json::objectValue);
    members["a"] = std::string(1000, 'a');
    const char* const text = members["a"].asCString();
    ASSERT_TRUE(sections.TakeData("known", &members, true));
    EXPECT_EQ(sections.GetData("known", "a", Json::Value()).asCString(), text);
}

TEST_F(KeyedStore, TakesNothingThatItWouldNotSet) {
    for (const char* text : {"{}", "[1]", "null", "\"text\""}) {
        Json::Value members = Parse(text);
        EXPECT_FALSE(sections.TakeData("known", &members, false)) << text;
    }
    for (const char* section : {"unknown", "list", ""}) {
        Json::Value members = Parse(R"({"a": 1})");
        EXPECT_FALSE(sections.TakeData(section, &members, false)) << section;
        EXPECT_EQ(members, Parse(R"({"a": 1})"));
    }
    EXPECT_EQ(sections.Everything(), untouched);
}

}  // namespace
