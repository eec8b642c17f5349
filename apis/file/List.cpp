#include <algorithm>
#include <vector>

#include "Entry.h"
#include "File.h"
#include "Parameters.h"
#include "Target.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

constexpr long long kDefaultLimit = 1000;
constexpr long long kMaxLimit = 10000;

typedef bool (*Before)(const talo::NamedFacts&, const talo::NamedFacts&);

// Entries that are equal otherwise stand in the order of their names.
bool ByName(const talo::NamedFacts& left, const talo::NamedFacts& right) {
    return left.name < right.name;
}

bool BySize(const talo::NamedFacts& left, const talo::NamedFacts& right) {
    return left.facts.size != right.facts.size ? left.facts.size < right.facts.size
                                               : ByName(left, right);
}

bool ByTime(const talo::NamedFacts& left, const talo::NamedFacts& right) {
    return left.facts.mtime != right.facts.mtime ? left.facts.mtime < right.facts.mtime
                                                 : ByName(left, right);
}

// Folders first.
int RankOf(talo::FileType type) {
    switch (type) {
        case talo::FileType::kFolder:
            return 0;
        case talo::FileType::kFile:
            return 1;
        case talo::FileType::kLink:
            return 2;
        default:
            return 3;
    }
}

bool ByType(const talo::NamedFacts& left, const talo::NamedFacts& right) {
    const int leftRank = RankOf(left.facts.type);
    const int rightRank = RankOf(right.facts.type);
    return leftRank != rightRank ? leftRank < rightRank : ByName(left, right);
}

struct SortRow {
    const char* name;
    bool needsFacts;
    Before before;
};

constexpr SortRow kSorts[] = {
    {"name", false, ByName},
    {"size", true, BySize},
    {"mtime", true, ByTime},
    {"type", true, ByType},
};

struct Order {
    const SortRow* sort = kSorts;
    bool descending = false;
    long long offset = 0;
    long long limit = kDefaultLimit;
};

bool ReadSort(const APIRequest& request, Order* order) {
    const auto sort = request.GetAndCheckString("sort", APIRequest::OPTIONAL, nullptr);
    const std::string wanted = sort.IsInvalid() ? std::string() : sort.Get(kSorts->name);
    for (const SortRow& row : kSorts) {
        if (wanted == row.name) {
            order->sort = &row;
            return true;
        }
    }
    return false;
}

bool ReadDirection(const APIRequest& request, Order* order) {
    const auto direction = request.GetAndCheckString("direction", APIRequest::OPTIONAL, nullptr);
    const std::string wanted = direction.IsInvalid() ? std::string() : direction.Get("asc");
    order->descending = wanted == "desc";
    return order->descending || wanted == "asc";
}

// Names the parameter that is wrong; null for none.
const char* ReadOrder(const APIRequest& request, Order* order) {
    if (!ReadSort(request, order)) {
        return "sort";
    }
    if (!ReadDirection(request, order)) {
        return "direction";
    }
    if (!ReadNumber(request, "offset", 0, static_cast<long long>(talo::kMaxFolderNames),
                    &order->offset)) {
        return "offset";
    }
    return ReadNumber(request, "limit", 1, kMaxLimit, &order->limit) ? nullptr : "limit";
}

void Sort(const Order& order, std::vector<talo::NamedFacts>* entries) {
    const Before before = order.sort->before;
    if (order.descending) {
        std::sort(entries->begin(), entries->end(),
                  [before](const auto& left, const auto& right) { return before(right, left); });
    } else {
        std::sort(entries->begin(), entries->end(), before);
    }
}

template <typename Item>
void KeepPage(const Order& order, std::vector<Item>* items) {
    const size_t first = std::min(static_cast<size_t>(order.offset), items->size());
    const size_t count = std::min(static_cast<size_t>(order.limit), items->size() - first);
    items->erase(items->begin(), items->begin() + static_cast<std::ptrdiff_t>(first));
    items->erase(items->begin() + static_cast<std::ptrdiff_t>(count), items->end());
}

