#ifndef PROGRAMS_WEBAPI_ACCOUNT_FORMAT_H
#define PROGRAMS_WEBAPI_ACCOUNT_FORMAT_H

#include <json/json.h>

#include <string>
#include <vector>

// What the lists are made of, for people and for programs.
using TextRow = std::vector<std::string>;

// Rows of equally many texts as lines with their columns below each other.
std::string TextTable(const std::vector<TextRow>& rows);

// Texts with commas between them.
std::string Joined(const std::vector<std::string>& texts);
std::string OrDash(const std::string& text);

Json::Value JsonTexts(const std::vector<std::string>& texts);
std::string JsonLines(const Json::Value& value);

#endif
