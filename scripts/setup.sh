#!/usr/bin/env bash
# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# Installs what building and testing need: the one place of the project that does.
#
#   scripts/setup.sh [group...]
#
# Groups are `host` and `aarch64`, named after the build presets that need them, both without an argument; `bench`,
# `coverage`, `fuzz` and `lint`, which add what the scripts of these names need; `dlib`, its sources in .deps/dlib for an
# engine on Android; `pictures`, the photographs that scripts/accuracy looks at; `models`, which makes the verifier's
# model in .deps/models out of published weights; `android-java`, which brings Android's own framework classes for the
# tests of that label; `fuzz-java`, the fuzzer of scripts/fuzz --java; and `opencv`, a newer OpenCV than the packaged one
# in .deps/opencv, for a column of scripts/bench. Nothing else needs the last four. Packages that are there already are
# left alone, and nothing is asked when all are. Packages of this machine are installed with apt-get (through sudo when
# not root). Packages of 64-bit Arm are unpacked into .deps/arm64: installing them would pull this system's own packages
# along. Names differ from one Debian to the next:
#
#   a|b         one of these: any that is there, or the first that can be had
#   clang-LLVM  with the version of LLVM's packages that there is, by cmake/llvm-versions
#   a:pattern   (64-bit Arm) the packages that package a depends on whose names match
# shellcheck source=scripts/common.sh
source "$(dirname "${BASH_SOURCE[0]}")/common.sh"

packages_host=(
  cmake ninja-build g++        # the build
  libdlib-dev                  # the open engine
  libdlib-data                 # its landmark model, for the demo and the tests
  googletest                   # sources; the tests are built from them for both presets
  libopencv-imgproc-dev        # the conformity test's second opinion
  'java17-sdk-headless|default-jdk-headless' # javac, JNI headers and the virtual machine: any JDK from 17 on
  junit4                       # the tests in the virtual machine
  libjetbrains-annotations-java # nullability annotations, for the compiler only
  python3                      # the tests that look at what was built; scripts/bench
)
packages_aarch64=(
  "${packages_host[@]}"
  clang-LLVM lld-LLVM llvm-LLVM # the compiler family of Android's NDK
  g++-aarch64-linux-gnu        # the C and C++ libraries that it compiles and links against
  qemu-user                    # runs the result
)
packages_models=(
  python3                      # the conversion
  libdlib-data                 # landmarks, which go into the same file
)
packages_android_java=(
  "${packages_host[@]}"
  maven                        # fetches the rest
)
packages_lint=(
  "${packages_aarch64[@]}"
  clang-format-LLVM clang-tidy-LLVM
  shellcheck                   # the scripts
)
packages_fuzz=(
  "${packages_host[@]}"
  clang-LLVM lld-LLVM llvm-LLVM
  libclang-rt-LLVM-dev         # libFuzzer, the sanitizers, coverage
)
packages_coverage=("${packages_fuzz[@]}")
packages_bench=(
  "${packages_aarch64[@]}"
  libyuv-dev libopencv-imgproc-dev  # the peers
)

# Unpacked for 64-bit Arm: a root folder that qemu-aarch64 takes with -L.
arm64_aarch64=(
  libdlib-dev                                 # the open engine's static library
  'default-jre-headless:openjdk-.*'           # the virtual machine,
  libc6 libgcc-s1 libstdc++6 zlib1g           # what it is linked with,
  liblcms2-2 libjpeg62-turbo                  # and what it reads pictures with
)
arm64_bench=(
  "${arm64_aarch64[@]}"
  libyuv-dev 'libyuv-dev:libyuv[0-9]+'                              # the peers,
  libopencv-core-dev 'libopencv-core-dev:libopencv-core[0-9].*'
  libopencv-imgproc-dev 'libopencv-imgproc-dev:libopencv-imgproc[0-9].*'
  libtbb12                                                          # and what they are linked with
  libblas3 liblapack3 libgfortran5
  libglx0 libglvnd0 libx11-6 libxcb1 libxau6 libxdmcp6 libbsd0 libmd0
)

