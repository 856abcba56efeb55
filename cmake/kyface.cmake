# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# Compile and link options shared by the project's targets.

# Checks built into everything, tests included: what -fsanitize takes.
set(KYFACE_SANITIZE "" CACHE STRING "Sanitizers to build with")
set(kyface_instrumented OFF)
if(KYFACE_SANITIZE)
  set(kyface_instrumented ON)
  add_compile_options(-fsanitize=${KYFACE_SANITIZE} -fno-sanitize-recover=all -fno-omit-frame-pointer -g1)
  add_link_options(-fsanitize=${KYFACE_SANITIZE})
endif()

# Counters of the lines and branches that run. Those of a process that ends by assertion count too: they are kept in
# the file itself (continuous mode), which takes counters that can be relocated.
option(KYFACE_COVERAGE "Count the lines and branches of the library that run; takes clang" OFF)
add_library(kyface_coverage INTERFACE)
if(KYFACE_COVERAGE)
  set(kyface_instrumented ON)
  target_compile_options(kyface_coverage INTERFACE -fprofile-instr-generate -fcoverage-mapping
                                                   "SHELL:-mllvm -runtime-counter-relocation")
  target_link_options(kyface_coverage INTERFACE -fprofile-instr-generate)
endif()

# An instrumented build is hardly optimised, and clang would complain of loops that ask to be.
if(kyface_instrumented)
  add_compile_options($<$<COMPILE_LANG_AND_ID:CXX,Clang>:-Wno-pass-failed>)
endif()

# Systems with pages of 16 KB load nothing that is aligned to less.
add_link_options(-Wl,-z,max-page-size=16384)

# Programs for Android are run by a script, on a device or by what takes the place of one, and find their libraries by
# what it tells the loader.
if(ANDROID)
  set(CMAKE_CROSSCOMPILING_EMULATOR ${PROJECT_SOURCE_DIR}/scripts/device run ${ANDROID_ABI} ${PROJECT_BINARY_DIR})
  set(CMAKE_SKIP_BUILD_RPATH ON)
endif()

# What every target of the project is compiled with. Warnings are errors where this project is what is built; for who
# builds it as a part, a new compiler's new warning is none of their business. NDKs bring compilers of many releases: there
# only the library's own sources must please them.
option(KYFACE_WERROR "Treat warnings as errors" ${PROJECT_IS_TOP_LEVEL})
set(kyface_werror $<$<BOOL:${KYFACE_WERROR}>:-Werror>)
add_library(kyface_warnings INTERFACE)
target_compile_options(kyface_warnings INTERFACE -Wall -Wextra -Wpedantic -Wshadow -Wcast-qual -Wvla
                                                 $<$<NOT:$<BOOL:${ANDROID}>>:${kyface_werror}>)

# The arithmetic that everything here is compiled to, tests included. On x86-64 FMA keeps the kernels' fused
# multiply-adds fused. Contraction is off so that only the written fused multiply-adds fuse.
add_library(kyface_arithmetic INTERFACE)
target_compile_options(kyface_arithmetic INTERFACE -ffp-contract=off -fno-math-errno)
if(CMAKE_SYSTEM_PROCESSOR MATCHES "x86_64|AMD64")
  # With clang vectors of 8 bytes would take MMX, after which a caller's long double is NaN.
  target_compile_options(kyface_arithmetic INTERFACE -mavx2 -mfma $<$<CXX_COMPILER_ID:Clang>:-mno-mmx>)
endif()

# What the shipped library is compiled with.
add_library(kyface_options INTERFACE)
target_compile_options(kyface_options INTERFACE ${kyface_werror} $<$<COMPILE_LANGUAGE:CXX>:-fno-exceptions -fno-rtti
                                                -fvisibility-inlines-hidden> -fvisibility=hidden)
target_link_libraries(kyface_options INTERFACE kyface_warnings kyface_arithmetic kyface_coverage)
if(ANDROID)
  # What an NDK's compiler notes for a debugger names no folder of the machine that it ran on: the same sources give the
  # same bytes everywhere.
  set(kyface_prefix_map -ffile-prefix-map=${PROJECT_SOURCE_DIR}/= -ffile-prefix-map=${KYFACE_NDK}=ndk)
  target_compile_options(kyface_options INTERFACE ${kyface_prefix_map})
endif()

# Hardening of a shared library: read-only relocations, everything bound at load, nothing left undefined.
add_library(kyface_link INTERFACE)
target_link_options(kyface_link INTERFACE -Wl,-z,relro -Wl,-z,now -Wl,--build-id=sha1)
if(NOT KYFACE_SANITIZE)
  # With clang the checks' run-time is in the program alone.
  target_link_options(kyface_link INTERFACE -Wl,-z,defs)
endif()

# The JNI headers. They hold nothing of an architecture, so a cross build takes them from this machine's JDK.
if(kyface_desktop)
  file(GLOB kyface_jdks /usr/lib/jvm/*)
  find_path(KYFACE_JNI_INCLUDE jni.h HINTS ENV JAVA_HOME PATHS /usr/lib/jvm/default-java ${kyface_jdks}
            PATH_SUFFIXES include NO_CMAKE_FIND_ROOT_PATH REQUIRED)
  add_library(kyface_jni INTERFACE)
  target_include_directories(kyface_jni SYSTEM INTERFACE ${KYFACE_JNI_INCLUDE} ${KYFACE_JNI_INCLUDE}/linux)
endif()
