#!/usr/bin/env bash
# Builds the product for the real root, installs it in a private view of the
# machine, builds the example API library against it by CMake and by pkg-config,
# and calls it.
set -euo pipefail

if [[ ${1:-} == --help || $# -lt 2 ]]; then
    echo "usage: install_and_use.sh SOURCE_DIR WORK_DIR"
    exit 0
fi
source_dir=$1
work=$2

fail() {
    echo "FAIL: $1" >&2
    exit 1
}

expect() { # DESCRIPTION TEXT PART
    case $2 in
        *"$3"*) ;;
        *) fail "$1: expected $3 in: $2" ;;
    esac
}

build_product() {
    env -u CXXFLAGS -u LDFLAGS cmake -S "$source_dir" -B "$work/build" -G Ninja \
        -DCMAKE_BUILD_TYPE=Debug -DBUILD_TESTING=OFF -DCMAKE_INSTALL_PREFIX=/usr \
        -DTALO_ROOT= > "$work/configure.log"
    # The build is the same for each preset that tests it: a compiler cache may know it.
    CCACHE_BASEDIR=$source_dir CCACHE_NOHASHDIR=1 \
        cmake --build "$work/build" > "$work/build.log" || {
        cat "$work/build.log"
        fail "the default build"
    }
}

# /usr becomes an overlay whose changes live in memory and go with the namespace.
privately() {
    local options=(--mount)
    [[ $(id -u) -eq 0 ]] || options+=(--user --map-root-user)
    unshare "${options[@]}" bash "$0" --inside "$source_dir" "$work"
}

inside() {
    mount -t tmpfs none "$work/overlay"
    mkdir "$work/overlay/upper" "$work/overlay/work"
    mount -t overlay none -o "lowerdir=/usr,upperdir=$work/overlay/upper,workdir=$work/overlay/work" /usr
    cmake --install "$work/build" > "$work/install.log"

    local api_dir=/usr/talo/taloman/webapi
    local path
    for path in entry.cgi lib.def TALO.System.lib lib/TALO.System.so; do
        [[ -e $api_dir/$path ]] || fail "$api_dir/$path is missing"
    done
    cmp "$source_dir/console/cipher.js" /usr/share/webapi/console/cipher.js ||
        fail "the browser's ciphers are not installed"

    cmake -S "$source_dir/examples/light" -B "$work/light" -G Ninja > "$work/light.log"
    cmake --build "$work/light" >> "$work/light.log" || fail "the example by CMake: $(cat "$work/light.log")"
    cmake --install "$work/light" >> "$work/light.log"
    call_light

    local flags
    flags=$(pkg-config --cflags --libs webapi)
    # The flags are words on purpose.
    # shellcheck disable=SC2086
    c++ -std=c++17 -shared -fPIC -o "$api_dir/lib/Acme.Light.so" \
        "$source_dir/examples/light/Light.cpp" $flags || fail "the example by pkg-config"
    call_light
}

call_light() {
    local reply
    reply=$(cd / && REQUEST_METHOD=GET \
        QUERY_STRING='api=Acme.Light&version=1&method=switch&room=cellar' \
        /usr/talo/taloman/webapi/entry.cgi)
    expect "entry.cgi" "$reply" '{"data":{"on":true,"room":"cellar"},"success":true}'
    reply=$(webapi-call --compact Acme.Light switch room=attic) && fail "attic is no room"
    expect "webapi-call" "$reply" '"code":401'
}

if [[ $1 == --inside ]]; then
    source_dir=$2
    work=$3
    inside
    exit 0
fi
mkdir -p "$work/overlay"
rm -rf "$work/light"
build_product
privately
