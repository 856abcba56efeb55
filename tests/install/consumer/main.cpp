// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include <fastcv/fastcv.h>

using namespace HPC::fastcv;

int main() {
  unsigned char bgr[] = {0, 0, 0, 255, 255, 255}, gray[] = {1, 2};
  const Mat<unsigned char, 3, ECO_ENV_ARM> src(2, 1, bgr);
  Mat<unsigned char, 1, ECO_ENV_ARM> dst(2, 1, gray);
  const auto status = cvtColor<CVT_BGR2GRAY, unsigned char, 3, unsigned char, 1, ECO_ENV_ARM>(src, &dst);
  return status == HPC_SUCCESS && gray[0] == 0 && gray[1] == 255 ? 0 : 1;
}
