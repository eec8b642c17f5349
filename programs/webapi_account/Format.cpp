#include "Format.h"

#include <algorithm>

std::string TextTable(const std::vector<TextRow>& rows) {
    std::vector<size_t> widths(rows[0].size(), 0);
    for (const TextRow& row : rows) {
        for (size_t column = 0; column < row.size(); ++column) {
            widths[column] = std::max(widths[column], row[column].size());
        }
    }
    std::string table;
    for (const TextRow& row : rows) {
        for (size_t column = 0; column < row.size(); ++column) {
            const bool last = column + 1 == row.size();
            table += row[column];
            table += last ? "\n" : std::string(widths[column] + 2 - row[column].size(), ' ');
        }
    }
    return table;
}

std::string Joined(const std::vector<std::string>& texts) {
    std::string line;
    for (const std::string& text : texts) {
        line += line.empty() ? text : "," + text;
    }
    return line;
}

std::string OrDash(const std::string& text) {
    return text.empty() ? "-" : text;
}

Json::Value JsonTexts(const std::vector<std::string>& texts) {
    Json::Value array(Json::arrayValue);
    for (const std::string& text : texts) {
        array.append(text);
    }
    return array;
}

std::string JsonLines(const Json::Value& value) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "  ";
    return Json::writeString(builder, value) + "\n";
}
