# shellcheck shell=sh
# What the scripts at the root share: the Debian packages of the project, and how to build it.

# libhbaapi2 is the system's own Common HBA API library: one test runs the module over it.
# nvrcim serve listens by GNU libmicrohttpd, reads by pugixml and delivers by libcurl; sblim-wbemcli is a client that asks it.
# graphviz draws what nvrcim graph writes.
# lintian, dpkg-dev and rpm make and inspect the packages.
# libcurl4 is what the module loads for transfers; python3, python3-pyftpdlib and openssl make the servers that tests transfer
# from and to: HTTP and HTTPS come with Python, FTP does not, and HTTPS needs a certificate.
# shellcheck disable=SC2034 # the scripts that source this file use it
packages="g++ cmake ninja-build ccache binutils libhbaapi-dev libhbaapi2 librapidxml-dev
    libtomlplusplus-dev libcli11-dev nlohmann-json3-dev libgtest-dev libgmock-dev libbenchmark-dev cmark-gfm
    libcurl4 python3 python3-pyftpdlib openssl lintian dpkg-dev rpm
    libmicrohttpd-dev libpugixml-dev libcurl4-openssl-dev sblim-wbemcli graphviz"

# What fuzz/run and scripts/coverage need beside them: clang with its run-time libraries, and LLVM's tools. No check is
# built by clang.
# shellcheck disable=SC2034
clang_packages="clang llvm libclang-rt-14-dev"

# install_packages NAMES...: asks apt for those that are not there yet, so that a second run costs nothing.
install_packages() {
    missing=""
    for package in "$@"; do
        case "$(dpkg-query -W -f '${Status}' "$package" 2>/dev/null)" in
        *"install ok installed") ;;
        *) missing="$missing $package" ;;
        esac
    done
    [ -n "$missing" ] || return 0

    as_root=""
    if [ "$(id -u)" -ne 0 ]; then
        if ! command -v sudo >/dev/null; then
            echo "These packages are missing, and neither root nor sudo is at hand to install them:$missing" >&2
            return 1
        fi
        as_root="sudo"
    fi
    echo "Installing packages:$missing"
    export DEBIAN_FRONTEND=noninteractive
    # shellcheck disable=SC2086 # word splitting is meant
    $as_root apt-get -q -o Dpkg::Use-Pty=0 update >/dev/null &&
        $as_root apt-get -q -o Dpkg::Use-Pty=0 install -y --no-install-recommends $missing >/dev/null
}

# build PRESET TARGETS...: configures once and builds, with ninja's progress on the terminal.
build() {
    preset="$1"
    shift
    if [ ! -f "build/$preset/build.ninja" ]; then
        echo "Configuring ($preset) ..."
        cmake --preset "$preset" >"build/$preset.configure.log" 2>&1 || {
            cat "build/$preset.configure.log" >&2
            return 1
        }
    fi
    NINJA_STATUS="[%f/%t %es] " cmake --build --preset "$preset" ${1:+--target "$@"}
}
