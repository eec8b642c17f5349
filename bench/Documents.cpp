#include "Documents.h"

namespace bench {

Json::Value Listing(size_t bytes) {
    constexpr size_t kBytesPerEntry = 150;
    Json::Value listing(Json::objectValue);
    Json::Value& files = listing["files"] = Json::Value(Json::arrayValue);
    for (size_t number = 0; number * kBytesPerEntry < bytes; ++number) {
        Json::Value file(Json::objectValue);
        file["name"] = "Holiday pictures \xC3\xBC " + std::to_string(number) + ".jpeg";
        file["path"] = "/volume1/photo/2024/" + std::to_string(number % 12) + "/raw";
        file["size"] = static_cast<Json::UInt64>(number * 104729);
        file["mtime"] = 1700000000 + static_cast<int>(number);
        file["rating"] = 0.5 * static_cast<double>(number % 11);
        file["hidden"] = false;
        files.append(file);
    }
    listing["total"] = files.size();
    return listing;
}

std::string ParameterLine(int pairs) {
    std::string line = "api=TALO.System&version=1&method=ping";
    for (int number = 3; number < pairs; ++number) {
        const std::string name = "&field" + std::to_string(number) + "=";
        line += name + (number % 3 == 0   ? "some%20text+with%20%C3%BC"
                        : number % 3 == 1 ? std::to_string(number * 7919)
                                          : "%5B1%2C2%2C%22three%22%5D");
    }
    return line;
}

}  // namespace bench
