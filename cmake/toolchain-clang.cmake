# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# This machine's own architecture, with clang.
include(${CMAKE_CURRENT_LIST_DIR}/clang.cmake)
