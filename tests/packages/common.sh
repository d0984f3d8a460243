# Sourced by the tests beside it, which are called with the build folder. Exit status 77 is skipped.
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

# quietly COMMAND…: its output only when it fails.
quietly() { "$@" >"$work/log" 2>&1 || { cat "$work/log"; fail "$*"; }; }

# install_copy FOLDER: installs there, and moves the copy, so that none can remember its place.
install_copy() {
  quietly cmake --install "$build" --prefix "$1.before"
  mv "$1.before" "$1"
}

# commands: what tallowmere-cli can be told to do, one a line.
commands() {
  "$cli" --help | sed -n '/^Subcommands:/,/^$/ s/^  *\([a-z][a-z-]*\).*/\1/p'
}

# options [COMMAND]: those of tallowmere-cli or of a command, one a line.
options() {
  "$cli" "$@" --help | sed -n 's/^ *\(-[^ ]*\).*/\1/p' | tr ',' '\n'
}

[ -n "$(commands)" ] && [ -n "$(options)" ] || fail "tallowmere-cli --help cannot be read"
