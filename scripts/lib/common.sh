# shellcheck shell=bash
# What every script starts with: the project's folder and a way to give up.

# shellcheck disable=SC2034  # used by the scripts that read this file
project=$(cd "$(dirname "${BASH_SOURCE[0]}")/../.." && pwd -P)

die() {
    echo "$(basename "$0"): $*" >&2
    exit 1
}

# Wrong usage is a status of its own, so that a caller can tell it from failure.
usage_error() {
    echo "$(basename "$0"): $* (see --help)" >&2
    exit 2
}

# Runs a command and keeps quiet about it, unless it fails: then its output is
# what the user needs. quietly LOGFILE COMMAND...
quietly() {
    local log=$1
    shift
    mkdir -p "$(dirname "$log")"
    if ! "$@" >"$log" 2>&1 </dev/null; then
        cat "$log" >&2
        return 1
    fi
}
