#ifndef TESTS_CONTRACT_WORLD_H
#define TESTS_CONTRACT_WORLD_H

#include <gtest/gtest.h>

#include <memory>
#include <string>

// The appliance around a platform. Each side builds its own, so that a case can
// say what there is and then ask the platform. Everything goes with it again.
class World {
  public:
    virtual ~World() {}

    // A place for a file of that name; nothing is there yet.
    virtual std::string PathOf(const std::string& name) = 0;
    virtual void WriteFile(const std::string& path, const std::string& content) = 0;

    // The name of an administrator, and of a user who does not exist.
    virtual std::string Administrator() = 0;
    virtual std::string Stranger() = 0;

    // Makes a preference folder and answers its path.
    virtual std::string MakeUserPreference(const std::string& user) = 0;
    virtual std::string MakeGroupPreference(const std::string& group) = 0;
};

// Of this executable's side.
std::unique_ptr<World> MakeWorld();

class Contract : public ::testing::Test {
  protected:
    Contract() : world(MakeWorld()) {}
    const std::unique_ptr<World> world;
};

#endif
