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

# build PRESET [TARGET...]: configures and builds; without a target, everything.
build() {
  local preset=$1
  shift
  say "building for $preset"
  cmake --preset "$preset" -Wno-dev --log-level=WARNING >&2 || return 1
  cmake --build --preset "$preset" ${1:+--target "$@"} >&2
}