Json::Value PageOf(const Order& order, size_t total, const std::vector<talo::NamedFacts>& entries) {
    Json::Value data(Json::objectValue);
    data["total"] = static_cast<Json::UInt64>(total);
    data["offset"] = static_cast<Json::Int64>(order.offset);
    Json::Value& list = data["entries"] = Json::Value(Json::arrayValue);
    for (const talo::NamedFacts& entry : entries) {
        list.append(EntryOf(entry.name, entry.facts));
    }
    return data;
}

// JSON carries no other names: they are counted.
size_t TakeOutUndecodable(std::vector<std::string>* names) {
    const size_t before = names->size();
    names->erase(std::remove_if(names->begin(), names->end(),
                                [](const std::string& name) { return !talo::IsComponent(name); }),
                 names->end());
    return before - names->size();
}

// By name only the page's entries are looked at.
talo::FileError ReadPage(const talo::Place& folder, const Order& order,
                         std::vector<std::string>* names, std::vector<talo::NamedFacts>* entries) {
    if (!order.sort->needsFacts) {
        std::sort(names->begin(), names->end());
        if (order.descending) {
            std::reverse(names->begin(), names->end());
        }
        KeepPage(order, names);
        return folder.StatAll(*names, entries);
    }
    const talo::FileError result = folder.StatAll(*names, entries);
    if (result == talo::FileError::kNone) {
        Sort(order, entries);
        KeepPage(order, entries);
    }
    return result;
}

void ListFolder(const Target& target, const Order& order, APIResponse* response) {
    std::vector<std::string> names;
    if (AnswerError(response, target.place.List(&names), target.path)) {
        return;
    }
    const size_t undecodable = TakeOutUndecodable(&names);
    const size_t total = names.size();
    std::vector<talo::NamedFacts> entries;
    if (AnswerError(response, ReadPage(target.place, order, &names, &entries), target.path)) {
        return;
    }
    Json::Value data = PageOf(order, total, entries);
    data["path"] = target.path;
    data["writable"] = target.writable;
    data["undecodable"] = static_cast<Json::UInt64>(undecodable);
    response->TakeSuccess(&data);
}

// The shares that the caller may read, by name whatever the order asked for.
void ListTop(const APIRequest& request, const Order& order, APIResponse* response) {
    talo::ShareUser user;
    std::vector<talo::Share> shares;
    if (!talo::FindShareUser(request.GetLoginUserName(), &user) || !talo::ListShares(&shares)) {
        response->SetError(kFailed, "/");
        return;
    }
    shares.erase(
        std::remove_if(shares.begin(), shares.end(),
                       [&](const talo::Share& share) { return !talo::MayRead(user, share); }),
        shares.end());
    if (order.descending) {
        std::reverse(shares.begin(), shares.end());
    }
    Json::Value data = PageOf(order, shares.size(), {});
    KeepPage(order, &shares);
    for (const talo::Share& share : shares) {
        Json::Value entry(Json::objectValue);
        entry["name"] = share.name;
        entry["type"] = "share";
        entry["writable"] = talo::MayWrite(user, share);
        data["entries"].append(entry);
    }
    data["path"] = "/";
    data["writable"] = false;
    data["undecodable"] = 0;
    response->TakeSuccess(&data);
}

}  // namespace

void List(APIRequest* request, APIResponse* response) {
    Order order;
    if (const char* wrong = ReadOrder(*request, &order)) {
        response->SetError(kBadParameter, wrong);
        return;
    }
    const auto folder = request->GetAndCheckString("folder", APIRequest::REQUIRED, nullptr);
    if (!folder.IsInvalid() && folder.Get() == "/") {
        ListTop(*request, order, response);
        return;
    }
    Target target;
    if (OpenTarget(*request, response, "folder", Access::kRead, &target)) {
        ListFolder(target, order, response);
    }
}
