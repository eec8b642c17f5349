#ifndef BENCH_HARNESS_H
#define BENCH_HARNESS_H

#include <functional>
#include <string>
#include <vector>

namespace bench {

struct Subject {
    std::string name;
    std::function<void()> run;
};

// Times the subjects alternately, round by round, so that whatever else the
// machine does falls on all of them, and prints a row for each: the median time
// of one run with its ratio and its difference to the
// first subject's.
void Compare(const std::string& title, const std::vector<Subject>& subjects, int rounds,
             int runsPerRound);

}  // namespace bench

#endif
