// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// An agent of the JVM that puts fences around every array that native code borrows: memory of
/// its own for each, which ends, or begins, at a page that may not be touched. What is read or written beyond
/// that end is a fault on the spot, what is written beyond the other one is found when the array is given
/// back. It stands in front of the JVM's own functions, so that -Xcheck:jni checks on.
///
/// Loaded by -agentpath; RandomCalls gets direct buffers with such fences from it, too.
#include <jni.h>
#include <jvmti.h>
#include <sys/mman.h>
#include <unistd.h>

#include <atomic>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <mutex>
#include <unordered_map>
#include <vector>

namespace {

constexpr unsigned char kFence = 0xA5;
/// Mappings of up to so many pages are used again.
constexpr size_t kKeptPages = 64;

JNINativeInterface_ machine;  ///< the functions that stand behind
jclass byte_array;
jclass int_array;
std::atomic<long> borrowed{0};

[[noreturn]] void fail(const char* what) {
  fprintf(stderr, "FENCE: %s\n", what);
  fflush(stderr);
  abort();
}

size_t page() {
  static const auto size = static_cast<size_t>(sysconf(_SC_PAGESIZE));
  return size;
}

/// Memory between two pages that may not be touched.
class Field {
 public:
  static Field take(size_t bytes, bool at_end) {
    Field field;
    field.bytes_ = bytes;
    field.pages_ = (bytes + page() - 1) / page() + (bytes == 0 ? 1 : 0);
    field.base_ = field.mapped();
    field.data_ = at_end ? field.base_ + field.pages_ * page() - bytes : field.base_;
    memset(field.base_, kFence, field.pages_ * page());
    return field;
  }

  void give_back() {
    if (pages_ > kKeptPages) {
      munmap(base_ - page(), (pages_ + 2) * page());
      return;
    }
    const std::lock_guard<std::mutex> lock(mutex());
    kept()[pages_].push_back(base_);
  }

  unsigned char* data() const { return data_; }
  size_t bytes() const { return bytes_; }

  void check() const {
    for (const unsigned char* p = base_; p < base_ + pages_ * page(); ++p) {
      if (p == data_) {
        p += bytes_;
        if (p == base_ + pages_ * page()) {
          break;
        }
      }
      if (*p != kFence) {
        fail("written beside an array");
      }
    }
  }

 private:
  static std::mutex& mutex() {
    static std::mutex mutex;
    return mutex;
  }
  static std::map<size_t, std::vector<unsigned char*>>& kept() {
    static std::map<size_t, std::vector<unsigned char*>> kept;
    return kept;
  }