deps=$root/.deps
arm64_root=$deps/arm64

as_root() {
  if [ "$(id -u)" -eq 0 ]; then
    env DEBIAN_FRONTEND=noninteractive "$@"
  elif command -v sudo >/dev/null; then
    sudo env DEBIAN_FRONTEND=noninteractive "$@"
  else
    fail "installing packages needs root: run this as root, or install sudo"
  fi
}

# The packages that are installed and what they provide, each between spaces.
installed=" $(dpkg-query -W -f '${db:Status-Abbrev}${Package}, ${Provides}\n' 2>/dev/null |
  sed -n 's/^ii *//p' | sed 's/([^)]*)//g' | tr -s ', \n' ' ') "
is_installed() { [[ $installed == *" $1 "* ]]; }

# Package lists may be absent or out of date: they are fetched when something is not in them, not before, and once.
fresh_lists=
fetch_lists() {
  [ -z "$fresh_lists" ] || return 1
  say "fetching package lists"
  as_root apt-get update -q >&2 || return 1
  fresh_lists=yes
}

# first_available NAME...: sets $available to the first package of these that the package lists have.
first_available() {
  while :; do
    for available in "$@"; do
      [ -z "$(apt-cache show --no-all-versions "$available" 2>/dev/null)" ] || return 0
    done
    fetch_lists || return 1
  done
}

