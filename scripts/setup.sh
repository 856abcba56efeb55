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
# model in .deps/models out of published weights; and `android-java`, which brings Android's own framework classes for the
# tests of that label. Nothing else needs the last two. Packages that are there already are left
# alone, and nothing is asked when all are. Packages of this machine are installed with apt-get (through sudo when not
# root). Packages of 64-bit Arm are unpacked into .deps/arm64: installing them would pull this system's own packages
# along.
# shellcheck source=scripts/common.sh
source "$(dirname "${BASH_SOURCE[0]}")/common.sh"

packages_host=(
  cmake ninja-build g++        # the build
  libsimde-dev                 # NEON intrinsics on x86-64
  libdlib-dev                  # the open engine
  libdlib-data                 # its landmark model, for the demo and the tests
  googletest                   # sources; the tests are built from them for both presets
  libopencv-imgproc-dev        # the conformity test's second opinion
  openjdk-17-jdk-headless      # javac, JNI headers and the virtual machine
  junit4                       # the tests in the virtual machine
  libjetbrains-annotations-java # nullability annotations, for the compiler only
  python3                      # the tests that look at what was built; scripts/bench
)
packages_aarch64=(
  "${packages_host[@]}"
  clang-19 lld-19 llvm-19      # the compiler family of Android's NDK
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
  clang-format-19 clang-tidy-19
)
packages_fuzz=(
  "${packages_host[@]}"
  clang-19 lld-19 llvm-19
  libclang-rt-19-dev           # libFuzzer, the sanitizers, coverage
)
packages_coverage=("${packages_fuzz[@]}")
packages_bench=(
  "${packages_aarch64[@]}"
  libbenchmark-dev                  # times on this machine
  libyuv-dev libopencv-imgproc-dev  # the peers
)

# Unpacked for 64-bit Arm: a root folder that qemu-aarch64 takes with -L.
arm64_aarch64=(
  libdlib-dev                                 # the open engine's static library
  openjdk-17-jre-headless                     # the virtual machine,
  libc6 libgcc-s1 libstdc++6 zlib1g           # what it is linked with,
  liblcms2-2 libjpeg62-turbo                  # and what it reads pictures with
)
arm64_bench=(
  "${arm64_aarch64[@]}"
  libyuv-dev libyuv0                                                # the peers,
  libopencv-core-dev libopencv-imgproc-dev
  libopencv-core406 libopencv-imgproc406 libtbb12                   # and what they are linked with
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

# install_packages NAME...: installs those that are missing.
install_packages() {
  local installed missing=() name
  installed=" $(dpkg-query -W -f '${db:Status-Abbrev}${binary:Package}\n' 2>/dev/null |
    sed -n 's/^ii *\([^:]*\).*/\1/p' | tr '\n' ' ') "
  for name in "$@"; do
    case $installed in
      *" $name "*) ;;
      *) missing+=("$name") ;;
    esac
  done
  [ ${#missing[@]} -gt 0 ] || return 0

  say "installing ${missing[*]}"
  # Package lists may be absent or out of date: fetch them when a first attempt fails, not before.
  local install=(apt-get install -y -q --no-install-recommends "${missing[@]}")
  if ! as_root "${install[@]}" >&2; then
    say "trying again with fresh package lists"
    as_root apt-get update -q >&2
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
  local record=$deps/arm64.packages missing=() name work
  mkdir -p "$arm64_root"
  exec 9>"$deps/lock"
  flock 9 # another script may be at it
  touch "$record"
  for name in "$@"; do
    grep -qx "$name" "$record" || missing+=("$name")
  done
  if [ ${#missing[@]} -eq 0 ]; then
    exec 9>&-
    return 0
  fi

  say "unpacking ${missing[*]} for arm64 into .deps/arm64"
  work=$deps/apt
  rm -rf "$work"
  mkdir -p "$work"/lists/partial "$work"/cache/archives/partial "$work"/packages
  : >"$work/status"
  local apt=(apt-get -q -o APT::Architecture=arm64 -o APT::Architectures=arm64
    -o Dir::State="$work" -o Dir::State::Lists="$work/lists" -o Dir::State::status="$work/status"
    -o Dir::Cache="$work/cache" -o Acquire::Languages=none -o APT::Sandbox::User=root)
  # A source without arm64 packages is no obstacle as long as another has what is needed.
  "${apt[@]}" update >&2 || say "not every package source could be read"
  (cd "$work/packages" && "${apt[@]}" download "${missing[@]}" >&2) ||
    fail "could not download ${missing[*]} for arm64 from this system's package sources"
  for name in "$work"/packages/*.deb; do
    dpkg-deb -x "$name" "$arm64_root"
  done
  relink "$arm64_root"
  printf '%s\n' "${missing[@]}" >>"$record"
  rm -rf "$work"
  exec 9>&-
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
  [ ! -e "$deps/dlib/dlib/revision.h" ] || return 0
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
  mkdir -p "$deps/pictures"
  cp "$work"/package/demo/sample?.jpg "$deps/pictures/"
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

# fetch_android_java: Android's framework classes, what runs them on a desktop, and the Kotlin compiler, into
# .deps/android-java: the files of tests/android_java/pom.xml, as jars.sha256 beside it has them.
fetch_android_java() {
  local folder=$deps/android-java work=$deps/android-java.new
  local sums=$root/tests/android_java/jars.sha256
  mkdir -p "$deps"
  exec 9>"$deps/lock"
  flock 9 # another script may be at it
  if ! cmp -s "$sums" "$folder/complete"; then
    say "fetching Android's framework classes and the Kotlin compiler into .deps/android-java"
    rm -rf "$folder" "$work"
    mkdir -p "$work"
    mvn -B -q -f tests/android_java/pom.xml -Dmaven.repo.local="$work/repository" -DoutputDirectory="$work/jars" \
      org.apache.maven.plugins:maven-dependency-plugin:3.6.1:copy >&2 ||
      fail "Maven could not fetch Android's framework classes; the tests that take them are skipped"
    (cd "$work/jars" && sha256sum --quiet -c "$sums" >&2) || fail "the files that Maven fetched are not those expected"
    cp "$sums" "$work/jars/complete"
    mv "$work/jars" "$folder"
    rm -rf "$work"
  fi
  exec 9>&-
}

command -v apt-get >/dev/null || fail "this needs a Debian system (Debian 12 or later): there is no apt-get"
[ $# -gt 0 ] || set -- host aarch64
packages=() arm64=() models='' android_java='' dlib='' pictures=''
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
    dlib) dlib=1 ;;
    pictures) packages+=("${packages_host[@]}") pictures=1 ;;
    *)
      fail "there is no group \"$group\"; the groups are host, aarch64, android-java, bench, coverage, dlib, fuzz, lint," \
        "models and pictures"
      ;;
  esac
done
readarray -t packages < <(printf '%s\n' "${packages[@]}" | awk '!seen[$0]++')
install_packages "${packages[@]}"
[ ${#arm64[@]} -eq 0 ] || unpack_arm64 "${arm64[@]}"
[ -z "$models" ] || make_models
[ -z "$android_java" ] || fetch_android_java
[ -z "$dlib" ] || unpack_dlib_source
[ -z "$pictures" ] || unpack_pictures
