#include "Listing.h"

#include <json/json.h>
#include <time.h>

#include <algorithm>

namespace {

using Row = std::vector<std::string>;

std::string Joined(const std::vector<std::string>& texts) {
    std::string line;
    for (const std::string& text : texts) {
        line += line.empty() ? text : "," + text;
    }
    return line;
}

std::string Day(long long seconds) {
    const time_t when = seconds;
    struct tm parts = {};
    char text[32];
    if (seconds == 0 || gmtime_r(&when, &parts) == nullptr ||
        strftime(text, sizeof text, "%Y-%m-%d", &parts) == 0) {
        return seconds == 0 ? "never" : std::to_string(seconds);
    }
    return text;
}

std::string PrivilegesOf(const talo::Account& account) {
    std::string line;
    for (const auto& entry : account.privileges) {
        line += line.empty() ? "" : " ";
        line += entry.first;
        line += entry.second.empty() ? "" : "@" + Joined(entry.second);
    }
    return line;
}

std::string OrDash(const std::string& text) {
    return text.empty() ? "-" : text;
}

Row RowOf(const talo::Account& account) {
    return {account.name,
            std::to_string(account.uid),
            account.locked ? "locked" : "open",
            Day(account.passwordExpires),
            OrDash(Joined(account.groups)),
            OrDash(PrivilegesOf(account))};
}

Json::Value TextsOf(const std::vector<std::string>& texts) {
    Json::Value array(Json::arrayValue);
    for (const std::string& text : texts) {
        array.append(text);
    }
    return array;
}

}  // namespace

std::string ListingTable(const std::vector<talo::Account>& accounts) {
    std::vector<Row> rows = {{"NAME", "UID", "STATE", "EXPIRES", "GROUPS", "PRIVILEGES"}};
    for (const talo::Account& account : accounts) {
        rows.push_back(RowOf(account));
    }
    std::vector<size_t> widths(rows[0].size(), 0);
    for (const Row& row : rows) {
        for (size_t column = 0; column < row.size(); ++column) {
            widths[column] = std::max(widths[column], row[column].size());
        }
    }
    std::string table;
    for (const Row& row : rows) {
        for (size_t column = 0; column < row.size(); ++column) {
            const bool last = column + 1 == row.size();
            table += row[column];
            table += last ? "\n" : std::string(widths[column] + 2 - row[column].size(), ' ');
        }
    }
    return table;
}

std::string ListingJson(const std::vector<talo::Account>& accounts) {
    Json::Value list(Json::arrayValue);
    for (const talo::Account& account : accounts) {
        Json::Value entry(Json::objectValue);
        entry["name"] = account.name;
        entry["uid"] = account.uid;
        entry["locked"] = account.locked;
        entry["passwordExpires"] = Json::Int64(account.passwordExpires);
        entry["groups"] = TextsOf(account.groups);
        entry["privileges"] = Json::Value(Json::objectValue);
        for (const auto& privilege : account.privileges) {
            entry["privileges"][privilege.first] = TextsOf(privilege.second);
        }
        list.append(entry);
    }
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "  ";
    return Json::writeString(builder, list) + "\n";
}
