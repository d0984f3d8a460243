# Sourced by the tests in this folder, which take the build folder as their first argument. Exit
# status 77 means skipped.
set -euo pipefail
build=$1
here=$(cd "$(dirname "${BASH_SOURCE[0]}")" && pwd)
source_tree=$(cd "$here/../.." && pwd)
cli=$build/bin/tallowmere-cli
export LC_ALL=C.UTF-8

work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

fail() { echo "FAILED: $1"; exit 1; }
need() { command -v "$1" >/dev/null || { echo "Skipped: $1 is not installed"; exit 77; }; }

# quietly COMMAND…: runs it, and shows its output only when it fails.
quietly() { "$@" >"$work/log" 2>&1 || { cat "$work/log"; fail "$*"; }; }

# install_copy FOLDER: installs elsewhere and moves the copy there, so that it cannot rely on its prefix.
install_copy() {
  quietly cmake --install "$build" --prefix "$1.before"
  mv "$1.before" "$1"
}

# commands: prints the commands of tallowmere-cli, one a line.
commands() {
  "$cli" --help | sed -n '/^Subcommands:/,/^$/ s/^  *\([a-z][a-z-]*\).*/\1/p'
}

# options [COMMAND]: prints the options of tallowmere-cli or of a command, one a line.
options() {
  "$cli" "$@" --help | sed -n 's/^ *\(-[^ ]*\).*/\1/p' | tr ',' '\n'
}

[ -n "$(commands)" ] && [ -n "$(options)" ] || fail "tallowmere-cli --help cannot be read"
