#include "bench/module/Reply.h"

#include <string>

#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

namespace {

constexpr size_t kRowBytes = 1000;
constexpr size_t kQuotesAndComma = 3;

}  // namespace

void Rows(TALO::APIRequest* request, TALO::APIResponse* response) {
    const Json::Value count = request->GetParam("count", Json::Value(1));
    if (!count.isUInt()) {
        response->SetError(400, "count");
        return;
    }
    const std::string row(kRowBytes - kQuotesAndComma, 'r');
    Json::Value rows(Json::arrayValue);
    for (Json::UInt number = 0; number < count.asUInt(); ++number) {
        rows.append(row);
    }
    Json::Value data(Json::objectValue);
    data["rows"].swap(rows);
    response->TakeSuccess(&data);
}
