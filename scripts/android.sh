# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# shellcheck shell=bash disable=SC2034,SC2154
# What the scripts that build for Android share; sourced after common.sh, never run.

# named_ndk: prints the folder of the Android NDK that the environment names, or nothing where it names none. Fails when
# there is no NDK in that folder, saying what is wrong.
named_ndk() {
  local variable folder
  for variable in ANDROID_NDK_HOME ANDROID_NDK; do
    [ -n "${!variable:-}" ] || continue
    folder=$(cd "$started_in" && realpath -m "${!variable}")
    [ -d "$folder" ] || fail "$variable is \"${!variable}\", and there is no such folder"
    [ -f "$folder/build/cmake/android.toolchain.cmake" ] ||
      fail "$variable is \"${!variable}\", which is no Android NDK: it has no build/cmake/android.toolchain.cmake"
    printf '%s\n' "$folder"
    return
  done
}

# use_ndk FOLDER: what is configured from now on is built by this NDK.
use_ndk() {
  ndk=$1
  export ANDROID_NDK_HOME=$ndk
  local folders=("$ndk"/toolchains/llvm/prebuilt/*/bin)
  [ -d "${folders[0]}" ] || fail "$ndk is no whole Android NDK: it has no toolchains/llvm/prebuilt"
  ndk_tools=${folders[0]}
}

# need_ndk: what is configured from now on is built by the NDK that the environment names.
need_ndk() {
  local found
  found=$(named_ndk)
  [ -n "$found" ] || fail "building for Android takes an NDK: set ANDROID_NDK_HOME to its folder"
  use_ndk "$found"
}

# ndk_major: the number of the NDK's release, 26 for r26.
ndk_major() {
  sed -n 's/^Pkg\.Revision *= *\([0-9]*\).*/\1/p' "$ndk/source.properties" | grep . ||
    fail "$ndk/source.properties does not say which NDK it is"
}

# preset_of ABI: the preset that builds for an ABI.
preset_of() {
  case $1 in
    arm64-v8a) echo android-arm64 ;;
    x86_64) echo android-x86_64 ;;
    *) fail "there is no ABI $1; the ABIs are arm64-v8a and x86_64" ;;
  esac
}

# abi_of PRESET: the ABI that a preset builds for.
abi_of() {
  case $1 in
    android-arm64) echo arm64-v8a ;;
    android-x86_64) echo x86_64 ;;
  esac
}

# configure_android PRESET [-DNAME=VALUE...]: configures for the NDK in use, from the start where the build folder is that
# of another one.
configure_android() {
  local preset=$1 built_by
  shift
  built_by=$(sed -n 's/^KYFACE_NDK:[A-Z]*=//p' "build/$preset/CMakeCache.txt" 2>/dev/null || true)
  [ -z "$built_by" ] || [ "$built_by" = "$(realpath "$ndk")" ] || set -- --fresh "$@"
  cmake --preset "$preset" -Wno-dev --log-level=WARNING "$@" >&2
}

# build_android PRESET [TARGET...]: configures and builds; without a target, everything.
build_android() {
  local preset=$1
  shift
  say "building for $preset"
  configure_android "$preset" || return 1
  cmake --build --preset "$preset" ${1:+--target "$@"} >&2
}
