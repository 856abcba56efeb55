# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# shellcheck shell=bash disable=SC2034
# Shared by the scripts of this folder; sourced, never run. Leaves the caller in the project's root, which is $root.
set -euo pipefail

# File names may be in any language, whatever that of the caller: Java reads them by this.
export LC_ALL=C.UTF-8

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

# llvm_version: prints the version of clang and of LLVM's tools to take, the first of cmake/llvm-versions that there is.
llvm_version() {
  local version
  while read -r version; do
    ! command -v "clang-$version" >/dev/null || { echo "$version" && return; }
  done <cmake/llvm-versions
  fail "there is no clang from 16 on: scripts/setup.sh installs one"
}

# writable FOLDER...: whether folders, which may not be there yet, can be written to; says so when one cannot.
writable() {
  local folder probe
  for folder in "$@"; do
    probe=$folder/.writable.$$
    if ! { mkdir -p "$folder" && echo probe >"$probe" && [ -s "$probe" ]; } 2>/dev/null; then
      rm -f "$probe" 2>/dev/null || true
      say "$root/$folder cannot be written to: it is no folder, or read-only, or its disk is full"
      return 1
    fi
    rm -f "$probe"
  done
}

# alone NAME: waits until no other script of this clone works on what NAME names: a folder of build/ or out/. Until the
# end of this script, or `alone_no_more NAME`, others wait.
declare -A alone_with=()
alone() {
  local lock
  [ -z "${alone_with[$1]:-}" ] || return 0
  writable "$(dirname "$1")" || return 1
  exec {lock}>"$(dirname "$1")/.$(basename "$1").lock"
  if ! flock -n "$lock"; then
    say "waiting for another script that works on $1"
    flock "$lock"
  fi
  alone_with[$1]=$lock
}
alone_no_more() {
  local lock=${alone_with[$1]}
  exec {lock}>&-
  unset "alone_with[$1]"
}

# build PRESET [TARGET...]: configures and builds; without a target, everything. What an interrupted build left is
# finished.
build() {
  local preset=$1 built=0
  shift
  alone "build/$preset" || return 1
  say "building for $preset"
  { cmake --preset "$preset" -Wno-dev --log-level=WARNING >&2 &&
    cmake --build --preset "$preset" ${1:+--target "$@"} >&2; } || built=1
  alone_no_more "build/$preset"
  return $built
}
