#include "tests/contract/World.h"
#include "tests/fake/FakePlatform.h"

namespace {

class FakeWorld : public World {
  public:
    FakeWorld() {
        fake::Reset();
    }
    ~FakeWorld() override {
        fake::Reset();
    }
    std::string PathOf(const std::string& name) override {
        return "/world/" + name;
    }
    void WriteFile(const std::string& path, const std::string& content) override {
        fake::Now().files[path] = content;
    }
    std::string Administrator() override {
        fake::Now().administrators.insert("root");
        return "root";
    }
    std::string Stranger() override {
        return "no-such-user-anywhere";
    }
    std::string MakeUserPreference(const std::string& user) override {
        return fake::Now().userPreference[user] = "/preference/" + user;
    }
    std::string MakeGroupPreference(const std::string& group) override {
        return fake::Now().groupPreference[group] = "/preference.group/" + group;
    }
};

}  // namespace

std::unique_ptr<World> MakeWorld() {
    return std::make_unique<FakeWorld>();
}
