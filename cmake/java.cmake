# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# Java: sources to jars, and the JVM that runs them.
#
# Class files are of Java 8, the level that every Android project takes; what a later JDK says about the age of that
# level is no finding.
find_package(Java 17 REQUIRED COMPONENTS Development Runtime)

# All findings of the compiler are errors, but for some of later JDKs: that a constructor lets a subclass see an object
# that is not finished (from 21 on).
set(kyface_lint all,-options)
if(Java_VERSION VERSION_GREATER_EQUAL 21)
  string(APPEND kyface_lint ",-this-escape")
endif()

# ${KYFACE_JAVA} runs Java for the architecture of this build, with this build's libraries. A cross build runs the
# JVM of the unpacked arm64 packages under emulation, where the simple compiler and collector pay, and
# where a program is started without the JDK's helper program, which this machine could not execute.
set(KYFACE_JAVA ${CMAKE_BINARY_DIR}/bin/java)
if(CMAKE_CROSSCOMPILING)
  set(arm64_root ${PROJECT_SOURCE_DIR}/.deps/arm64)
  file(GLOB java_programs ${arm64_root}/usr/lib/jvm/java-*-openjdk-arm64/bin/java)
  list(SORT java_programs COMPARE NATURAL ORDER DESCENDING)
  list(GET java_programs 0 java_program)
  if(NOT java_program)
    message(FATAL_ERROR "There is no Java for arm64 in .deps. Run scripts/setup.sh, which unpacks it.")
  endif()
  set(java_command "qemu-aarch64 -cpu cortex-a76 -L '${arm64_root}' '${java_program}' -XX:+UseSerialGC \
-XX:TieredStopAtLevel=1 -Djdk.lang.Process.launchMechanism=VFORK")
else()
  set(java_command "'${Java_JAVA_EXECUTABLE}'")
endif()
configure_file(${CMAKE_CURRENT_LIST_DIR}/java.sh.in ${KYFACE_JAVA} @ONLY USE_SOURCE_PERMISSIONS)

# kyface_jar(NAME sources... [DOCUMENTED] [JARS jar...]): target NAME_jar, which makes
# ${CMAKE_BINARY_DIR}/jar/NAME.jar. JARS are names given to this function before, or paths of other jars.
# With DOCUMENTED whatever is public must carry complete documentation.
function(kyface_jar name)
  cmake_parse_arguments(PARSE_ARGV 1 arg "DOCUMENTED" "" "JARS")
  set(jar ${CMAKE_BINARY_DIR}/jar/${name}.jar)
  set(classes ${CMAKE_CURRENT_BINARY_DIR}/${name}.classes)
  set(class_path)
  set(needed)
  foreach(other IN LISTS arg_JARS)
    if(TARGET ${other}_jar)
      set(file ${CMAKE_BINARY_DIR}/jar/${other}.jar)
      list(APPEND needed ${other}_jar ${file})
    else()
      set(file ${other})
    endif()
    list(APPEND class_path ${file})
  endforeach()
  set(doclint)
  if(arg_DOCUMENTED)
    set(doclint -Xdoclint:all/protected)
  endif()
  list(JOIN class_path ":" class_path)
  add_custom_command(
    OUTPUT ${jar}
    COMMAND ${CMAKE_COMMAND} -E rm -rf ${classes}
    COMMAND ${CMAKE_COMMAND} -E make_directory ${classes} ${CMAKE_BINARY_DIR}/jar
    COMMAND ${Java_JAVAC_EXECUTABLE} --release 8 -Xlint:${kyface_lint} -Werror -encoding UTF-8 -implicit:none ${doclint}
            -cp "${class_path}" -d ${classes} ${arg_UNPARSED_ARGUMENTS}
    COMMAND ${Java_JAR_EXECUTABLE} --create --file ${jar} -C ${classes} .
    DEPENDS ${arg_UNPARSED_ARGUMENTS} ${needed}
    COMMENT "Building ${name}.jar"
    VERBATIM)
  add_custom_target(${name}_jar ALL DEPENDS ${jar})
endfunction()
