#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <string>

#include "src/base/JsonText.h"
#include "tests/support/Json.h"

namespace {

// Builds values of every kind at random. Numbers are made in the type in which
// the parser answers them, because the JSON library tells 5 from 5u.
class RandomValues {
  public:
    explicit RandomValues(unsigned seed) : random(seed) {}

    Json::Value Any(int depth) {
        switch (Below(depth > 0 ? 9 : 7)) {
            case 0:
                return Json::Value();
            case 1:
                return Json::Value(Below(2) == 0);
            case 2:
                return Json::Value(static_cast<Json::Int64>(random()));
            case 3:
                return Json::Value(static_cast<Json::UInt64>(random() | 1ull << 63));
            case 4:
                return Json::Value(Real());
            case 5:
                return Json::Value(static_cast<int>(Below(200)) - 100);
            case 6:
                return Json::Value(Text());
            case 7:
                return Array(depth);
            default:
                return Object(depth);
        }
    }

  private:
    unsigned long long Below(unsigned long long limit) {
        return random() % limit;
    }

    double Real() {
        for (;;) {
            const unsigned long long bits = random();
            double number = 0;
            std::memcpy(&number, &bits, sizeof number);
            if (std::isfinite(number)) {
                return number;
            }
        }
    }

    std::string Text() {
        static const std::string kPieces[] = {"a",
                                              "Z",
                                              " ",
                                              "/",
                                              "\"",
                                              "\\",
                                              "\n",
                                              "\t",
                                              std::string(1, '\0'),
                                              "\x1F",
                                              "<",
                                              ">",
                                              "&",
                                              "\x7F",
                                              "\xC3\xA9",
                                              "\xE2\x82\xAC",
                                              "\xE2\x80\xA8",
                                              "\xE2\x80\xA9",
                                              "\xF0\x9F\x98\x80",
                                              "\xEF\xBF\xBF"};
        std::string text;
        for (unsigned long long left = Below(12); left > 0; --left) {
            text += kPieces[Below(sizeof kPieces / sizeof kPieces[0])];
        }
        return text;
    }

    Json::Value Array(int depth) {
        Json::Value array(Json::arrayValue);
        for (unsigned long long left = Below(6); left > 0; --left) {
            array.append(Any(depth - 1));
        }
        return array;
    }

    Json::Value Object(int depth) {
        Json::Value object(Json::objectValue);
        for (unsigned long long left = Below(6); left > 0; --left) {
            object[Text()] = Any(depth - 1);
        }
        return object;
    }

    std::mt19937_64 random;
};

TEST(ToString, WritesWhatTheJsonLibraryReadsBackAsTheSameValue) {
    RandomValues values(7);
    for (int round = 0; round < 3000; ++round) {
        const Json::Value value = values.Any(6);
        const std::string json = TALO::toString(value);
        Json::Value read;
        ASSERT_NO_THROW(read = support::Parse(json)) << json;
        ASSERT_EQ(read, value) << json;
    }
}

TEST(ToString, WritesTheSameTextForWhatWasReadBack) {
    RandomValues values(8);
    for (int round = 0; round < 1000; ++round) {
        const std::string json = TALO::toString(values.Any(6));
        ASSERT_EQ(TALO::toString(support::Parse(json)), json);
    }
}

TEST(ToString, WritesOneLineWithoutBlanksBetweenTheParts) {
    Json::Value value;
    value["a"][0]["b"] = 1;
    value["a"][1] = 2.5;
    value["c"] = Json::Value();
    EXPECT_EQ(TALO::toString(value), R"({"a":[{"b":1},2.5],"c":null})");
}

TEST(ToString, WritesWhatIsNestedTo500Levels) {
    Json::Value value(1);
    for (int level = 0; level < 500; ++level) {
        Json::Value outer(Json::arrayValue);
        outer.append(value);
        value.swap(outer);
    }
    EXPECT_EQ(TALO::toString(value), std::string(500, '[') + "1" + std::string(500, ']'));
}

}  // namespace
