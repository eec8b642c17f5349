#include "hosts/linux/account/AccountFile.h"

#include <string.h>

#include <algorithm>
#include <limits>
#include <set>

#include "hosts/linux/util/HostLog.h"
#include "hosts/linux/util/LineFile.h"
#include "hosts/linux/util/LineObject.h"
#include "hosts/linux/util/TrustedFile.h"

namespace host {

namespace {

constexpr char kSource[] = "AccountFile.cpp";
constexpr unsigned kLastUid = std::numeric_limits<int>::max();

bool Refuse(std::string* problem, const std::string& text) {
    *problem = text;
    return false;
}

bool Understand(const std::string& path, const std::string& content, size_t number, size_t start,
                size_t end, StoredAccount* stored, Json::Value* members = nullptr) {
    std::string reason;
    if (ParseAccountLine(content.data() + start, content.data() + end, stored, members, &reason)) {
        return true;
    }
    HOST_LOG("%s: line %zu is skipped: %s", path.c_str(), number, reason.c_str());
    return false;
}

// Spares the parsing of all the other accounts: a line that has the name has it
// in quotes, or has an escape that may stand for a part of it.
bool MayName(const std::string& content, size_t start, size_t end, const std::string& quoted) {
    const char* begin = content.data() + start;
    return memmem(begin, end - start, quoted.data(), quoted.size()) != nullptr ||
           memchr(begin, '\\', end - start) != nullptr;
}

// All lines of one account: the first counts, but all go when it goes.
std::vector<LinePlace> PlacesOf(const std::string& path, const std::string& content,
                                const std::string& name) {
    std::vector<LinePlace> places;
    ForEachLine(content, [&](size_t number, size_t start, size_t end) {
        StoredAccount read;
        if (MayName(content, start, end, '"' + name + '"') &&
            Understand(path, content, number, start, end, &read) && read.account.name == name) {
            places.push_back({start, end});
        }
        return true;
    });
    return places;
}

// The one behind the highest: a removed account's files must not fall to the
// next one as long as there are other numbers.
bool NextUid(const std::string& path, const std::string& content, unsigned* uid) {
    std::set<unsigned> taken;
    ForEachLine(content, [&](size_t number, size_t start, size_t end) {
        StoredAccount read;
        if (Understand(path, content, number, start, end, &read)) {
            taken.insert(read.account.uid);
        }
        return true;
    });
    if (taken.empty() || *taken.rbegin() < kLastUid) {
        *uid = taken.empty() ? kFirstUid : std::max(*taken.rbegin() + 1, kFirstUid);
        return true;
    }
    unsigned candidate = kFirstUid;
    while (candidate < kLastUid && taken.count(candidate) != 0) {
        ++candidate;
    }
    *uid = candidate;
    return candidate < kLastUid;
}

bool Edit(const std::string& path, const ContentChange& change, std::string* problem) {
    return ChangeLineFile({path.c_str(), "file of accounts", kMaxAccountsBytes, ReadTrustedFile},
                          change, problem);
}

}  // namespace

Lookup FindInFile(const std::string& path, const std::string& name, StoredAccount* stored) {
    std::string content;
    if (!ReadTrustedFile(path, kMaxAccountsBytes, &content)) {
        return Lookup::kUnavailable;
    }
    Lookup result = Lookup::kAbsent;
    const std::string quoted = '"' + name + '"';
    ForEachLine(content, [&](size_t number, size_t start, size_t end) {
        StoredAccount read;
        if (MayName(content, start, end, quoted) &&
            Understand(path, content, number, start, end, &read) && read.account.name == name) {
            *stored = std::move(read);
            result = Lookup::kFound;
        }
        return result == Lookup::kAbsent;
    });
    return result;
}

bool ListFile(const std::string& path, std::vector<talo::Account>* accounts) {
    std::string content;
    if (!ReadTrustedFile(path, kMaxAccountsBytes, &content)) {
        return false;
    }
    std::map<std::string, talo::Account> byName;
    ForEachLine(content, [&](size_t number, size_t start, size_t end) {
        StoredAccount read;
        if (Understand(path, content, number, start, end, &read) &&
            !byName.emplace(read.account.name, read.account).second) {
            HOST_LOG("%s: line %zu is skipped: its name has an earlier line", path.c_str(), number);
        }
        return true;
    });
    std::vector<talo::Account> listed;
    listed.reserve(byName.size());
    for (auto& entry : byName) {
        listed.push_back(std::move(entry.second));
    }
    accounts->swap(listed);
    return true;
}

bool AppendToFile(const std::string& path, const std::string& name, const std::string& hash,
                  std::string* problem) {
    return Edit(
        path,
        [&](std::string* content, std::string* why) {
            if (!PlacesOf(path, *content, name).empty()) {
                return Refuse(why, "the account \"" + name + "\" exists");
            }
            unsigned uid = 0;
            if (!NextUid(path, *content, &uid)) {
                return Refuse(why, "no uid is free");
            }
            Json::Value members(Json::objectValue);
            members[kNameMember] = name;
            members[kUidMember] = uid;
            members[kHashMember] = hash;
            AppendLine(content, RenderLineObject(members));
            return true;
        },
        problem);
}

bool RemoveFromFile(const std::string& path, const std::string& name, std::string* problem) {
    return Edit(
        path,
        [&](std::string* content, std::string* why) {
            const std::vector<LinePlace> places = PlacesOf(path, *content, name);
            if (places.empty()) {
                return Refuse(why, "there is no account \"" + name + "\"");
            }
            for (auto place = places.rbegin(); place != places.rend(); ++place) {
                EraseLine(content, *place);
            }
            return true;
        },
        problem);
}

bool ChangeInFile(const std::string& path, const std::string& name, const MemberChange& change,
                  std::string* problem) {
    return Edit(
        path,
        [&](std::string* content, std::string* why) {
            const std::vector<LinePlace> places = PlacesOf(path, *content, name);
            if (places.empty()) {
                return Refuse(why, "there is no account \"" + name + "\"");
            }
            const LinePlace place = places.front();
            StoredAccount read;
            Json::Value members;
            std::string reason;
            if (!ParseAccountLine(content->data() + place.start, content->data() + place.end, &read,
                                  &members, &reason) ||
                !change(&members, why)) {
                return false;
            }
            // What would be skipped afterwards must not be written.
            const std::string line = RenderLineObject(members);
            if (!ParseAccountLine(line.data(), line.data() + line.size(), &read, nullptr,
                                  &reason)) {
                return Refuse(why, reason);
            }
            content->replace(place.start, place.end - place.start, line);
            return true;
        },
        problem);
}

}  // namespace host
