// Native methods of FaceLibrary over the frame helpers.
#include <jni.h>

#include "frame.h"
#include "pinned.h"

namespace {

/// The `format` argument of the frame helpers.
enum FrameFormat { kNv12 = 2, kNv21 = 3 };

}  // namespace

extern "C" {

JNIEXPORT void JNICALL Java_com_vantrel_faceapi_FaceLibrary_convertColorSpace(JNIEnv* env, jobject /*thiz*/,
                                                                              jbyteArray src, jint width,
                                                                              jint height, jbyteArray dst,
                                                                              jint code) {
  if (src == nullptr || dst == nullptr) {
    return;
  }
  kyface::PinnedArray in(env, src);
  if (!in) {
    return;
  }
  kyface::PinnedArray out(env, dst);
  if (!out) {
    return;
  }
  switch (code) {
    case 1:
      nv2BGR(in.bytes(), kNv21, width, height, out.bytes());
      break;
    case 2:
      nv2RGB(in.bytes(), kNv21, width, height, out.bytes());
      break;
    case 3:
      RGB2nv(in.bytes(), kNv21, width, height, out.bytes());
      break;
    case 5:
      nv2BGR(in.bytes(), kNv12, width, height, out.bytes());
      break;
    case 20:
      RGB2nv(in.bytes(), kNv12, width, height, out.bytes());
      break;
    case 1001:
      nv212BGR(in.bytes(), kNv21, width, height, out.bytes());
      break;
    default:
      break;
  }
  in.release();
  out.release();
}

}  // extern "C"
