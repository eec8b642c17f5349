# shellcheck shell=bash
# The Debian packages that the scripts work with, and how they get installed. Needs
# common.sh.
# shellcheck disable=SC2154  # project is set by common.sh

# shellcheck disable=SC2034  # used by the scripts that read this file
packages_build=(g++ cmake ninja-build libjsoncpp-dev libcrypt-dev
    libsqlite3-dev libssl-dev libarchive-dev libidn2-dev libcurl4-openssl-dev media-types)
# shellcheck disable=SC2034
packages_test=(ccache libgtest-dev libgmock-dev python3 nodejs git curl pkg-config util-linux
    lighttpd lighttpd-mod-openssl openssl nginx fcgiwrap apache2-bin libapache2-mod-xsendfile)
# shellcheck disable=SC2034
packages_check=(clang clang-format clang-tidy libclang-rt-14-dev shellcheck)
# shellcheck disable=SC2034
packages_bench=(git python3 pkg-config lighttpd nginx fcgiwrap wrk php8.2-fpm libcpp-httplib-dev)

# What a web server needs: packages_of_server lighttpd|nginx|apache
packages_of_server() {
    case $1 in
        lighttpd) echo lighttpd lighttpd-mod-openssl ;;
        nginx) echo nginx fcgiwrap ;;
        apache) echo apache2-bin libapache2-mod-xsendfile ;;
    esac
}

is_installed() {
    dpkg-query -W -f '${db:Status-Status}\n' "$1" 2>/dev/null | grep -qx installed
}

as_root() {
    if [[ $EUID -eq 0 ]]; then
        "$@"
    elif command -v sudo >/dev/null; then
        sudo "$@"
    else
        die "root is needed for: $* (and there is no sudo)"
    fi
}

# Web servers come as services that start by themselves, on port 80. Here they
# are programs only: the environment keeps their installation from starting
# them, and what the installation enabled for the next boot is disabled again.
install_packages() {
    local unit
    as_root env DEBIAN_FRONTEND=noninteractive apt-get -qq update </dev/null
    as_root env DEBIAN_FRONTEND=noninteractive SYSTEMD_OFFLINE=1 RUNLEVEL=1 \
        apt-get -qq -o Dpkg::Use-Pty=0 -o DPkg::Lock::Timeout=300 \
        install -y --no-install-recommends "$@" </dev/null
    for unit in lighttpd.service nginx.service fcgiwrap.service fcgiwrap.socket \
        php8.2-fpm.service; do
        if [[ " $* " == *" ${unit%.*} "* ]] && command -v systemctl >/dev/null; then
            as_root systemctl --quiet disable "$unit" >/dev/null 2>&1 || true
        fi
    done
}

# Installs those of the named packages that are missing; usually none.
ensure_packages() {
    local name missing=()
    command -v dpkg-query >/dev/null || die "this needs Debian's packages; install: $*"
    for name in "$@"; do
        is_installed "$name" || missing+=("$name")
    done
    [[ ${#missing[@]} -eq 0 ]] && return
    echo "installing ${missing[*]}"
    quietly "$project/build/packages.log" install_packages "${missing[@]}" ||
        die "the packages could not be installed"
}
