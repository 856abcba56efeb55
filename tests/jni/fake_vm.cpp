// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "fake_vm.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdarg>
#include <cstring>
#include <type_traits>
#include <utility>

#include "jni_functions.h"
#include "journal.h"

namespace fake {

namespace {

constexpr size_t kLargestArray = 64U << 20;

constexpr char kBufferClass[] = "java/nio/DirectByteBuffer";

std::string class_title(const std::string& class_name) {
  return class_name.substr(class_name.find_last_of('/') + 1);
}

/// Stands in for a function that the bridge has no business to call. `member` tells functions of one type
/// apart.
template <auto member, typename Function = std::decay_t<decltype(std::declval<JniFunctions>().*member)>>
struct Unexpected;

template <auto member, typename Result, typename... Arguments>
struct Unexpected<member, Result(JNICALL*)(Arguments...)> {
  static inline const char* name = "";
  static Result JNICALL call(Arguments...) {
    ADD_FAILURE() << "unexpected call of " << name;
    return Result();
  }
};

template <auto member, typename Result, typename... Arguments>
struct Unexpected<member, Result(JNICALL*)(Arguments..., ...)> {
  static inline const char* name = "";
  static Result JNICALL call(Arguments..., ...) {
    ADD_FAILURE() << "unexpected call of " << name;
    return Result();
  }
};

}  // namespace

/// The functions of the table that are modelled.
struct Functions {
  static Vm& vm(JNIEnv* env) { return *static_cast<Vm::Env*>(env)->vm; }

  static jclass JNICALL FindClass(JNIEnv* env, const char* name) {
    Vm& self = vm(env);
    note("FindClass(%s)", name);
    if (self.enter("FindClass") || self.classes_.count(name) == 0) {
      self.throw_exception();
      return nullptr;
    }
    Object* object = self.make("java/lang/Class", name);
    object->text = name;
    return static_cast<jclass>(self.refer(object, Vm::Scope::kLocal));
  }

  static std::string class_of(Vm& self, jclass owner, const char* function) {
    return owner == nullptr ? "null" : self.resolve(owner, function)->text;
  }

  static const Vm::Member* find_member(JNIEnv* env, const char* function, jclass owner, const char* name,
                                       const char* signature) {
    Vm& self = vm(env);
    const std::string class_name = class_of(self, owner, function);
    note("%s(%s, %s, %s)", function, class_name.c_str(), name, signature);
    // A null class is answered with null, as a look-up that fails, also when the class look-up's exception is
    // pending already.
    const bool refused = self.enter(function, owner == nullptr);
    const Vm::Member* member = refused ? nullptr : self.member(class_name, name, signature);
    if (member == nullptr) {
      self.throw_exception();
    }
    return member;
  }

  static jfieldID JNICALL GetFieldID(JNIEnv* env, jclass owner, const char* name, const char* signature) {
    return reinterpret_cast<jfieldID>(
        const_cast<Vm::Member*>(find_member(env, "GetFieldID", owner, name, signature)));
  }

  static jmethodID JNICALL GetMethodID(JNIEnv* env, jclass owner, const char* name, const char* signature) {
    return reinterpret_cast<jmethodID>(
        const_cast<Vm::Member*>(find_member(env, "GetMethodID", owner, name, signature)));
  }

  static jobject JNICALL NewGlobalRef(JNIEnv* env, jobject reference) {
    Vm& self = vm(env);
    Object* object = reference == nullptr ? nullptr : self.resolve(reference, "NewGlobalRef");
    note("NewGlobalRef(%s)", object == nullptr ? "null" : object->name.c_str());
    if (self.enter("NewGlobalRef", reference == nullptr) || object == nullptr) {
      return nullptr;
    }
    ++self.globals_;
    return self.refer(object, Vm::Scope::kGlobal);
  }

  static void JNICALL DeleteLocalRef(JNIEnv* env, jobject reference) {
    Vm& self = vm(env);
    self.enter("DeleteLocalRef", true);
    if (reference == nullptr) {
      ADD_FAILURE() << "DeleteLocalRef of null";
      return;
    }
    note("DeleteLocalRef(%s)", self.resolve(reference, "DeleteLocalRef")->name.c_str());
    auto* entry = reinterpret_cast<Vm::Reference*>(reference);
    EXPECT_EQ(entry->scope, Vm::Scope::kLocal) << "DeleteLocalRef of " << entry->object->name;
    entry->alive = false;
    --self.live_locals_;
  }

