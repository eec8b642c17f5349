# shellcheck shell=bash
# Configuring, building and testing by preset. Needs common.sh.
# shellcheck disable=SC2154  # project is set by common.sh

# The folder of a preset's build: build_folder PRESET
build_folder() {
    echo "$project/build/$1"
}

# configure_and_build PRESET [ARGUMENT OF cmake --build]...
configure_and_build() {
    local preset=$1
    shift
    if command -v ccache >/dev/null; then
        export CMAKE_CXX_COMPILER_LAUNCHER=ccache
    fi
    quietly "$project/build/$preset.configure.log" \
        cmake -S "$project" --preset "$preset" || die "preset $preset cannot be configured"
    quietly "$project/build/$preset.build.log" \
        cmake --build "$(build_folder "$preset")" --parallel "$(nproc)" "$@" ||
        die "preset $preset cannot be built"
}

# run_tests PRESET [ARGUMENT OF ctest]...: more at a time than there are processors,
# because many of them wait: one more, or tests_ahead. What failed stands at the very end, where a
# record that is cut still has it.
run_tests() {
    local preset=$1 report status=0
    report="$(build_folder "$preset")/Testing/tests.xml"
    shift
    rm -f "$report"
    ctest --test-dir "$(build_folder "$preset")" -j"$(($(nproc) + ${tests_ahead:-1}))" --output-on-failure \
        --output-junit "$report" --test-output-truncation head --no-tests=error "$@" || status=$?
    if [[ $status -ne 0 && -f $report ]]; then
        python3 "$project/scripts/lib/failed_tests.py" "$report" || true
    fi
    return "$status"
}
