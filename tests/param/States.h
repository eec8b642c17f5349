#ifndef TESTS_PARAM_STATES_H
#define TESTS_PARAM_STATES_H

#include <ostream>

#include "webapi/APIParameter.h"

// The three flags of a parameter as one value.
struct State {
    bool set;
    bool reset;
    bool invalid;
};

const State kAbsent = {false, false, false};
const State kMissing = {false, false, true};
const State kNull = {true, true, false};
const State kValid = {true, false, false};
const State kBad = {true, false, true};

inline bool operator==(const State& one, const State& other) {
    return one.set == other.set && one.reset == other.reset && one.invalid == other.invalid;
}

inline std::ostream& operator<<(std::ostream& out, const State& state) {
    return out << (state.set ? "set " : "- ") << (state.reset ? "reset " : "- ")
               << (state.invalid ? "invalid" : "-");
}

template <typename T>
State StateOf(const TALO::APIParameter<T>& parameter) {
    return {parameter.IsSet(), parameter.IsReset(), parameter.IsInvalid()};
}

#endif