  static jint JNICALL EnsureLocalCapacity(JNIEnv* env, jint capacity) {
    Vm& self = vm(env);
    note("EnsureLocalCapacity(%d)", capacity);
    if (self.enter("EnsureLocalCapacity")) {
      self.throw_exception();
      return JNI_ENOMEM;
    }
    return JNI_OK;
  }

  static void JNICALL ExceptionClear(JNIEnv* env) {
    Vm& self = vm(env);
    self.enter("ExceptionClear", true);
    note("ExceptionClear()");
    self.exception_pending_ = false;
  }

  static jobject JNICALL NewObjectV(JNIEnv* env, jclass type, jmethodID constructor, va_list) {
    Vm& self = vm(env);
    const std::string class_name = class_of(self, type, "NewObjectV");
    note("NewObject(%s)", class_name.c_str());
    if (self.enter("NewObjectV") || type == nullptr || constructor == nullptr) {
      self.throw_exception();
      return nullptr;
    }
    const auto* method = reinterpret_cast<const Vm::Member*>(constructor);
    EXPECT_EQ(method->class_name, class_name);
    EXPECT_EQ(method->name + method->signature, "<init>()V");
    return self.refer(self.make(class_name), Vm::Scope::kLocal);
  }

  static jobjectArray JNICALL NewObjectArray(JNIEnv* env, jsize length, jclass type, jobject initial) {
    Vm& self = vm(env);
    const std::string class_name = class_of(self, type, "NewObjectArray");
    note("NewObjectArray(%d, %s)", length, class_name.c_str());
    EXPECT_EQ(initial, nullptr);
    if (self.enter("NewObjectArray") || length < 0 || static_cast<size_t>(length) > kLargestArray ||
        type == nullptr) {
      self.throw_exception();
      return nullptr;
    }
    Object* array = self.make("[L" + class_name + ";");
    array->elements.resize(static_cast<size_t>(length));
    return static_cast<jobjectArray>(self.refer(array, Vm::Scope::kLocal));
  }

  static void JNICALL SetObjectArrayElement(JNIEnv* env, jobjectArray reference, jsize index,
                                            jobject element) {
    Vm& self = vm(env);
    self.enter("SetObjectArrayElement");
    Object* array = self.resolve(reference, "SetObjectArrayElement");
    Object* value = self.resolve(element, "SetObjectArrayElement");
    note("SetObjectArrayElement(%s, %d, %s)", array->name.c_str(), index, value->name.c_str());
    EXPECT_EQ(array->class_name, "[L" + value->class_name + ";");
    array->elements.at(static_cast<size_t>(index)) = value;
  }

  static jobject JNICALL GetObjectArrayElement(JNIEnv* env, jobjectArray reference, jsize index) {
    Vm& self = vm(env);
    Object* array = self.resolve(reference, "GetObjectArrayElement");
    note("GetObjectArrayElement(%s, %d)", array->name.c_str(), index);
    if (self.enter("GetObjectArrayElement")) {
      self.throw_exception();
      return nullptr;
    }
    Object* element = array->elements.at(static_cast<size_t>(index));
    return element == nullptr ? nullptr : self.refer(element, Vm::Scope::kLocal);
  }

  static jsize JNICALL GetArrayLength(JNIEnv* env, jarray reference) {
    Vm& self = vm(env);
    self.enter("GetArrayLength");
    Object* array = self.resolve(reference, "GetArrayLength");
    note("GetArrayLength(%s)", array->name.c_str());
    return static_cast<jsize>(std::max({array->bytes.size(), array->words.size(), array->elements.size()}));
  }

  /// The object and the name of the field that an accessor is called with.
  static std::pair<Object*, std::string> field(Vm& self, const char* function, jobject reference, jfieldID id,
                                               char kind) {
    self.enter(function);
    Object* object = self.resolve(reference, function);
    if (id == nullptr) {
      ADD_FAILURE() << function << " with a null field ID";
      return {object, "?"};
    }
    const auto* member = reinterpret_cast<const Vm::Member*>(id);
    EXPECT_EQ(member->class_name, object->class_name) << function << " of " << member->name;
    EXPECT_TRUE(member->signature[0] == kind || (kind == 'L' && member->signature[0] == '[')) << function;
    return {object, member->name};
  }

  static void JNICALL SetIntField(JNIEnv* env, jobject reference, jfieldID id, jint value) {
    auto [object, name] = field(vm(env), "SetIntField", reference, id, 'I');
    note("SetIntField(%s.%s, %d)", object->name.c_str(), name.c_str(), value);
    object->ints[name] = value;
  }

