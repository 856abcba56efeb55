// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// A JVM for tests, as one thread sees it: it records every call in the journal, models the few
/// classes that the bridge uses, counts what is borrowed and not given back, and can refuse any call.
#pragma once

#include <jni.h>

#include <deque>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace fake {

/// A Java object, array, string or class. Only the members that belong to its kind are used.
struct Object {
  std::string name;        ///< how the journal calls it
  std::string class_name;  ///< with slashes; arrays by their signature
  std::map<std::string, float> floats;
  std::map<std::string, int> ints;
  std::map<std::string, Object*> objects;
  std::vector<jbyte> bytes;
  std::vector<jint> words;
  std::vector<Object*> elements;
  std::string text;
};

class Vm {
 public:
  Vm();
  ~Vm();
  Vm(const Vm&) = delete;
  Vm& operator=(const Vm&) = delete;

  JNIEnv* env();
  JavaVM* java_vm();

  // ---- what the test puts into the JVM. Its references are not counted.
  jbyteArray byte_array(const std::string& name, const std::vector<unsigned char>& bytes);
  jintArray int_array(const std::string& name, const std::vector<jint>& words);
  jstring string(const std::string& name, const std::string& text);
  /// A direct buffer of bytes.
  jobject buffer(const std::string& name, const std::vector<unsigned char>& bytes);
  jobject object(const std::string& name, const std::string& class_name);
  /// Another reference to the same object, as each argument of a native method is.
  jobject another(jobject reference);
  jobjectArray object_array(const std::string& name, const std::string& element_class,
                            const std::vector<Object*>& elements);

  /// The object behind a reference; a null or dead reference fails the test.
  Object& at(jobject reference);
  std::vector<unsigned char> bytes(jbyteArray array);

  // ---- what it refuses
  /// The n-th call (counted from 1, from now on) of a function answers null with an exception pending. The
  /// pin and release functions are told apart by their type ("GetByteArrayElements").
  void refuse(const std::string& function, int nth);
  /// A class that cannot be found, a member ("name:signature") that cannot be found.
  void hide_class(const std::string& class_name);
  void hide_member(const std::string& class_name, const std::string& name_and_signature);
  /// What `GetEnv` answers.
  jint get_env_result = JNI_OK;
  /// Calls that are made with an exception pending fail the test unless this is set, and so do calls between
  /// the borrowing and the giving back of a critical array.
  bool tolerate_calls_under_exception = false;

  // ---- what it has seen
  int calls(const std::string& function) const;
  const std::map<std::string, int>& all_calls() const { return calls_; }
  /// Arrays and strings that are pinned now, by name.
  std::vector<std::string> pinned() const;
  /// The name of the array (or string) whose pinned elements start at `address`, or "null", or "?".
  std::string pin_name(const void* address) const;
  /// Bytes of the pinned elements at `address`.
  size_t pin_size(const void* address) const;
  int live_locals() const { return live_locals_; }
  int peak_locals() const { return peak_locals_; }
  int globals() const { return globals_; }
  /// Takes global references that a test expects out of the count.
  void forget_globals(int count) { globals_ -= count; }
  bool exception_pending() const { return exception_pending_; }
  /// Forgets the counts of calls and local references and clears the pending exception: the next native call
  /// begins.
  void begin_call();

 private:
  friend struct Functions;

  enum class Scope { kArgument, kLocal, kGlobal };
  struct Reference {
    Object* object;
    Scope scope;
    bool alive;
  };
  struct Member {
    std::string class_name;
    std::string name;
    std::string signature;
  };
  struct Pin {
    Object* object;
    std::string kind;
    std::vector<char> memory;
  };
  struct Class {
    std::vector<std::string> members;  // "name:signature"
  };
  struct Env : JNIEnv {
    Vm* vm;
  };
  struct Invoke : JavaVM {
    Vm* vm;
  };

  Object* make(const std::string& class_name, const std::string& name = "");
  jobject refer(Object* object, Scope scope);
  Object* resolve(jobject reference, const char* function);
  /// Counts a call; true when it is to be refused.
  bool enter(const char* function, bool allowed_under_exception = false);
  void throw_exception() { exception_pending_ = true; }
  const Member* member(const std::string& class_name, const std::string& name, const std::string& signature);
  void* pin(jobject reference, const char* kind, const char* function);
  void unpin(jobject reference, const void* elements, int mode, const char* kind, const char* function);

  Env env_;
  Invoke invoke_;
  std::deque<Object> objects_;
  std::deque<Reference> references_;
  std::deque<Member> members_;
  std::map<const void*, Pin> pins_;
  std::map<std::string, Class> classes_;
  std::map<std::string, int> names_;
  std::map<std::string, int> calls_;
  std::map<std::string, int> refusals_;
  int live_locals_ = 0;
  int peak_locals_ = 0;
  int globals_ = 0;
  int criticals_ = 0;
  bool exception_pending_ = false;
};

}  // namespace fake
