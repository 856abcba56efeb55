# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# shellcheck shell=bash disable=SC2034
# Shared by the scripts of this folder; sourced, never run. Leaves the caller in the project's root, which is $root.
set -euo pipefail

started_in=$PWD
root=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
program=$(basename "$0")
self=$root/scripts/$program
cd "$root"

# Progress goes to standard error, so that standard output holds results alone.
say() { printf '%s: %s\n' "$program" "$*" >&2; }
fail() {
  say "$@"
  exit 1
}

# usage: prints the comment at the top of the script, but for its licence, and leaves.
usage() {
  sed -n '2,${/^# shellcheck/q;/^# SPDX-/d;/^#/!q;s/^# \{0,1\}//;p}' "$self"
  exit 0
}

# build PRESET [TARGET...]: configures and builds; without a target, everything.
build() {
  local preset=$1
  shift
  say "building for $preset"
  cmake --preset "$preset" -Wno-dev --log-level=WARNING >&2 || return 1
  cmake --build --preset "$preset" ${1:+--target "$@"} >&2
}
