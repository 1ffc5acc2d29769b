// A JNI environment for timing the exported Engine methods without a JVM.
// Like Android's runtime it hands out the arrays themselves (no copies, the
// copy flag false), so what a benchmark measures is the bridge's own work:
// checks, pins, conversions and merges. Rectangles are objects with the int
// fields left, right, top, bottom. Only the calls the bridge makes on these
// paths are filled in; any other call would jump through a null pointer.
#pragma once

#include <jni.h>

#include <cstdint>
#include <cstring>
#include <deque>
#include <vector>

class BenchJni {
 public:
  BenchJni() {
    std::memset(&table_, 0, sizeof table_);
    table_.GetArrayLength = [](JNIEnv*, jarray a) { return static_cast<jsize>(array(a)->length); };
    table_.GetIntArrayElements = [](JNIEnv*, jintArray a, jboolean* copy) {
      if (copy) *copy = JNI_FALSE;
      return static_cast<jint*>(array(a)->data);
    };
    table_.GetByteArrayElements = [](JNIEnv*, jbyteArray a, jboolean* copy) {
      if (copy) *copy = JNI_FALSE;
      return static_cast<jbyte*>(array(a)->data);
    };
    table_.ReleaseIntArrayElements = [](JNIEnv*, jintArray, jint*, jint) {};
    table_.ReleaseByteArrayElements = [](JNIEnv*, jbyteArray, jbyte*, jint) {};
    table_.GetObjectClass = [](JNIEnv*, jobject) { return reinterpret_cast<jclass>(&kRectClass); };
    table_.GetFieldID = [](JNIEnv*, jclass, const char* name, const char*) {
      static const char* const kNames[] = {"left", "top", "right", "bottom"};
      for (uintptr_t i = 0; i < 4; ++i)
        if (std::strcmp(name, kNames[i]) == 0) return reinterpret_cast<jfieldID>(i + 1);
      return static_cast<jfieldID>(nullptr);
    };
    table_.GetIntField = [](JNIEnv*, jobject o, jfieldID id) {
      return reinterpret_cast<const Rect*>(o)->side[reinterpret_cast<uintptr_t>(id) - 1];
    };
    table_.DeleteLocalRef = [](JNIEnv*, jobject) {};
    table_.ExceptionClear = [](JNIEnv*) {};
    table_.ExceptionCheck = [](JNIEnv*) -> jboolean { return JNI_FALSE; };
    env_.functions = &table_;
  }
  BenchJni(const BenchJni&) = delete;
  BenchJni& operator=(const BenchJni&) = delete;

  JNIEnv* env() { return &env_; }

  // Java arrays backed by the caller's vectors (which must outlive them).
  jintArray ints(std::vector<int>& v) { return reinterpret_cast<jintArray>(&arrays_.emplace_back(Array{v.size(), v.data()})); }
  jbyteArray bytes(std::vector<unsigned char>& v) {
    return reinterpret_cast<jbyteArray>(&arrays_.emplace_back(Array{v.size(), v.data()}));
  }
  jobject rect(int left, int top, int right, int bottom) {
    return reinterpret_cast<jobject>(&rects_.emplace_back(Rect{{left, top, right, bottom}}));
  }

 private:
  struct Array {
    size_t length;
    void* data;
  };
  struct Rect {
    jint side[4];
  };
  static inline char kRectClass = 0;
  static Array* array(jarray a) { return reinterpret_cast<Array*>(a); }

  JNINativeInterface table_;
  JNIEnv env_;
  std::deque<Array> arrays_;
  std::deque<Rect> rects_;
};
