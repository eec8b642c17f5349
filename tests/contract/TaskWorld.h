#ifndef TESTS_CONTRACT_TASKWORLD_H
#define TESTS_CONTRACT_TASKWORLD_H

#include <memory>

// An appliance without tasks. Those that are made go with it again.
class TaskWorld {
  public:
    virtual ~TaskWorld() {}
};

// Of this executable's side.
std::unique_ptr<TaskWorld> MakeTaskWorld();

#endif
