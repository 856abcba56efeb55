# Shared by the scripts of this folder; sourced, never run. Leaves the caller in the project's root, which is $root.
set -euo pipefail

root=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
deps=$root/.deps
arm64_root=$deps/arm64
program=$(basename "$0")
cd "$root"

# Progress goes to standard error, so that standard output holds results alone.
say() { printf '%s: %s\n' "$program" "$*" >&2; }
fail() {
  say "$@"
  exit 1
}
