#include "Listing.h"

#include <time.h>

#include "Format.h"

namespace {

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

TextRow RowOf(const talo::Account& account) {
    return {account.name,
            std::to_string(account.uid),
            account.locked ? "locked" : "open",
            Day(account.passwordExpires),
            OrDash(Joined(account.groups)),
            OrDash(PrivilegesOf(account))};
}

}  // namespace

std::string ListingTable(const std::vector<talo::Account>& accounts) {
    std::vector<TextRow> rows = {{"NAME", "UID", "STATE", "EXPIRES", "GROUPS", "PRIVILEGES"}};
    for (const talo::Account& account : accounts) {
        rows.push_back(RowOf(account));
    }
    return TextTable(rows);
}

std::string ListingJson(const std::vector<talo::Account>& accounts) {
    Json::Value list(Json::arrayValue);
    for (const talo::Account& account : accounts) {
        Json::Value entry(Json::objectValue);
        entry["name"] = account.name;
        entry["uid"] = account.uid;
        entry["locked"] = account.locked;
        entry["passwordExpires"] = Json::Int64(account.passwordExpires);
        entry["groups"] = JsonTexts(account.groups);
        entry["privileges"] = Json::Value(Json::objectValue);
        for (const auto& privilege : account.privileges) {
            entry["privileges"][privilege.first] = JsonTexts(privilege.second);
        }
        list.append(entry);
    }
    return JsonLines(list);
}