# choose_llvm: sets $llvm to the version of LLVM's packages.
choose_llvm() {
  local versions
  readarray -t versions <cmake/llvm-versions
  llvm=${versions[0]}
  ! is_installed "clang-$llvm" || return 0
  if first_available "${versions[@]/#/clang-}"; then
    llvm=${available#clang-}
  else
    fail "there is no package of clang from 16 on"
  fi
}

# install_packages NAME...: installs those that are missing.
install_packages() {
  local missing=() name alternatives alternative
  for name in "$@"; do
    IFS='|' read -r -a alternatives <<<"$name"
    for alternative in "${alternatives[@]}"; do
      ! is_installed "$alternative" || continue 2
    done
    if [ ${#alternatives[@]} -gt 1 ]; then
      first_available "${alternatives[@]}" || fail "there is no package of $name"
      missing+=("$available")
    else
      missing+=("$name")
    fi
  done
  [ ${#missing[@]} -gt 0 ] || return 0

  say "installing ${missing[*]}"
  local install=(apt-get install -y -q --no-install-recommends "${missing[@]}")
  if ! as_root "${install[@]}" >&2; then
    fetch_lists || fail "could not install ${missing[*]}"
    as_root "${install[@]}" >&2 || fail "could not install ${missing[*]}"
  fi
}

# relink FOLDER: makes symbolic links from one file of an unpacked system to another relative, since absolute ones
# would lead into this machine's own system.
relink() {
  local link target
  while IFS= read -r -d '' link; do
    target=$1$(readlink "$link")
    [ ! -e "$target" ] || ln -sfn "$(realpath -s --relative-to="$(dirname "$link")" "$target")" "$link"
  done < <(find "$1" -type l -lname '/*' -print0)
}

# unpack_arm64 NAME...: unpacks those that are missing into .deps/arm64. apt-get is given the other architecture,
# an empty list of installed packages and folders of its own on the command line, so that this system's
# configuration stays as it is and no root is needed.
unpack_arm64() {
  local record=$deps/arm64.packages missing=() names=() found name work
  mkdir -p "$arm64_root"
  touch "$record"
  for name in "$@"; do
    grep -qxF "$name" "$record" || missing+=("$name")
  done
  [ ${#missing[@]} -gt 0 ] || return 0

  say "unpacking packages of arm64 into .deps/arm64"
  work=$deps/apt
  rm -rf "$work"
  mkdir -p "$work"/lists/partial "$work"/cache/archives/partial "$work"/packages
  : >"$work/status"
  local apt=(apt-get -q -o APT::Architecture=arm64 -o APT::Architectures=arm64
    -o Dir::State="$work" -o Dir::State::Lists="$work/lists" -o Dir::State::status="$work/status"
    -o Dir::Cache="$work/cache" -o Acquire::Languages=none -o APT::Sandbox::User=root)
  # A source without arm64 packages is no obstacle as long as another has what is needed.
  "${apt[@]}" update >&2 || say "not every package source could be read"
  for name in "${missing[@]}"; do
    case $name in
      *:*)
        readarray -t found < <(apt-cache "${apt[@]:1}" depends --important "${name%%:*}" |
          sed -nE "s/^ *\|?Depends: (${name#*:})$/\1/p")
        [ ${#found[@]} -gt 0 ] || fail "${name%%:*} of arm64 depends on nothing like ${name#*:}"
        names+=("${found[@]}")
        ;;
      *) names+=("$name") ;;
    esac
  done
  (cd "$work/packages" && "${apt[@]}" download "${names[@]}" >&2) ||
    fail "could not download ${names[*]} for arm64 from this system's package sources"
  for name in "$work"/packages/*.deb; do
    dpkg-deb -x "$name" "$arm64_root"
  done
  relink "$arm64_root"
  printf '%s\n' "${missing[@]}" >>"$record"
  rm -rf "$work"
}

# The weights of dlib's face descriptor, as an npm package carries them. They are neither committed nor packaged: whoever
# wants them fetches them, and reads what is written beside them.
descriptor_package=@vladmandic/face-api
descriptor_version=1.7.15
descriptor_sha256=0d77fffeef362ef9c0939cf6c567f3a2e8e177f114fa257a3270cbd2e509b031
landmarks=/usr/share/dlib/shape_predictor_68_face_landmarks.dat

# unpack_descriptor_package WORK PATH...: fetches the package and unpacks some of it into the folder WORK.
unpack_descriptor_package() {
  local work=$1
  shift
  command -v npm >/dev/null || fail "$descriptor_package comes from npm, and there is no npm here"
  say "fetching $descriptor_package $descriptor_version from npm"
  (cd "$work" && npm pack --silent "$descriptor_package@$descriptor_version" >package.name) ||
    fail "could not fetch $descriptor_package $descriptor_version"
  echo "$descriptor_sha256  $work/$(cat "$work/package.name")" | sha256sum --check --status ||
    fail "$descriptor_package $descriptor_version is not the package that it was: its checksum differs"
  tar -xzf "$work/$(cat "$work/package.name")" -C "$work" "$@"
}

# unpack_dlib_source: puts Debian's source package of dlib, without the models that come with it, into .deps/dlib. It is
# found through this system's own package sources.
unpack_dlib_source() {
  [ ! -e "$deps/dlib/dlib/revision.h.in" ] || return 0
  local work file uri name size sum
  mkdir -p "$deps"
  work=$(mktemp -d "$deps/dlib.XXXXXX")
  mkdir -p "$work"/parts "$work"/lists/partial "$work"/cache/archives/partial
  for file in /etc/apt/sources.list /etc/apt/sources.list.d/*; do
    case $file in
      *.list) [ ! -e "$file" ] || sed -n 's/^deb /deb-src /p' "$file" >"$work/parts/$(basename "$file")" ;;
      *.sources) sed 's/^Types:.*/Types: deb-src/' "$file" >"$work/parts/$(basename "$file")" ;;
    esac
  done
  local apt=(apt-get -q -o Dir::Etc::sourcelist=/dev/null -o Dir::Etc::sourceparts="$work/parts"
    -o Dir::State::Lists="$work/lists" -o Dir::Cache="$work/cache" -o APT::Sandbox::User=root)
  say "fetching the sources of dlib"
  "${apt[@]}" update >&2 || say "not every package source could be read"
  read -r uri name size sum < <("${apt[@]}" source --print-uris dlib | tr -d "'" | grep -E 'dlib_[^ /]*[.]orig[.]tar[^ /]* ') ||
    fail "this system's package sources have no sources of dlib"
  /usr/lib/apt/apt-helper download-file "$uri" "$work/$name" "$sum" >&2 ||
    fail "could not fetch the $size bytes of $name"
  mkdir "$work/dlib"
  tar -xf "$work/$name" -C "$work/dlib" --strip-components=1 --wildcards '*/dlib/*' '*/examples/faces/*' '*/LICENSE.txt'
  rm -rf "$deps/dlib"
  mv "$work/dlib" "$deps/dlib"
  rm -rf "$work"
}

# What scripts/accuracy looks at: photographs that others publish with their software. None is committed or packaged.
unpack_pictures() {
  unpack_dlib_source
  [ ! -e "$deps/pictures/sample6.jpg" ] || return 0
  local work
  work=$(mktemp -d "$deps/pictures.XXXXXX")
  unpack_descriptor_package "$work" package/demo
  mkdir "$work/pictures"
  cp "$work"/package/demo/sample?.jpg "$work/pictures/"
  rm -rf "$deps/pictures"
  mv "$work/pictures" "$deps/pictures"
  rm -rf "$work"
}

make_models() {
  local models=$deps/models work
  ! grep -q "$descriptor_sha256" "$models/ORIGIN.txt" 2>/dev/null || return 0
  mkdir -p "$deps"
  work=$(mktemp -d "$deps/models.XXXXXX")
  unpack_descriptor_package "$work" package/model package/LICENSE
  mkdir "$work/models"
  python3 engine/tool/make_verifier_model.py "$work/package/model" "$work/models/descriptor.kym"
  python3 engine/tool/make_verifier_model.py "$work/package/model" "$work/models/verifier.kym" --landmarks "$landmarks"
  cp "$work/package/LICENSE" "$work/models/LICENSE.txt"
  cat >"$work/models/ORIGIN.txt" <<END
descriptor.kym  dlib's face descriptor (dlib_face_recognition_resnet_model_v1), converted
verifier.kym    the same, and dlib's landmarks of 68 points behind it

The weights come from the npm package $descriptor_package $descriptor_version
(model/face_recognition_model, sha256 of the package $descriptor_sha256),
which is under the licence in LICENSE.txt. It carries them in a form whose numbers are quantised to bytes but for some.
The network and its training are dlib's, whose author put the weights into the public domain.

The descriptor was trained with about 3 million pictures of 7485 persons, put together from collections for research
(FaceScrub and VGG among them) and from pictures found on the internet. The persons in such collections were not asked,
and most of them are adults and well known: with children, and with peoples whose pictures are few there, it errs more
often than the figures that are quoted for it say. Find out how often before relying on it.

The landmarks come from Debian's package libdlib-data. They were trained with the iBUG 300-W pictures, whose licence
excludes commercial use.
END
  rm -rf "$models"
  mv "$work/models" "$models"
  rm -rf "$work"
  say "the verifier's models are in .deps/models"
}

# fetch_jars NAME FOLDER WHAT WITHOUT: the files of FOLDER/pom.xml into .deps/NAME, as jars.sha256 beside it has them.
fetch_jars() {
  local name=$1 from=$2 what=$3 without=$4
  local folder=$deps/$name work=$deps/$name.new sums=$root/$2/jars.sha256
  if ! cmp -s "$sums" "$folder/complete"; then
    say "fetching $what into .deps/$name"
    rm -rf "$folder" "$work"
    mkdir -p "$work"
    mvn -B -q -f "$from/pom.xml" -Dmaven.repo.local="$work/repository" -DoutputDirectory="$work/jars" \
      org.apache.maven.plugins:maven-dependency-plugin:3.6.1:copy >&2 ||
      fail "Maven could not fetch $what; $without"
    (cd "$work/jars" && sha256sum --quiet -c "$sums" >&2) || fail "the files that Maven fetched are not those expected"
    cp "$sums" "$work/jars/complete"
    mv "$work/jars" "$folder"
    rm -rf "$work"
  fi
}

# fetch_opencv: OpenCV for Python, as bench/newer_opencv.txt has it, into .deps/opencv.
fetch_opencv() {
  local folder=$deps/opencv work
  ! cmp -s bench/newer_opencv.txt "$folder/complete" || return 0
  say "fetching OpenCV for Python into .deps/opencv"
  mkdir -p "$deps"
  work=$(mktemp -d "$deps/opencv.XXXXXX")
  local install=(python3 -m pip install --quiet --disable-pip-version-check --root-user-action ignore --no-deps
    --only-binary :all: --require-hashes --target "$work" --requirement bench/newer_opencv.txt)
  if ! "${install[@]}" >&2 || ! PYTHONPATH=$work python3 -c 'import cv2' >&2; then
    rm -rf "$work"
    fail "OpenCV for Python could not be had; without it scripts/bench leaves its column out"
  fi
  cp bench/newer_opencv.txt "$work/complete"
  rm -rf "$folder"
  mv "$work" "$folder"
}

command -v apt-get >/dev/null || fail "this needs a Debian system (Debian 12 or later): there is no apt-get"
[ $# -gt 0 ] || set -- host aarch64
packages=() arm64=() models='' android_java='' fuzz_java='' dlib='' opencv='' pictures=''
for group in "$@"; do
  case $group in
    host) packages+=("${packages_host[@]}") ;;
    aarch64) packages+=("${packages_aarch64[@]}") arm64+=("${arm64_aarch64[@]}") ;;
    lint) packages+=("${packages_lint[@]}") arm64+=("${arm64_aarch64[@]}") ;;
    fuzz) packages+=("${packages_fuzz[@]}") ;;
    coverage) packages+=("${packages_coverage[@]}") ;;
    bench) packages+=("${packages_bench[@]}") arm64+=("${arm64_bench[@]}") ;;
    models) packages+=("${packages_models[@]}") models=1 ;;
    android-java) packages+=("${packages_android_java[@]}") android_java=1 ;;
    fuzz-java) packages+=("${packages_android_java[@]}") fuzz_java=1 ;;
    dlib) dlib=1 ;;
    opencv)
      # Any Python with these will do, Debian's or another.
      python3 -c 'import numpy, pip' 2>/dev/null || packages+=(python3-numpy python3-pip)
      opencv=1
      ;;
    pictures) packages+=("${packages_host[@]}") pictures=1 ;;
    *)
      fail "there is no group \"$group\"; the groups are host, aarch64, android-java, bench, coverage, dlib, fuzz," \
        "fuzz-java, lint, models, opencv and pictures"
      ;;
  esac
