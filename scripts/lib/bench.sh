# shellcheck shell=bash
# shellcheck disable=SC2154  # works on what the files that it needs have set
# The parts of scripts/bench. Needs common.sh, packages.sh and build.sh.

# install_bench TARGET...: builds the release and these targets, and installs it.
install_bench() {
    configure_and_build release
    configure_and_build release --target "$@"
    quietly "$project/build/release.install.log" cmake --install "$(build_folder release)" ||
        die "cannot install"
}

bench_groups() {
    install_bench bench
    exec "$(build_folder release)/bench/bench" "$@"
}

# bench_http NAME [ARGUMENT]...: peers or growth.
bench_http() {
    local name=$1
    shift
    ensure_packages "${packages_bench[@]}"
    install_bench bench-module bench-httplib
    exec python3 -B "$project/bench/http/run_$name.py" "$@"
}

# check_out REVISION FOLDER: a worktree, kept for the next time.
check_out() {
    local git=(git -c "safe.directory=$project" -C "$project")
    [[ -e $2/.git ]] && return
    rm -rf "$2"
    "${git[@]}" worktree prune
    quietly "$project/build/compare.log" \
        "${git[@]}" worktree add --detach "$2" "$1" || die "cannot check out $1"
}

# bench_compare REVISION [--rounds N] [GROUP]...: the other revision is built by its own
# scripts' rules, in its own private root.
bench_compare() {
    local revision=$1 commit folder program=build/release/bench/bench
    shift
    commit=$(git -c "safe.directory=$project" -C "$project" \
        rev-parse --quiet --verify --short=12 "$revision^{commit}") ||
        usage_error "no revision '$revision'"
    folder=$project/build/compare/$commit
    check_out "$commit" "$folder"
    echo "building $commit in build/compare/$commit"
    project=$folder install_bench bench
    install_bench bench
    exec python3 -B "$project/bench/http/run_compare.py" \
        "$commit" "$folder/$program" "$project/$program" "$@"
}
