#include <filesystem>

#include "platform/Paths.h"
#include "tests/contract/TaskWorld.h"

namespace fs = std::filesystem;

namespace {

// The store of the private root, with the module in its place as an installation
// puts it.
class HostTaskWorld : public TaskWorld {
  public:
    HostTaskWorld() {
        const fs::path module = fs::path(TALO_MODULE_DIR) / "talo-task.so";
        fs::remove_all(TALO_TASK_DIR);
        fs::create_directories(module.parent_path());
        if (!fs::exists(module)) {
            fs::copy_file(TASK_MODULE, module);
        }
    }
    ~HostTaskWorld() override {
        fs::remove_all(TALO_TASK_DIR);
    }
};

}  // namespace

std::unique_ptr<TaskWorld> MakeTaskWorld() {
    return std::make_unique<HostTaskWorld>();
}
