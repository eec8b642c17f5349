#include "tests/contract/TaskWorld.h"
#include "tests/fake/FakeTask.h"

namespace {

class FakeTaskWorld : public TaskWorld {
  public:
    FakeTaskWorld() {
        fake::ResetTasks();
    }
    ~FakeTaskWorld() override {
        fake::ResetTasks();
    }
};

}  // namespace

std::unique_ptr<TaskWorld> MakeTaskWorld() {
    return std::make_unique<FakeTaskWorld>();
}