  static void JNICALL SetFloatField(JNIEnv* env, jobject reference, jfieldID id, jfloat value) {
    auto [object, name] = field(vm(env), "SetFloatField", reference, id, 'F');
    note("SetFloatField(%s.%s, %g)", object->name.c_str(), name.c_str(), static_cast<double>(value));
    object->floats[name] = value;
  }

  static void JNICALL SetObjectField(JNIEnv* env, jobject reference, jfieldID id, jobject value) {
    auto [object, name] = field(vm(env), "SetObjectField", reference, id, 'L');
    Object* target = vm(env).resolve(value, "SetObjectField");
    note("SetObjectField(%s.%s, %s)", object->name.c_str(), name.c_str(), target->name.c_str());
    object->objects[name] = target;
  }

  static jint JNICALL GetIntField(JNIEnv* env, jobject reference, jfieldID id) {
    auto [object, name] = field(vm(env), "GetIntField", reference, id, 'I');
    note("GetIntField(%s.%s)", object->name.c_str(), name.c_str());
    return object->ints[name];
  }

  static jfloat JNICALL GetFloatField(JNIEnv* env, jobject reference, jfieldID id) {
    auto [object, name] = field(vm(env), "GetFloatField", reference, id, 'F');
    note("GetFloatField(%s.%s)", object->name.c_str(), name.c_str());
    return object->floats[name];
  }

  static jobject JNICALL GetObjectField(JNIEnv* env, jobject reference, jfieldID id) {
    auto [object, name] = field(vm(env), "GetObjectField", reference, id, 'L');
    note("GetObjectField(%s.%s)", object->name.c_str(), name.c_str());
    Object* value = object->objects[name];
    return value == nullptr ? nullptr : vm(env).refer(value, Vm::Scope::kLocal);
  }

  static jbyteArray JNICALL NewByteArray(JNIEnv* env, jsize length) {
    Vm& self = vm(env);
    note("NewByteArray(%d)", length);
    if (self.enter("NewByteArray") || length < 0 || static_cast<size_t>(length) > kLargestArray) {
      self.throw_exception();
      return nullptr;
    }
    Object* array = self.make("[B");
    array->bytes.resize(static_cast<size_t>(length));
    return static_cast<jbyteArray>(self.refer(array, Vm::Scope::kLocal));
  }

  static jbyte* JNICALL GetByteArrayElements(JNIEnv* env, jbyteArray array, jboolean* is_copy) {
    EXPECT_EQ(is_copy, nullptr);
    return static_cast<jbyte*>(vm(env).pin(array, "[B", "GetByteArrayElements"));
  }

  static jint* JNICALL GetIntArrayElements(JNIEnv* env, jintArray array, jboolean* is_copy) {
    EXPECT_EQ(is_copy, nullptr);
    return static_cast<jint*>(vm(env).pin(array, "[I", "GetIntArrayElements"));
  }

  static const std::string& array_class(Vm& self, jarray array) {
    return self.resolve(array, "the critical functions")->class_name;
  }

  static void* JNICALL GetPrimitiveArrayCritical(JNIEnv* env, jarray array, jboolean* is_copy) {
    EXPECT_EQ(is_copy, nullptr);
    Vm& self = vm(env);
    const std::string kind = array_class(self, array);
    void* elements = self.pin(array, kind.c_str(), "GetPrimitiveArrayCritical");
    self.criticals_ += elements != nullptr ? 1 : 0;
    return elements;
  }

  static void JNICALL ReleasePrimitiveArrayCritical(JNIEnv* env, jarray array, void* elements, jint mode) {
    Vm& self = vm(env);
    const std::string kind = array_class(self, array);
    self.unpin(array, elements, mode, kind.c_str(), "ReleasePrimitiveArrayCritical");
    --self.criticals_;
  }

  static void* JNICALL GetDirectBufferAddress(JNIEnv* env, jobject buffer) {
    Vm& self = vm(env);
    Object* object = self.resolve(buffer, "GetDirectBufferAddress");
    self.enter("GetDirectBufferAddress");
    return object->class_name == kBufferClass ? object->bytes.data() : nullptr;
  }

  static jlong JNICALL GetDirectBufferCapacity(JNIEnv* env, jobject buffer) {
    Vm& self = vm(env);
    Object* object = self.resolve(buffer, "GetDirectBufferCapacity");
    self.enter("GetDirectBufferCapacity");
    return object->class_name == kBufferClass ? static_cast<jlong>(object->bytes.size()) : -1;
  }