  unsigned char* mapped() const {
    if (pages_ <= kKeptPages) {
      const std::lock_guard<std::mutex> lock(mutex());
      std::vector<unsigned char*>& of_size = kept()[pages_];
      if (!of_size.empty()) {
        unsigned char* base = of_size.back();
        of_size.pop_back();
        return base;
      }
    }
    void* all = mmap(nullptr, (pages_ + 2) * page(), PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (all == MAP_FAILED) {
      fail("there is no memory");
    }
    unsigned char* base = static_cast<unsigned char*>(all) + page();
    if (mprotect(base, pages_ * page(), PROT_READ | PROT_WRITE) != 0) {
      fail("memory cannot be opened");
    }
    return base;
  }

  unsigned char* base_ = nullptr;
  unsigned char* data_ = nullptr;
  size_t bytes_ = 0;
  size_t pages_ = 0;
};

/// What is borrowed: the fenced memory, and the JVM's where that was borrowed too.
struct Loan {
  Field field;
  void* original = nullptr;
};

std::mutex loans_mutex;
std::unordered_map<void*, std::vector<Loan>> loans;  // arrays without elements may share an address

void* lend(size_t bytes, void* original) {
  const Loan loan = {Field::take(bytes, borrowed++ % 4 != 0), original};
  const std::lock_guard<std::mutex> lock(loans_mutex);
  loans[loan.field.data()].push_back(loan);
  return loan.field.data();
}

bool is_lent(void* elements) {
  const std::lock_guard<std::mutex> lock(loans_mutex);
  return loans.count(elements) != 0;
}

Loan take_back(void* elements) {
  const std::lock_guard<std::mutex> lock(loans_mutex);
  const auto found = loans.find(elements);
  if (found == loans.end()) {
    fail("elements given back that were not borrowed");
  }
  const Loan loan = found->second.back();
  found->second.pop_back();
  if (found->second.empty()) {
    loans.erase(found);
  }
  return loan;
}

template <typename Array, typename Element>
using Getter = Element*(JNICALL*)(JNIEnv*, Array, jboolean*);
template <typename Array, typename Element>
using Releaser = void(JNICALL*)(JNIEnv*, Array, Element*, jint);

template <auto member, typename Array, typename Element>
Element* JNICALL get_elements(JNIEnv* env, Array array, jboolean* is_copy) {
  const Getter<Array, Element> get = machine.*member;
  Element* original = get(env, array, is_copy);
  if (original == nullptr) {
    return nullptr;
  }
  const size_t bytes = static_cast<size_t>(machine.GetArrayLength(env, array)) * sizeof(Element);
  void* fenced = lend(bytes, original);
  memcpy(fenced, original, bytes);
  return static_cast<Element*>(fenced);
}

template <auto member, typename Array, typename Element>
void JNICALL release_elements(JNIEnv* env, Array array, Element* elements, jint mode) {
  const Releaser<Array, Element> release = machine.*member;
  Loan loan = take_back(elements);
  loan.field.check();
  if (mode != JNI_ABORT) {
    memcpy(loan.original, elements, loan.field.bytes());
  }
  release(env, array, static_cast<Element*>(loan.original), mode);
  loan.field.give_back();
}

// The JVM's own borrowing of this kind would forbid the calls that copying takes.
void* JNICALL get_critical(JNIEnv* env, jarray array, jboolean* is_copy) {
  const bool is_bytes = machine.IsInstanceOf(env, array, byte_array) != JNI_FALSE;
  if (!is_bytes && machine.IsInstanceOf(env, array, int_array) == JNI_FALSE) {
    return machine.GetPrimitiveArrayCritical(env, array, is_copy);  // the JVM's own libraries
  }
  const jsize length = machine.GetArrayLength(env, array);
  void* fenced = lend(static_cast<size_t>(length) * (is_bytes ? sizeof(jbyte) : sizeof(jint)), nullptr);
  if (is_bytes) {
    machine.GetByteArrayRegion(env, static_cast<jbyteArray>(array), 0, length, static_cast<jbyte*>(fenced));
  } else {
    machine.GetIntArrayRegion(env, static_cast<jintArray>(array), 0, length, static_cast<jint*>(fenced));
  }
  if (is_copy != nullptr) {
    *is_copy = JNI_TRUE;
  }
  return fenced;
}

void JNICALL release_critical(JNIEnv* env, jarray array, void* elements, jint mode) {
  if (!is_lent(elements)) {
    machine.ReleasePrimitiveArrayCritical(env, array, elements, mode);
    return;
  }
  Loan loan = take_back(elements);
  loan.field.check();
  const jsize length = machine.GetArrayLength(env, array);
  if (mode != JNI_ABORT && machine.IsInstanceOf(env, array, byte_array) != JNI_FALSE) {
    machine.SetByteArrayRegion(env, static_cast<jbyteArray>(array), 0, length,
                               static_cast<const jbyte*>(elements));
  } else if (mode != JNI_ABORT) {
    machine.SetIntArrayRegion(env, static_cast<jintArray>(array), 0, length,
                              static_cast<const jint*>(elements));
  }
  loan.field.give_back();
}

void JNICALL put_up_fences(jvmtiEnv* jvmti, JNIEnv* env, jthread /*thread*/) {
  jniNativeInterface* functions = nullptr;
  if (jvmti->GetJNIFunctionTable(&functions) != JVMTI_ERROR_NONE) {
    fail("the JVM's functions are not to be had");
  }
  machine = *functions;
  byte_array = static_cast<jclass>(env->NewGlobalRef(env->FindClass("[B")));
  int_array = static_cast<jclass>(env->NewGlobalRef(env->FindClass("[I")));
  functions->GetByteArrayElements =
      get_elements<&JNINativeInterface_::GetByteArrayElements, jbyteArray, jbyte>;
  functions->GetIntArrayElements = get_elements<&JNINativeInterface_::GetIntArrayElements, jintArray, jint>;
  functions->ReleaseByteArrayElements =
      release_elements<&JNINativeInterface_::ReleaseByteArrayElements, jbyteArray, jbyte>;
  functions->ReleaseIntArrayElements =
      release_elements<&JNINativeInterface_::ReleaseIntArrayElements, jintArray, jint>;
  functions->GetPrimitiveArrayCritical = get_critical;
  functions->ReleasePrimitiveArrayCritical = release_critical;
  if (jvmti->SetJNIFunctionTable(functions) != JVMTI_ERROR_NONE) {
    fail("the JVM's functions cannot be replaced");
  }
  jvmti->Deallocate(reinterpret_cast<unsigned char*>(functions));
}

}  // namespace

extern "C" {

JNIEXPORT jint JNICALL Agent_OnLoad(JavaVM* vm, char* /*options*/, void* /*reserved*/) {
  jvmtiEnv* jvmti = nullptr;
  if (vm->GetEnv(reinterpret_cast<void**>(&jvmti), JVMTI_VERSION_1_2) != JNI_OK) {
    return JNI_ERR;
  }
  jvmtiEventCallbacks callbacks = {};
  callbacks.VMInit = put_up_fences;
  const bool done =
      jvmti->SetEventCallbacks(&callbacks, sizeof callbacks) == JVMTI_ERROR_NONE &&
      jvmti->SetEventNotificationMode(JVMTI_ENABLE, JVMTI_EVENT_VM_INIT, nullptr) == JVMTI_ERROR_NONE;
  return done ? JNI_OK : JNI_ERR;
}

/// A direct buffer that ends, or begins, at a page that may not be touched; it stays for good.
JNIEXPORT jobject JNICALL Java_com_vantrel_faceapi_RandomCalls_fencedBuffer(JNIEnv* env, jclass /*type*/,
                                                                            jint bytes, jboolean atEnd) {
  const Field field = Field::take(static_cast<size_t>(bytes), atEnd != JNI_FALSE);
  return env->NewDirectByteBuffer(field.data(), bytes);
}

/// How many loans there were, and how many were not given back.
JNIEXPORT jlong JNICALL Java_com_vantrel_faceapi_RandomCalls_loans(JNIEnv* /*env*/, jclass /*type*/) {
  return borrowed;
}

JNIEXPORT jlong JNICALL Java_com_vantrel_faceapi_RandomCalls_openLoans(JNIEnv* /*env*/, jclass /*type*/) {
  const std::lock_guard<std::mutex> lock(loans_mutex);
  long open = 0;
  for (const auto& [address, of_address] : loans) {
    open += static_cast<long>(of_address.size());
  }
  return open;
}

}  // extern "C"
