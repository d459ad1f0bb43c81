# What the scripts share. They run at the top of the tree, in one locale, and write the output of the tools that they
# call to build/log/, showing it only when a tool fails.
# shellcheck shell=bash
cd -P -- "$(dirname -- "${BASH_SOURCE[0]}")/.." || exit
export LC_ALL=C.UTF-8

say() { printf '==> %s\n' "$*"; }

die() {
    printf '%s: %s\n' "$0" "$*" >&2
    exit 1
}

# quietly NAME COMMAND...: runs a command with its output in build/log/NAME.log, and shows the end if that fails.
quietly() {
    local log=build/log/$1.log status=0
    shift
    mkdir -p build/log
    "$@" >"$log" 2>&1 </dev/null || status=$?
    [ "$status" = 0 ] && return
    tail -n 30 "$log" >&2
    die "'$1' failed with status $status; its output is in $log"
}

# build PRESET [TARGET...]: configures and builds, in a new directory if the old one was copied from elsewhere, because
# CMake refuses its cache.
build() {
    local preset=$1
    shift
    [ $# != 0 ] || set -- all
    say "Building $* in build/$preset (log in build/log/)"
    grep -qsxF "CMAKE_HOME_DIRECTORY:INTERNAL=$PWD" "build/$preset/CMakeCache.txt" ||
        rm -rf "build/$preset"
    quietly "configure-$preset" cmake --preset "$preset"
    quietly "build-$preset" cmake --build --preset "$preset" -j "$(nproc)" --target "$@"
}

# judges TOOL VERSION: whether this system has the version whose findings count, Debian 12's; if not, says so.
judges() {
    local version
    version=$("$1" --version | sed -nE '/version/ { s/.*version:? ([0-9.]+).*/\1/p; q }')
    [[ $version. == "$2".* ]] || {
        say "Skipping $1 $version, because only the findings of $1 $2 count"
        return 1
    }
}

# find_code PATTERN...: lists our files whose names match, each followed by a NUL.
find_code() {
    local names=(-name "$1")
    shift
    for name in "$@"; do names+=(-o -name "$name"); done
    find . \( -path './build*' -o -path ./.git \) -prune -o -type f \( "${names[@]}" \) -print0
}

# without_comments FILE: prints the file without empty lines and comments.
without_comments() { grep -vE '^(#|$)' "$1"; }

# readme TEXT: prints the first block of README.md that contains TEXT.
readme() {
    local block
    block=$(awk -v text="$1" '/^```/ { if (found) exit; inside = !inside; block = ""; next }
        inside { block = block $0 "\n"; found = found || index($0, text) }
        END { if (found) printf "%s", block }' README.md)
    [ -n "$block" ] || die "README.md has no block with '$1'"
    printf '%s\n' "$block"
}

# block PAGE HEAD: prints the blocks of a page whose fence says HEAD.
block() { awk -v head="\`\`\`$2" '$0 == "```" { inside = 0 } inside; $0 == head { inside = 1 }' "$1"; }

# log_of FILE: prints a log without dates, times, processes and threads.
log_of() { sed -E 's/^[0-9-]+ [0-9:.]+ +[0-9]+ +[0-9]+ //' "$1"; }
