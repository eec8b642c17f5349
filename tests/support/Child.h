#ifndef TESTS_SUPPORT_CHILD_H
#define TESTS_SUPPORT_CHILD_H

#include <functional>
#include <string>

namespace support {

struct ChildResult {
    int status = -1;     // exit status, or 1000 + the signal that ended it
    std::string output;  // what it wrote to standard output
};

// Runs `body` in a child process: for whatever forks, renames itself, changes
// directory or writes to standard output. `input` is its standard input. The
// child's exit status is what `body` returns, or 99 when gtest saw a failure in
// it (which the parent's output shows). Waits until everybody who holds the
// child's standard output has closed it.
ChildResult InChild(const std::function<int()>& body, const std::string& input = "");

}  // namespace support

#endif
