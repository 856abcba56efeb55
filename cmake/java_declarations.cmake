# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# kyface_java_declarations: what javac makes of the native methods and the constants of the Java classes, for the bridge
# and its tests. Without tests a build for Android does without a JDK: the bridge itself compiles without them.
if(ANDROID AND NOT KYFACE_TESTS)
  set(required QUIET)
else()
  set(required REQUIRED)
endif()
find_package(Java 17 ${required} COMPONENTS Development)
# Nullability annotations for Kotlin: read by compilers from the class files, not needed at run time.
find_file(KYFACE_ANNOTATIONS_JAR org.jetbrains.annotations-java8.jar PATHS /usr/share/java NO_CMAKE_FIND_ROOT_PATH
          ${required})

add_library(kyface_java_declarations INTERFACE)
if(Java_JAVAC_EXECUTABLE AND KYFACE_ANNOTATIONS_JAR)
  set(declarations ${PROJECT_BINARY_DIR}/java_declarations)
  set(headers)
  foreach(class BrightnessMetric ColorConversion FaceLibrary PixelConversion PlaneConversion)
    list(APPEND headers ${declarations}/com_vantrel_faceapi_${class}.h)
  endforeach()
  file(GLOB_RECURSE sources CONFIGURE_DEPENDS ${PROJECT_SOURCE_DIR}/java/*.java ${PROJECT_SOURCE_DIR}/platform/java/*.java)
  add_custom_command(
    OUTPUT ${headers}
    COMMAND ${Java_JAVAC_EXECUTABLE} --release 8 -Xlint:-options -encoding UTF-8 -cp ${KYFACE_ANNOTATIONS_JAR}
            -h ${declarations} -d ${declarations}/classes ${sources}
    DEPENDS ${sources}
    COMMENT "Declaring native methods"
    VERBATIM)
  add_custom_target(kyface_java_headers DEPENDS ${headers})
  add_dependencies(kyface_java_declarations kyface_java_headers)
  target_compile_definitions(kyface_java_declarations INTERFACE KYFACE_JAVA_DECLARATIONS)
  target_include_directories(kyface_java_declarations SYSTEM INTERFACE ${declarations})
endif()
