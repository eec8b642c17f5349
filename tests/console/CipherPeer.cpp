// The host's side of the ciphers, for a test in another language. A request is a
// line of standard input: a command and its arguments in URL-safe base64, each
// behind a blank. The answer is a line: "ok" with the results, or "refused".
#include <iostream>
#include <string>
#include <vector>

#include "hosts/linux/cipher/Base64Url.h"
#include "hosts/linux/cipher/SealedLine.h"
#include "hosts/linux/cipher/TokenText.h"

extern "C" const TaloCipherModule taloCipherModule;

namespace {

using Words = std::vector<std::string>;

constexpr long long kNow = 1800000000;

bool KeyText(const Words& given, Words* results) {
    return given.size() == 1 && host::DeriveKeyText(taloCipherModule, given[0], &(*results)[0]);
}

// Key text, plain line.
bool Encipher(const Words& given, Words* results) {
    host::GcmNonce nonce;
    return given.size() == 2 && nonce.Randomize() &&
           host::EncipherText(taloCipherModule, given[0], nonce, given[1], &(*results)[0]);
}

// Key text, enciphered text.
bool Decipher(const Words& given, Words* results) {
    return given.size() == 2 &&
           host::DecipherText(taloCipherModule, given[0], given[1], &(*results)[0]);
}

// A secret's public half.
bool Public(const Words& given, Words* results) {
    host::Key secret;
    host::Key half;
    if (given.size() != 1 || !secret.Set(given[0]) ||
        taloCipherModule.publicHalf(secret.bytes, half.bytes) == 0) {
        return false;
    }
    (*results)[0] = half.Text();
    return true;
}

// The appliance's secret, a sealed text: its line and its time.
bool Open(const Words& given, Words* results) {
    host::KeyRing ring;
    host::LineContent content;
    if (given.size() != 2 || !ring.current.secret.Set(given[0]) ||
        taloCipherModule.publicHalf(ring.current.secret.bytes, ring.current.half.bytes) == 0 ||
        !host::OpenLine(taloCipherModule, ring, given[1], kNow, &content)) {
        return false;
    }
    *results = {content.line, std::to_string(content.time)};
    return true;
}

// The appliance's public half, a line, its time.
bool Seal(const Words& given, Words* results) {
    host::Key half;
    host::Key own;
    host::LineContent content;
    if (given.size() != 3 || !half.Set(given[0]) || !own.Randomize() ||
        !content.nonce.Randomize()) {
        return false;
    }
    content.line = given[1];
    content.time = std::stoll(given[2]);
    return host::SealLine(taloCipherModule, half, own, content, &(*results)[0]);
}

struct CommandRow {
    const char* name;
    bool (*run)(const Words& given, Words* results);
};

constexpr CommandRow kCommands[] = {
    {"key-text", KeyText}, {"encipher", Encipher}, {"decipher", Decipher},
    {"public", Public},    {"open", Open},         {"seal", Seal},
};

// Arguments that are empty are there all the same: a blank begins each.
bool Read(const std::string& line, std::string* command, Words* given) {
    size_t at = line.find(' ');
    *command = line.substr(0, at);
    while (at != std::string::npos) {
        const size_t end = line.find(' ', at + 1);
        const std::string word = line.substr(at + 1, end == std::string::npos ? end : end - at - 1);
        std::string bytes;
        if (!host::FromBase64Url(word.data(), word.size(), &bytes)) {
            return false;
        }
        given->push_back(bytes);
        at = end;
    }
    return true;
}

std::string Answer(const std::string& line) {
    std::string command;
    Words given;
    Words results(1);
    if (!Read(line, &command, &given)) {
        return "unreadable";
    }
    for (const CommandRow& row : kCommands) {
        if (command != row.name) {
            continue;
        }
        if (!row.run(given, &results)) {
            return "refused";
        }
        std::string answer = "ok";
        for (const std::string& result : results) {
            answer += " " + host::ToBase64Url(result);
        }
        return answer;
    }
    return "unknown command";
}

}  // namespace

int main() {
    for (std::string line; std::getline(std::cin, line);) {
        std::cout << Answer(line) << std::endl;
    }
    return 0;
}
