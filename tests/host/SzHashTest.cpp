#include "hosts/linux/util/SzHash.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "platform/System.h"
#include "platform/WebAPIUtil.h"

namespace {

class SzHash : public ::testing::Test {
  protected:
    ~SzHash() override {
        TLIBCSzHashFree(hash);
    }
    std::string Walk() const {
        std::string all;
        size_t position = 0;
        const char* key = nullptr;
        const char* value = nullptr;
        while (TLIBCSzHashNext(hash, &position, &key, &value) != 0) {
            all += std::string(key) + "=" + value + ";";
        }
        return all;
    }
    TALOSZHASH* const hash = TLIBCSzHashAlloc(256);
};

TEST_F(SzHash, IsWalkedInTheOrderInWhichNamesCame) {
    EXPECT_EQ(Walk(), "");
    EXPECT_TRUE(host::HashSet(hash, "b", "1"));
    EXPECT_TRUE(host::HashSet(hash, "a", "2"));
    EXPECT_TRUE(host::HashSet(hash, "", "3"));
    EXPECT_TRUE(host::HashSet(hash, "b", "4"));
    EXPECT_EQ(Walk(), "b=4;a=2;=3;");
    ASSERT_NE(host::HashGet(hash, "a"), nullptr);
    EXPECT_EQ(*host::HashGet(hash, "a"), "2");
    EXPECT_EQ(host::HashGet(hash, "c"), nullptr);
    TLIBCHashRemoveAll(hash);
    EXPECT_EQ(Walk(), "");
    EXPECT_EQ(host::HashGet(hash, "a"), nullptr);
    EXPECT_TRUE(host::HashSet(hash, "a", "5"));
    EXPECT_EQ(Walk(), "a=5;");
}

TEST_F(SzHash, TakesNoTextThatWouldComeOutCut) {
    EXPECT_FALSE(host::HashSet(hash, std::string("a\0b", 3), "x"));
    EXPECT_FALSE(host::HashSet(hash, "a", std::string("x\0y", 3)));
    EXPECT_EQ(Walk(), "");
}

TEST_F(SzHash, HoldsSoManyEntriesAndNoMore) {
    for (size_t entry = 0; entry < host::kMaxHashEntries; ++entry) {
        ASSERT_TRUE(host::HashSet(hash, std::to_string(entry), "x"));
    }
    EXPECT_FALSE(host::HashSet(hash, "more", "x"));
    EXPECT_TRUE(host::HashSet(hash, "0", "replaced"));
    EXPECT_EQ(*host::HashGet(hash, "0"), "replaced");
}

TEST_F(SzHash, BecomesMembersOfADocument) {
    Json::Value document;
    EXPECT_TRUE(TALO::WebAPIUtil::SzHashToJsonObj(hash, document));
    EXPECT_TRUE(document.isObject() && document.empty());
    document["a"] = 1;
    document["kept"] = true;
    EXPECT_TRUE(host::HashSet(hash, "a", "[1]"));
    EXPECT_TRUE(host::HashSet(hash, "b", ""));
    EXPECT_TRUE(TALO::WebAPIUtil::SzHashToJsonObj(hash, document));
    EXPECT_EQ(document["a"], "[1]");
    EXPECT_EQ(document["b"], "");
    EXPECT_EQ(document["kept"], true);
    EXPECT_EQ(document.size(), 3u);

    Json::Value list(Json::arrayValue);
    EXPECT_FALSE(TALO::WebAPIUtil::SzHashToJsonObj(hash, list));
    EXPECT_TRUE(list.isArray() && list.empty());
    EXPECT_FALSE(TALO::WebAPIUtil::SzHashToJsonObj(nullptr, document));
}

TEST(SzHashBounds, AreSafeAtTheirEnds) {
    for (const int capacity : {-1, 0, 1, 2147483647}) {
        TALOSZHASH* hash = TLIBCSzHashAlloc(capacity);
        EXPECT_NE(hash, nullptr) << capacity;
        size_t position = 99;
        const char* text = nullptr;
        EXPECT_EQ(TLIBCSzHashNext(hash, &position, &text, &text), 0);
        EXPECT_EQ(TLIBCSzHashNext(hash, nullptr, &text, &text), 0);
        TLIBCSzHashFree(hash);
    }
    size_t position = 0;
    EXPECT_EQ(TLIBCSzHashNext(nullptr, &position, nullptr, nullptr), 0);
    EXPECT_FALSE(host::HashSet(nullptr, "a", "b"));
    TLIBCHashRemoveAll(nullptr);
    TLIBCSzHashFree(nullptr);
}

}  // namespace
