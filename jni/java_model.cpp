// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "java_model.h"

#include <algorithm>
#include <iterator>
#include <utility>

#include "base/log.h"
#include "java_declarations.h"

namespace {

constexpr char kRectClass[] = "android/graphics/Rect";
constexpr char kPointFClass[] = "android/graphics/PointF";
constexpr char kFaceInfoClass[] = "com/vantrel/faceapi/model/FaceInfo";

/// Local references that a machine promises to every native method, and how many of them a face's points may
/// take: its rectangle, its array of points and the method's result take the others.
constexpr int kPromisedReferences = 16;
constexpr int kPromisedPoints = kPromisedReferences - 3;

/// Everything that is looked up at load. What a failed look-up leaves null is used as it is by later
/// conversions (C12 in docs/compatibility.md): the JVM has its say.
struct Registry {
  struct {
    jfieldID left, top, right, bottom;
  } rect;
  struct {
    jfieldID x, y;
  } point;
  struct {
    jfieldID score, yaw, pitch, roll, eyeDist, id, faceRect, facePoints;
  } face;
  jmethodID newPointF;
  jmethodID newRect;
  jmethodID newFaceInfo;
  jclass mPointFClass;
  jclass mRectClass;
  jclass mFaceClass;
  jclass mFaceAttrClass;  // reserved: never filled, never read
};

Registry registry;

/// One Java field and where its ID is kept.
struct field {
  const char* className;
  const char* name;
  const char* signature;
  jfieldID* id;
};

const field fields[] = {
    {kRectClass, "left", "I", &registry.rect.left},
    {kRectClass, "top", "I", &registry.rect.top},
    {kRectClass, "right", "I", &registry.rect.right},
    {kRectClass, "bottom", "I", &registry.rect.bottom},
    {kPointFClass, "x", "F", &registry.point.x},
    {kPointFClass, "y", "F", &registry.point.y},
    {kFaceInfoClass, "score", "F", &registry.face.score},
    {kFaceInfoClass, "yaw", "F", &registry.face.yaw},
    {kFaceInfoClass, "pitch", "F", &registry.face.pitch},
    {kFaceInfoClass, "roll", "F", &registry.face.roll},
    {kFaceInfoClass, "eyeDist", "F", &registry.face.eyeDist},
    {kFaceInfoClass, "id", "I", &registry.face.id},
    {kFaceInfoClass, "faceRect", "Landroid/graphics/Rect;", &registry.face.faceRect},
    {kFaceInfoClass, "facePoints", "[Landroid/graphics/PointF;", &registry.face.facePoints},
};

/// Looks up `count` fields in order, up to the first that is missing. The class references are left to the
/// caller's local frame.
int find_fields(JNIEnv* env, const field* table, int count) {
  for (int i = 0; i < count; ++i) {
    const field& entry = table[i];
    jclass owner = env->FindClass(entry.className);
    if (owner == nullptr) {
      FACE_LOG_ALWAYS(ANDROID_LOG_ERROR, "Can't find %s", entry.className);
      return -1;
    }
    jfieldID id = env->GetFieldID(owner, entry.name, entry.signature);
    if (id == nullptr) {
      FACE_LOG_ALWAYS(ANDROID_LOG_ERROR, "Can't find %s.%s", entry.className, entry.name);
      return -1;
    }
    *entry.id = id;
  }
  return 0;
}

/// Keeps a global reference to a class and looks up its constructor without arguments. The class is not
/// tested by itself: a missing one shows as a missing constructor.
bool registerClass(JNIEnv* env, const char* name, jclass* global, jmethodID* constructor) {
  jclass local = env->FindClass(name);
  *global = static_cast<jclass>(env->NewGlobalRef(local));
  *constructor = env->GetMethodID(local, "<init>", "()V");
  return *constructor != nullptr;
}

/// A local reference that is deleted at the end of the scope unless it is handed on.
template <typename Object>
class LocalRef {
 public:
  LocalRef(JNIEnv* env, Object object) : env_(env), object_(object) {}
  LocalRef(const LocalRef&) = delete;
  LocalRef& operator=(const LocalRef&) = delete;
  ~LocalRef() {
    if (object_ != nullptr) {
      env_->DeleteLocalRef(object_);
    }
  }

  explicit operator bool() const { return object_ != nullptr; }
  Object get() const { return object_; }
  Object handOn() { return std::exchange(object_, nullptr); }

 private:
  JNIEnv* env_;
  Object object_;
};

/// Makes an object array of `count` elements, each converted from its record and deleted from the local frame
/// at once.
template <typename Record, typename Convert>
jobjectArray toJavaArray(JNIEnv* env, jclass elementClass, const Record* records, int count,
                         Convert convert) {
  LocalRef array(env, env->NewObjectArray(count, elementClass, nullptr));
  if (!array) {
    return nullptr;
  }
  for (int i = 0; i < count; ++i) {
    LocalRef<jobject> element(env, convert(env, &records[i]));
    if (!element) {
      return nullptr;
    }
    env->SetObjectArrayElement(array.get(), i, element.get());
  }
  return array.handOn();
}

jobject ky_pointf_t_to_java_pointf(JNIEnv* env, const ky_pointf_t* point) {
  jobject javaPoint = env->NewObject(registry.mPointFClass, registry.newPointF);
  if (javaPoint != nullptr) {
    env->SetFloatField(javaPoint, registry.point.x, point->x);
    env->SetFloatField(javaPoint, registry.point.y, point->y);
  }
  return javaPoint;
}

}  // namespace

