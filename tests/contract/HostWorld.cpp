#include <filesystem>
#include <vector>

#include "platform/Paths.h"
#include "tests/contract/World.h"
#include "tests/support/TempFolder.h"

namespace {

// Users and groups are those of the machine: root is an administrator everywhere.
class HostWorld : public World {
  public:
    ~HostWorld() override {
        for (const std::string& folder : made_) {
            std::filesystem::remove(folder);
        }
    }
    std::string PathOf(const std::string& name) override {
        return folder_.Path(name);
    }
    void WriteFile(const std::string& path, const std::string& content) override {
        std::ofstream(path, std::ios::binary) << content;
    }
    std::string Administrator() override {
        return "root";
    }
    std::string Stranger() override {
        return "no-such-user-anywhere";
    }
    std::string MakeUserPreference(const std::string& user) override {
        return Make(TALO_USER_PREFERENCE_DIR + user);
    }
    std::string MakeGroupPreference(const std::string& group) override {
        return Make(TALO_GROUP_PREFERENCE_DIR + group);
    }

  private:
    std::string Make(const std::string& path) {
        std::filesystem::create_directories(path);
        made_.push_back(path);
        return path;
    }

    support::TempFolder folder_;
    std::vector<std::string> made_;
};

}  // namespace

std::unique_ptr<World> MakeWorld() {
    return std::make_unique<HostWorld>();
}
