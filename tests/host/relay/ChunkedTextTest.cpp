#include "hosts/linux/relay/ChunkedText.h"

#include <gtest/gtest.h>

#include <string>

namespace {

// What comes out of a text that is read in pieces: "..." while more is to come,
// "!" where it is refused.
std::string Read(const std::string& text, size_t piece) {
    host::ChunkedText chunks;
    std::string content;
    for (size_t from = 0; from < text.size(); from += piece) {
        const std::string part = text.substr(from, piece);
        const char* at = part.data();
        const char* end = at + part.size();
        while (at < end && !chunks.IsWhole()) {
            const char* bytes = nullptr;
            size_t size = 0;
            if (!chunks.Next(&at, end, &bytes, &size)) {
                return "!";
            }
            content.append(bytes != nullptr ? bytes : "", size);
        }
    }
    return content + (chunks.IsWhole() ? "" : "...");
}

struct ChunkRow {
    const char* name;
    const char* text;
    const char* content;
};

class ChunkedText : public ::testing::TestWithParam<ChunkRow> {};

TEST_P(ChunkedText, IsReadInPiecesOfAnySize) {
    for (size_t piece = 1; piece < 40; ++piece) {
        EXPECT_EQ(Read(GetParam().text, piece), GetParam().content) << piece;
    }
}

const ChunkRow kRows[] = {
    {"Nothing", "", "..."},
    {"Empty", "0\r\n\r\n", ""},
    {"One", "3\r\nabc\r\n0\r\n\r\n", "abc"},
    {"Two", "3\r\nabc\r\n0A\r\n0123456789\r\n0\r\n\r\n", "abc0123456789"},
    {"Extensions", "1;x=\"y\"\r\na\r\n0;z\r\n\r\n", "a"},
    {"Trailers", "1\r\na\r\n0\r\nX: 1\r\nY: 2\r\n\r\n", "a"},
    {"TrailersWithoutEnd", "1\r\na\r\n0\r\nX: 1\r\n", "a..."},
    {"LineFeedsOnly", "1\na\n0\n\n", "a"},
    {"SeveralZeros", "000\r\n\r\n", ""},
    {"BehindTheEnd", "0\r\n\r\n5\r\nabc", ""},
    {"CutInTheContent", "5\r\nabc", "abc..."},
    {"CutBehindTheContent", "3\r\nabc", "abc..."},
    {"CutBeforeTheLastLine", "3\r\nabc\r\n0\r\n", "abc..."},
    {"LineEndsInTheContent", "4\r\n\r\n\r\n\r\n0\r\n\r\n", "\r\n\r\n"},
    {"NoSize", "\r\nabc", "!"},
    {"NoNumber", "x\r\nabc", "!"},
    {"Negative", "-1\r\na", "!"},
    {"TooLongANumber", "1000000000000000\r\na", "!"},
    {"MoreThanTheChunk", "1\r\nab\r\n0\r\n\r\n", "!"},
};

INSTANTIATE_TEST_SUITE_P(Rows, ChunkedText, ::testing::ValuesIn(kRows),
                         [](const auto& row) { return std::string(row.param.name); });

}  // namespace