done
readarray -t packages < <(printf '%s\n' "${packages[@]}" | awk 'NF && !seen[$0]++')
if [[ ${packages[*]} == *LLVM* ]]; then
  choose_llvm
  packages=("${packages[@]//LLVM/$llvm}")
fi
install_packages "${packages[@]}"

# Into .deps one script at a time puts something, each thing under its own name when it is whole; what one that was ended
# left is of no use.
if [ -n "${arm64[*]}$models$android_java$fuzz_java$dlib$opencv$pictures" ]; then
  alone .deps/contents
  rm -rf "$deps"/{dlib,pictures,models,opencv}.?????? "$deps"/{android-java,fuzz-java}.new
fi
if [ ${#arm64[@]} -gt 0 ]; then
  readarray -t arm64 < <(printf '%s\n' "${arm64[@]}" | awk '!seen[$0]++')
  unpack_arm64 "${arm64[@]}"
fi
[ -z "$models" ] || make_models
[ -z "$android_java" ] ||
  fetch_jars android-java tests/android_java "Android's framework classes and the Kotlin compiler" \
    "the tests that take them are skipped"
[ -z "$fuzz_java" ] || fetch_jars fuzz-java fuzz/java "the fuzzer of the Java classes" "they are not fuzzed"
[ -z "$dlib" ] || unpack_dlib_source
[ -z "$opencv" ] || fetch_opencv
[ -z "$pictures" ] || unpack_pictures