int register_face_fields(JNIEnv* env) {
  if (find_fields(env, fields, static_cast<int>(std::size(fields))) < 0) {
    return -1;
  }
  if (!registerClass(env, kPointFClass, &registry.mPointFClass, &registry.newPointF)) {
    FACE_LOG_ALWAYS(ANDROID_LOG_ERROR, "Can't find android/graphics/PointF.PointF()");
    return -1;
  }
  if (!registerClass(env, kRectClass, &registry.mRectClass, &registry.newRect)) {
    FACE_LOG_ALWAYS(ANDROID_LOG_ERROR, "Can't find android/graphics/Rect.Rect()");
    return -1;
  }
  if (!registerClass(env, kFaceInfoClass, &registry.mFaceClass, &registry.newFaceInfo)) {
    FACE_LOG_ALWAYS(ANDROID_LOG_ERROR, "Can't find com/vantrel/faceapi/model/FaceInfo");
    return -1;
  }
  return 0;
}

jobjectArray ky_pointf_t_array_to_java_pointf(JNIEnv* env, const ky_pointf_t* points, int count) {
  return toJavaArray(env, registry.mPointFClass, points, count, ky_pointf_t_to_java_pointf);
}

jobject ky_face_t_to_java_face(JNIEnv* env, const ky_face_t* record) {
  LocalRef face(env, env->NewObject(registry.mFaceClass, registry.newFaceInfo));
  if (!face) {
    return nullptr;
  }
  LocalRef rect(env, env->NewObject(registry.mRectClass, registry.newRect));
  if (!rect) {
    return nullptr;
  }
  env->SetIntField(rect.get(), registry.rect.left, record->rect.left);
  env->SetIntField(rect.get(), registry.rect.top, record->rect.top);
  env->SetIntField(rect.get(), registry.rect.right, record->rect.right);
  env->SetIntField(rect.get(), registry.rect.bottom, record->rect.bottom);
  env->SetObjectField(face.get(), registry.face.faceRect, rect.get());

  const int pointsCount = std::clamp(record->points_count, 0, KY_FACE_MAX_POINTS);
  LocalRef points(env, ky_pointf_t_array_to_java_pointf(env, record->points_array, pointsCount));
  if (!points) {
    return nullptr;
  }
  env->SetObjectField(face.get(), registry.face.facePoints, points.get());

  env->SetFloatField(face.get(), registry.face.score, record->score);
  env->SetFloatField(face.get(), registry.face.yaw, record->yaw);
  env->SetFloatField(face.get(), registry.face.pitch, record->pitch);
  env->SetFloatField(face.get(), registry.face.roll, record->roll);
  env->SetFloatField(face.get(), registry.face.eyeDist, record->eye_dist);
  env->SetIntField(face.get(), registry.face.id, record->id);
  return face.handOn();
}

jobjectArray ky_face_t_array_to_java_face(JNIEnv* env, const ky_face_t* records, int count) {
  return toJavaArray(env, registry.mFaceClass, records, count, ky_face_t_to_java_face);
}

ky_face_t java_face_to_ky_face_t(JNIEnv* env, jobject face) {
  ky_face_t record = {};
  // No local reference is deleted here: they all end with the native method that asked for the record.
  jobject rect = env->GetObjectField(face, registry.face.faceRect);
  if (rect != nullptr) {
    record.rect.left = env->GetIntField(rect, registry.rect.left);
    record.rect.top = env->GetIntField(rect, registry.rect.top);
    record.rect.right = env->GetIntField(rect, registry.rect.right);
    record.rect.bottom = env->GetIntField(rect, registry.rect.bottom);
  }

  auto points = static_cast<jobjectArray>(env->GetObjectField(face, registry.face.facePoints));
  if (points != nullptr) {
    record.points_count = std::min<int>(env->GetArrayLength(points), KY_FACE_MAX_POINTS);
    // For the points beside all else. A machine that has no room for the promise may have it for the
    // references.
    if (record.points_count > kPromisedPoints &&
        env->EnsureLocalCapacity(kPromisedReferences + record.points_count) < 0) {
      env->ExceptionClear();
    }
  }
  for (int i = 0; i < record.points_count; ++i) {
    jobject point = env->GetObjectArrayElement(points, i);
    if (point != nullptr) {
      record.points_array[i].x = env->GetFloatField(point, registry.point.x);
      record.points_array[i].y = env->GetFloatField(point, registry.point.y);
    }
  }

  record.score = env->GetFloatField(face, registry.face.score);
  record.yaw = env->GetFloatField(face, registry.face.yaw);
  record.pitch = env->GetFloatField(face, registry.face.pitch);
  record.roll = env->GetFloatField(face, registry.face.roll);
  record.eye_dist = env->GetFloatField(face, registry.face.eyeDist);
  record.id = env->GetIntField(face, registry.face.id);
  return record;
}

extern "C" {

JNIEXPORT void JNICALL Java_com_vantrel_faceapi_FaceLibrary_setDebug(JNIEnv* /*env*/, jclass /*type*/,
                                                                     jboolean debug) {
  kyface::debugSwitch.store(debug != JNI_FALSE ? 1 : 0, std::memory_order_relaxed);
}

}  // extern "C"
