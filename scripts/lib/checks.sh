# shellcheck shell=bash
# The steps of scripts/check, each a function that works in the project's folder
# and fails with a message. Needs common.sh and build.sh.
# shellcheck disable=SC2154  # project is set by common.sh

# The files of the project, the ones not yet committed included: sources PATTERN...
sources() {
    local file
    git -c safe.directory="$project" ls-files -z --cached --others --exclude-standard -- "$@" |
        while IFS= read -r -d '' file; do
            [[ ! -f $file ]] || printf '%s\0' "$file"
        done
}

shell_scripts() {
    sources | xargs -0 grep -lZE '^#(!.*\b(ba|da)?sh$| shellcheck shell=)' | grep -zvE '\.(in|md)$'
}

check_format() {
    sources '*.cpp' '*.h' | xargs -0 clang-format --dry-run -Werror
}

check_shell() {
    shell_scripts | xargs -0 shellcheck -x
}

# must_not_find WHAT GREP-ARGUMENT...: over all text files of the project.
must_not_find() {
    local what=$1 status=0
    shift
    sources ':!:fuzz/corpus' | xargs -0 grep -nI "$@" || status=$?
    [[ $status -ne 0 ]] || die "$what"
}

check_text() {
    must_not_find "white space at the end of a line" -E '[[:blank:]]+$'
    must_not_find "a carriage return" -E $'\r'
    must_not_find "work left to do" -E '\b(TO''DO|FIX''ME|X''XX)\b'
    must_not_find "a path of this machine" -F -- "$project/"
    must_not_find "a suppressed warning without its reason" -E 'NO''LINT[A-Z]*(\([^)]*\))?[^:(A-Z]*$'
    local file
    while IFS= read -r -d '' file; do
        [[ ! -s $file || -z $(tail -c1 "$file") ]] || die "$file: no line end at the end"
    done < <(sources '*.cpp' '*.h' '*.in' '*.txt' '*.md' '*.py' '*.json' '*.lib' 'scripts/*')
}

check_warnings() {
    configure_and_build dev
}

# The tests compile sources of the product again, for another root; clang-tidy would
# look at them as often. It reads every header itself: an #include that is missing
# shows, and GCC's compiled headers are of no use to it.
one_command_per_file() {
    python3 -c '
import json, shlex, sys
commands = {command["file"]: command for command in reversed(json.load(sys.stdin))}
for command in commands.values():
    words = shlex.split(command["command"])
    for place in reversed(range(len(words))):
        if words[place] in ("-Winvalid-pch", "-fpch-preprocess"):
            del words[place]
        elif words[place] == "-include" and words[place + 1].endswith("/cmake_pch.hxx"):
            del words[place : place + 2]
    command["command"] = shlex.join(words)
json.dump(list(commands.values()), sys.stdout, indent=0, ensure_ascii=False)'
}

check_tidy() {
    configure_and_build dev
    mkdir -p build/tidy
    one_command_per_file <build/dev/compile_commands.json >build/tidy/compile_commands.json
    # Large pages, and few calls for memory, are a tenth of its time, and starting it for
    # each file is another. Only what the build knows how to compile.
    sources '*.cpp' | while IFS= read -r -d '' file; do
        if grep -qF "\"file\": \"$project/$file\"" build/tidy/compile_commands.json; then
            printf '%s\0' "$file"
        fi
    done | GLIBC_TUNABLES=glibc.malloc.hugetlb=1:glibc.malloc.top_pad=67108864 \
        xargs -0 -n6 -P"$(nproc)" clang-tidy --quiet -p build/tidy
}

check_sanitizers() {
    configure_and_build asan
    run_tests asan -LE '^slow$'
}

# fuzz_target PROGRAM: from the kept seeds, in a corpus of the build's own.
fuzz_target() {
    local name corpus
    name=$(basename "$1" -fuzz)
    corpus=build/fuzz/corpus/$name
    mkdir -p "$corpus" build/fuzz/findings
    if [[ -d fuzz/corpus/$name ]]; then
        cp -r "fuzz/corpus/$name/." "$corpus/"
    fi
    quietly "build/fuzz/$name.log" \
        "$1" "$corpus" -max_total_time="${FUZZ_SECONDS:-20}" -timeout=10 -rss_limit_mb=2048 \
        -artifact_prefix=build/fuzz/findings/ -verbosity=0
}

check_fuzz() {
    local program programs=()
    configure_and_build fuzz
    for program in build/fuzz/fuzz/*-fuzz; do
        [[ -x $program ]] && programs+=("$program")
    done
    [[ ${#programs[@]} -gt 0 ]] || die "no fuzz targets"
    # Each has a processor to itself.
    export -f fuzz_target quietly
    printf '%s\0' "${programs[@]}" |
        xargs -0 -n1 -P"$(nproc)" bash -euo pipefail -c "fuzz_target \"\$1\"" fuzz
}