  static jboolean JNICALL IsSameObject(JNIEnv* env, jobject a, jobject b) {
    Vm& self = vm(env);
    self.enter("IsSameObject");
    return self.resolve(a, "IsSameObject") == self.resolve(b, "IsSameObject") ? JNI_TRUE : JNI_FALSE;
  }

  static void JNICALL GetIntArrayRegion(JNIEnv* env, jintArray array, jsize start, jsize length, jint* to) {
    Vm& self = vm(env);
    const Object* object = self.resolve(array, "GetIntArrayRegion");
    self.enter("GetIntArrayRegion");
    ASSERT_LE(static_cast<size_t>(start) + static_cast<size_t>(length), object->words.size());
    std::copy_n(object->words.begin() + start, length, to);
  }

  static const char* JNICALL GetStringUTFChars(JNIEnv* env, jstring string, jboolean* is_copy) {
    EXPECT_EQ(is_copy, nullptr);
    return static_cast<const char*>(vm(env).pin(string, "java/lang/String", "GetStringUTFChars"));
  }

  static void JNICALL ReleaseByteArrayElements(JNIEnv* env, jbyteArray array, jbyte* elements, jint mode) {
    vm(env).unpin(array, elements, mode, "[B", "ReleaseByteArrayElements");
  }

  static void JNICALL ReleaseIntArrayElements(JNIEnv* env, jintArray array, jint* elements, jint mode) {
    vm(env).unpin(array, elements, mode, "[I", "ReleaseIntArrayElements");
  }

  static void JNICALL ReleaseStringUTFChars(JNIEnv* env, jstring string, const char* chars) {
    vm(env).unpin(string, chars, 0, "java/lang/String", "ReleaseStringUTFChars");
  }

