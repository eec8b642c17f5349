#include "hosts/linux/cgi/MultipartParser.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "Groups.h"
#include "Harness.h"

namespace bench {

namespace {

constexpr size_t kBodyBytes = 64u << 20;
constexpr size_t kBlock = 256u << 10;
const char kBoundary[] = "----FormBoundary7MA4YWxkTrZu0gW";

// What a file's receiver sees of the parser, and no disk.
struct Count : host::MultipartSink {
    Answer OnPartBegin(const host::PartHeaders&) override {
        return Answer::kGoOn;
    }
    Answer OnData(const char*, size_t size) override {
        bytes += size;
        return Answer::kGoOn;
    }
    Answer OnPartEnd() override {
        return Answer::kGoOn;
    }
    size_t bytes = 0;
};

std::string BodyOf(const std::string& content) {
    const std::string line = std::string("--") + kBoundary;
    return line + "\r\nContent-Disposition: form-data; name=\"f\"; filename=\"n\"\r\n\r\n" +
           content + "\r\n" + line + "--\r\n";
}

std::string Random() {
    std::string content(kBodyBytes, '\0');
    std::mt19937_64 random(1);
    for (size_t at = 0; at + sizeof(unsigned long long) <= content.size();
         at += sizeof(unsigned long long)) {
        const unsigned long long bytes = random();
        std::memcpy(&content[at], &bytes, sizeof bytes);
    }
    return content;
}

std::string Repeated(const std::string& unit) {
    std::string content;
    content.reserve(kBodyBytes + unit.size());
    while (content.size() < kBodyBytes) {
        content += unit;
    }
    return content;
}

// Over and over through one block, as a reader of standard input does.
void Parse(const std::string& body) {
    static std::vector<char> block(kBlock);
    Count sink;
    host::MultipartParser parser(kBoundary, host::MultipartLimits(), &sink);
    for (size_t at = 0; at < body.size(); at += kBlock) {
        const size_t size = std::min(kBlock, body.size() - at);
        std::memcpy(block.data(), body.data() + at, size);
        size_t used = 0;
        (void)parser.Feed(block.data(), size, &used);
    }
    if (parser.Finish() != host::MultipartParser::Result::kEnd || sink.bytes < kBodyBytes) {
        std::fprintf(stderr, "the body was not read\n");
        std::exit(1);
    }
}

void Copy(const std::string& body) {
    static std::vector<char> block(kBlock);
    for (size_t at = 0; at < body.size(); at += kBlock) {
        std::memcpy(block.data(), body.data() + at, std::min(kBlock, body.size() - at));
        // The copy is wanted.
        asm volatile("" : : "r"(block.data()) : "memory");
    }
}

}  // namespace

void Multipart() {
    const struct {
        const char* what;
        std::string body;
    } bodies[] = {
        {"random bytes", BodyOf(Random())},
        {"lines of text", BodyOf(Repeated(std::string(58, 'a') + "\r\n"))},
        {"CR LF pairs", BodyOf(Repeated("\r\n"))},
        {"the boundary and a letter", BodyOf(Repeated(std::string("\r\n--") + kBoundary + "x"))},
    };
    for (const auto& body : bodies) {
        Compare(std::string("A multipart body of 64 MiB, copied and parsed: ") + body.what,
                {{"copied into a block", [&] { Copy(body.body); }},
                 {"and parsed there", [&] { Parse(body.body); }}},
                11, 1);
    }
}

}  // namespace bench
