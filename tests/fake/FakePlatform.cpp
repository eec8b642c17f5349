#include "tests/fake/FakePlatform.h"

#include "tests/fake/FakeRelay.h"
#include "tests/fake/FakeTask.h"

namespace fake {

namespace {
Platform platform;
}

Platform& Now() {
    return platform;
}

void Reset() {
    platform = Platform();
    ResetTasks();
    ResetRelay();
}

void Platform::FailCall(const std::string& operation, int nth) {
    failAt[operation] = calls[operation] + nth;
}

void Platform::WriteJson(const std::string& path, const Json::Value& document) {
    files[path] = Json::writeString(Json::StreamWriterBuilder(), document);
}

bool Platform::Called(const std::string& operation) {
    journal.push_back(operation);
    const int number = ++calls[operation];
    const auto planned = failAt.find(operation);
    return planned != failAt.end() && planned->second == number;
}

}  // namespace fake