  static jint JNICALL GetEnv(JavaVM* java_vm, void** env, jint version) {
    Vm& self = *static_cast<Vm::Invoke*>(java_vm)->vm;
    note("GetEnv(%#x)", static_cast<unsigned>(version));
    if (self.get_env_result == JNI_OK) {
      *env = self.env();
    }
    return self.get_env_result;
  }
};

namespace {

JniFunctions makeFunctions() {
  JniFunctions table = {};
#define KY_UNEXPECTED(function)                          \
  Unexpected<&JniFunctions::function>::name = #function; \
  table.function = Unexpected<&JniFunctions::function>::call;
  KY_JNI_FUNCTIONS(KY_UNEXPECTED)
#undef KY_UNEXPECTED
  // All but the four reserved entries are set: whatever the bridge calls, the test says which it was.
  void* entries[sizeof table / sizeof(void*)];
  std::memcpy(entries, &table, sizeof table);
  for (size_t i = 4; i < std::size(entries); ++i) {
    EXPECT_NE(entries[i], nullptr) << "JNI function " << i << " is missing in the list of functions";
  }

#define KY_MODELLED(function) table.function = Functions::function;
  KY_MODELLED(FindClass)
  KY_MODELLED(GetFieldID)
  KY_MODELLED(GetMethodID)
  KY_MODELLED(NewGlobalRef)
  KY_MODELLED(DeleteLocalRef)
  KY_MODELLED(EnsureLocalCapacity)
  KY_MODELLED(ExceptionClear)
  KY_MODELLED(NewObjectV)
  KY_MODELLED(NewObjectArray)
  KY_MODELLED(SetObjectArrayElement)
  KY_MODELLED(GetObjectArrayElement)
  KY_MODELLED(GetArrayLength)
  KY_MODELLED(SetIntField)
  KY_MODELLED(SetFloatField)
  KY_MODELLED(SetObjectField)
  KY_MODELLED(GetIntField)
  KY_MODELLED(GetFloatField)
  KY_MODELLED(GetObjectField)
  KY_MODELLED(NewByteArray)
  KY_MODELLED(GetByteArrayElements)
  KY_MODELLED(GetIntArrayElements)
  KY_MODELLED(GetPrimitiveArrayCritical)
  KY_MODELLED(ReleasePrimitiveArrayCritical)
  KY_MODELLED(GetDirectBufferAddress)
  KY_MODELLED(GetDirectBufferCapacity)
  KY_MODELLED(IsSameObject)
  KY_MODELLED(GetIntArrayRegion)
  KY_MODELLED(GetStringUTFChars)
  KY_MODELLED(ReleaseByteArrayElements)
  KY_MODELLED(ReleaseIntArrayElements)
  KY_MODELLED(ReleaseStringUTFChars)
#undef KY_MODELLED
  return table;
}

JniInvokeFunctions makeInvokeFunctions() {
  JniInvokeFunctions table = {};
  table.GetEnv = Functions::GetEnv;
  return table;
}

}  // namespace

Vm::Vm() {
  // Shared by the machines of all threads.
  static const JniFunctions functions = makeFunctions();
  static const JniInvokeFunctions invokeFunctions = makeInvokeFunctions();
  env_.functions = &functions;
  env_.vm = this;
  invoke_.functions = &invokeFunctions;
  invoke_.vm = this;

  classes_["android/graphics/Rect"].members = {"left:I", "top:I", "right:I", "bottom:I", "<init>:()V"};
  classes_["android/graphics/PointF"].members = {"x:F", "y:F", "<init>:()V"};
  classes_["com/vantrel/faceapi/model/FaceInfo"].members = {"score:F",
                                                            "yaw:F",
                                                            "pitch:F",
                                                            "roll:F",
                                                            "eyeDist:F",
                                                            "id:I",
                                                            "<init>:()V",
                                                            "faceRect:Landroid/graphics/Rect;",
                                                            "facePoints:[Landroid/graphics/PointF;"};
}

Vm::~Vm() = default;

JNIEnv* Vm::env() { return &env_; }
JavaVM* Vm::java_vm() { return &invoke_; }

jbyteArray Vm::byte_array(const std::string& name, const std::vector<unsigned char>& bytes) {
  Object* array = make("[B", name);
  array->bytes.assign(bytes.begin(), bytes.end());
  return static_cast<jbyteArray>(refer(array, Scope::kArgument));
}

jintArray Vm::int_array(const std::string& name, const std::vector<jint>& words) {
  Object* array = make("[I", name);
  array->words = words;
  return static_cast<jintArray>(refer(array, Scope::kArgument));
}

jstring Vm::string(const std::string& name, const std::string& text) {
  Object* string = make("java/lang/String", name);
  string->text = text;
  return static_cast<jstring>(refer(string, Scope::kArgument));
}

jobject Vm::buffer(const std::string& name, const std::vector<unsigned char>& bytes) {
  Object* buffer = make(kBufferClass, name);
  buffer->bytes.assign(bytes.begin(), bytes.end());
  return refer(buffer, Scope::kArgument);
}

jobject Vm::object(const std::string& name, const std::string& class_name) {
  return refer(make(class_name, name), Scope::kArgument);
}

jobject Vm::another(jobject reference) { return refer(resolve(reference, "another"), Scope::kArgument); }

jobjectArray Vm::object_array(const std::string& name, const std::string& element_class,
                              const std::vector<Object*>& elements) {
  Object* array = make("[L" + element_class + ";", name);
  array->elements = elements;
  return static_cast<jobjectArray>(refer(array, Scope::kArgument));
}

Object& Vm::at(jobject reference) { return *resolve(reference, "the test"); }

std::vector<unsigned char> Vm::bytes(jbyteArray array) {
  const Object& object = at(array);
  return {object.bytes.begin(), object.bytes.end()};
}

void Vm::refuse(const std::string& function, int nth) { refusals_[function] = calls(function) + nth; }

void Vm::hide_class(const std::string& class_name) { classes_.erase(class_name); }

void Vm::hide_member(const std::string& class_name, const std::string& name_and_signature) {
  const size_t hidden = std::erase(classes_.at(class_name).members, name_and_signature);
  EXPECT_EQ(hidden, 1U) << name_and_signature;
}

int Vm::calls(const std::string& function) const {
  auto found = calls_.find(function);
  return found == calls_.end() ? 0 : found->second;
}

std::vector<std::string> Vm::pinned() const {
  std::vector<std::string> names;
  for (const auto& [address, pin] : pins_) {
    names.push_back(pin.object->name);
  }
  std::sort(names.begin(), names.end());
  return names;
}

std::string Vm::pin_name(const void* address) const {
  if (address == nullptr) {
    return "null";
  }
  auto found = pins_.find(address);
  return found == pins_.end() ? "?" : found->second.object->name;
}

size_t Vm::pin_size(const void* address) const {
  auto found = pins_.find(address);
  return found == pins_.end() ? 0 : found->second.memory.size();
}

void Vm::begin_call() {
  calls_.clear();
  refusals_.clear();
  live_locals_ = 0;
  peak_locals_ = 0;
  exception_pending_ = false;
}

Object* Vm::make(const std::string& class_name, const std::string& name) {
  Object& object = objects_.emplace_back();
  object.class_name = class_name;
  object.name = name;
  if (name.empty()) {
    std::string title = class_title(class_name);
    if (class_name[0] == '[') {
      title = class_name == "[B" ? "byte[]" : title.substr(0, title.size() - 1) + "[]";
    }
    object.name = title + "#" + std::to_string(++names_[title]);
  }
  return &object;
}

jobject Vm::refer(Object* object, Scope scope) {
  Reference& reference = references_.emplace_back(Reference{object, scope, true});
  if (scope == Scope::kLocal) {
    peak_locals_ = std::max(peak_locals_, ++live_locals_);
  }
  return reinterpret_cast<jobject>(&reference);
}

Object* Vm::resolve(jobject reference, const char* function) {
  static Object nothing{"null", "", {}, {}, {}, {}, {}, {}, ""};
  if (reference == nullptr) {
    ADD_FAILURE() << function << " with a null reference";
    return &nothing;
  }
  auto* entry = reinterpret_cast<Reference*>(reference);
  EXPECT_TRUE(entry->alive) << function << " with the deleted reference to " << entry->object->name;
  return entry->object;
}

bool Vm::enter(const char* function, bool allowed_under_exception) {
  if (exception_pending_ && !allowed_under_exception && !tolerate_calls_under_exception) {
    ADD_FAILURE() << function << " is called with an exception pending";
  }
  if (criticals_ > 0 && std::string(function).find("PrimitiveArrayCritical") == std::string::npos) {
    ADD_FAILURE() << function << " is called while an array is borrowed critically";
  }
  const int count = ++calls_[function];
  auto refusal = refusals_.find(function);
  return refusal != refusals_.end() && refusal->second == count;
}

const Vm::Member* Vm::member(const std::string& class_name, const std::string& name,
                             const std::string& signature) {
  auto found = classes_.find(class_name);
  if (found == classes_.end()) {
    return nullptr;
  }
  const std::vector<std::string>& members = found->second.members;
  if (std::find(members.begin(), members.end(), name + ":" + signature) == members.end()) {
    return nullptr;
  }
  return &members_.emplace_back(Member{class_name, name, signature});
}

void* Vm::pin(jobject reference, const char* kind, const char* function) {
  Object* object = reference == nullptr ? nullptr : resolve(reference, function);
  note("%s(%s)", function, object == nullptr ? "null" : object->name.c_str());
  if (enter(function) || object == nullptr) {
    throw_exception();
    return nullptr;
  }
  EXPECT_EQ(object->class_name, kind) << function << " of " << object->name;
  Pin pin{object, kind, {}};
  // A copy of exactly the elements, and never of none, so that every pin has an address of its own.
  if (object->class_name == "[B") {
    pin.memory.assign(object->bytes.begin(), object->bytes.end());
  } else if (object->class_name == "[I") {
    pin.memory.resize(object->words.size() * sizeof(jint));
    std::copy_n(reinterpret_cast<const char*>(object->words.data()), pin.memory.size(), pin.memory.begin());
  } else {
    pin.memory.assign(object->text.begin(), object->text.end());
    pin.memory.push_back('\0');
  }
  if (pin.memory.empty()) {
    pin.memory.reserve(1);
  }
  void* address = pin.memory.data();
  pins_.emplace(address, std::move(pin));
  return address;
}

void Vm::unpin(jobject reference, const void* elements, int mode, const char* kind, const char* function) {
  enter(function, true);
  Object* object = resolve(reference, function);
  if (object->class_name == "java/lang/String") {
    note("%s(%s)", function, object->name.c_str());
  } else {
    note("%s(%s, %d)", function, object->name.c_str(), mode);
  }
  auto found = pins_.find(elements);
  if (found == pins_.end()) {
    ADD_FAILURE() << function << " of elements that are not pinned, for " << object->name;
    return;
  }
  const Pin& pin = found->second;
  EXPECT_EQ(pin.object, object) << function << ": the elements of " << pin.object->name;
  EXPECT_EQ(pin.kind, kind) << function;
  if (mode != JNI_ABORT) {
    if (pin.kind == "[B") {
      object->bytes.assign(pin.memory.begin(), pin.memory.end());
    } else if (pin.kind == "[I") {
      std::copy_n(pin.memory.begin(), pin.memory.size(), reinterpret_cast<char*>(object->words.data()));
    }
  }
  if (mode != JNI_COMMIT) {
    pins_.erase(found);
  }
}

}  // namespace fake
