#include "Harness.h"

#include <algorithm>
#include <chrono>
#include <cstdio>

namespace bench {

namespace {

double MicrosecondsPerRun(const Subject& subject, int runs) {
    const auto start = std::chrono::steady_clock::now();
    for (int run = 0; run < runs; ++run) {
        subject.run();
    }
    const std::chrono::duration<double, std::micro> time = std::chrono::steady_clock::now() - start;
    return time.count() / runs;
}

double Median(std::vector<double> times) {
    std::sort(times.begin(), times.end());
    return times[times.size() / 2];
}

}  // namespace

void Compare(const std::string& title, const std::vector<Subject>& subjects, int rounds,
             int runsPerRound) {
    std::vector<std::vector<double>> times(subjects.size());
    for (const Subject& subject : subjects) {
        subject.run();
    }
    for (int round = 0; round < rounds; ++round) {
        for (size_t index = 0; index < subjects.size(); ++index) {
            times[index].push_back(MicrosecondsPerRun(subjects[index], runsPerRound));
        }
    }
    std::printf("%s\n", title.c_str());
    const double first = Median(times[0]);
    for (size_t index = 0; index < subjects.size(); ++index) {
        const double median = Median(times[index]);
        std::printf("  %-44s %10.2f us  %6.2f  %+10.2f us\n", subjects[index].name.c_str(), median,
                    median / first, median - first);
    }
    std::printf("\n");
}

}  // namespace bench
