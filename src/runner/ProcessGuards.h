#ifndef TALO_SRC_RUNNER_PROCESSGUARDS_H
#define TALO_SRC_RUNNER_PROCESSGUARDS_H

#include <fstream>
#include <streambuf>

namespace TALO {

// Keeps a method away from the client's streams: as long as a guard lives,
// std::cin is at its end and what is written to std::cout goes nowhere, so that
// no stray print of a method spoils a reply.
class StandardStreams {
  public:
    StandardStreams(bool disconnectInput, bool disconnectOutput);
    ~StandardStreams();
    StandardStreams(const StandardStreams&) = delete;
    StandardStreams& operator=(const StandardStreams&) = delete;

  private:
    std::filebuf noInput;
    std::filebuf noOutput;
    std::streambuf* input = nullptr;
    std::streambuf* output = nullptr;
};

// Runs at another scheduling priority as long as it lives.
class SchedulingPriority {
  public:
    explicit SchedulingPriority(int priority);
    ~SchedulingPriority();
    SchedulingPriority(const SchedulingPriority&) = delete;
    SchedulingPriority& operator=(const SchedulingPriority&) = delete;

  private:
    int before;
    bool changed;
};

}  // namespace TALO

#endif
