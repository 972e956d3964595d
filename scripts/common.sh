# Functions that the scripts share. Source it; don't run it.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."
mkdir -p build

# say TEXT: prints a line on standard error.
say() { printf '%s\n' "$*" >&2; }

die() {
    say "$*"
    exit 1
}

# as_root COMMAND...: runs it as root, with sudo if necessary.
as_root() {
    if [ "$(id -u)" = 0 ]; then
        "$@"
    elif command -v sudo >/dev/null; then
        sudo "$@"
    else
        die "Installing packages needs root or sudo: $*"
    fi
}

# quietly LOG COMMAND...: runs it with its output in build/logs/LOG. Prints the log if it fails.
quietly() {
    local log=build/logs/$1
    shift
    mkdir -p build/logs
    if ! "$@" >"$log" 2>&1; then
        tail -n 200 "$log" >&2
        die "Failed: $* (whole log: $log)"
    fi
}

# timed WHAT COMMAND...: runs it, and prints WHAT before and the time after.
timed() {
    local what=$1 start=$SECONDS
    shift
    say "$what ..."
    "$@"
    say "$what: done in $((SECONDS - start)) s"
}

# list_sources: the names of the tree's files, each with a zero byte after it. In an unpacked source archive
# these are all files outside of build/.
list_sources() {
    if [ -e .git ]; then
        git ls-files -z --cached --others --exclude-standard
    else
        find . -path ./build -prune -o \( -type f -o -type l \) -printf '%P\0'
    fi
}

project_version() { sed -n 's/^project(assay VERSION \([0-9.]*\).*/\1/p' CMakeLists.txt; }

jobs=$(nproc)
if command -v ccache >/dev/null; then
    export CMAKE_CXX_COMPILER_LAUNCHER=ccache CMAKE_C_COMPILER_LAUNCHER=ccache
fi
