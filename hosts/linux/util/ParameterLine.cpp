#include "hosts/linux/util/ParameterLine.h"

#include <algorithm>

#include "hosts/linux/util/JsonGrammar.h"
#include "hosts/linux/util/Percent.h"
#include "platform/WebAPIUtil.h"

namespace host {

namespace {

constexpr size_t kMaxDepth = TALO::WebAPIUtil::kMaxJsonDepth;
constexpr size_t kMaxPairs = TALO::WebAPIUtil::kMaxPairs;
constexpr char kBlanks[] = " \t";

std::string Trimmed(const std::string& text) {
    const size_t first = text.find_first_not_of(kBlanks);
    return first == std::string::npos
               ? std::string()
               : text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}

bool ParseText(const std::string& text, Json::Value* out, size_t* budget) {
    JsonError error;
    return ParseJson(text.data(), text.data() + text.size(), kMaxDepth, out, &error, budget);
}

// A line that is one JSON object: its members. `merged` says whether it was.
bool MergeObject(const std::string& line, Json::Value& out, bool* merged) {
    Json::Value object;
    const size_t first = line.find_first_not_of(" \t\r\n");
    size_t budget = kMaxJsonValues;
    *merged = first != std::string::npos && line[first] == '{' && ParseText(line, &object, &budget);
    if (!*merged) {
        return true;
    }
    if (object.size() > kMaxPairs) {
        return false;
    }
    for (auto member = object.begin(); member != object.end(); ++member) {
        out[member.name()].swap(*member);
    }
    return true;
}

// `budget` bounds the JSON values of the whole line: ten thousand pairs of a
// thousand values each would cost as much memory as one pair of ten million.
void MergePair(const std::string& piece, Json::Value& out, bool decode, bool parseJson,
               size_t* budget) {
    const size_t equals = piece.find('=');
    std::string name = piece.substr(0, equals);
    std::string value = equals == std::string::npos ? std::string() : piece.substr(equals + 1);
    if (decode) {
        name = PercentDecode(name, true);
        value = PercentDecode(value, true);
    }
    if (name.empty()) {
        return;
    }
    Json::Value parsed;
    if (parseJson && ParseText(value, &parsed, budget)) {
        out[name].swap(parsed);
    } else {
        out[name] = value;
    }
}

}  // namespace

Json::Value SplitTrimmed(const std::string& text, const std::string& separator) {
    Json::Value pieces(Json::arrayValue);
    size_t start = 0;
    size_t end = separator.empty() ? std::string::npos : text.find(separator);
    while (end != std::string::npos) {
        pieces.append(Trimmed(text.substr(start, end - start)));
        start = end + separator.size();
        end = text.find(separator, start);
    }
    pieces.append(Trimmed(text.substr(start)));
    return pieces;
}

bool MergeParameterLine(const std::string& line, Json::Value& out, bool decode, bool parseJson) {
    if (out.isNull()) {
        out = Json::Value(Json::objectValue);
    }
    if (!out.isObject()) {
        return false;
    }
    if (parseJson) {
        bool merged = false;
        const bool withinLimit = MergeObject(line, out, &merged);
        if (merged) {
            return withinLimit;
        }
    }
    size_t pairs = 0;
    size_t budget = kMaxJsonValues;
    for (size_t start = 0; start < line.size();) {
        const size_t end = std::min(line.find('&', start), line.size());
        if (end > start) {
            if (++pairs > kMaxPairs) {
                return false;
            }
            MergePair(line.substr(start, end - start), out, decode, parseJson, &budget);
        }
        start = end + 1;
    }
    return true;
}

}  // namespace host
