# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# Builds and runs consumer/ in ${WORK}, with the library in the given way.
function(run)
  execute_process(COMMAND ${ARGN} COMMAND_ECHO STDOUT COMMAND_ERROR_IS_FATAL ANY)
endfunction()

file(REMOVE_RECURSE ${WORK})
set(options -G ${GENERATOR} -DWAY=${WAY} -DSOURCE=${SOURCE} -DVERSION=${VERSION})
if(TOOLCHAIN)
  list(APPEND options -DCMAKE_TOOLCHAIN_FILE=${TOOLCHAIN})
else()
  list(APPEND options -DCMAKE_CXX_COMPILER=${CXX} -DCMAKE_C_COMPILER=${CC})
endif()
if(WAY STREQUAL "find_package")
  run(${CMAKE_COMMAND} --install ${BUILD} --component fastcv --prefix ${WORK}/installed)
  # By its folder: a cross build looks for packages in the target's root alone. Nothing of the build is looked at.
  file(GLOB_RECURSE config ${WORK}/installed/fastcvConfig.cmake)
  cmake_path(GET config PARENT_PATH folder)
  list(APPEND options -Dfastcv_DIR=${folder})
endif()
run(${CMAKE_COMMAND} -S ${CONSUMER} -B ${WORK}/build ${options})
run(${CMAKE_COMMAND} --build ${WORK}/build --target consumer)
run(${CMAKE_CTEST_COMMAND} --test-dir ${WORK}/build --output-on-failure)
