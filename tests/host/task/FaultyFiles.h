#ifndef TESTS_HOST_TASK_FAULTYFILES_H
#define TESTS_HOST_TASK_FAULTYFILES_H

// SQLite's calls to the system, one of which fails.
namespace faulty {

enum class Fault { kNone, kError, kFull, kKill };

// From here on, the call of that number (counted from 1) fails, or ends the
// process. For the life of the process; to be settled in a child.
void Plan(Fault fault, int call);

// Whether it has come to that.
bool HasStruck();

}  // namespace faulty

#endif
