// JNI bridge of com.quilby.norvane.apps.clipweaver.aggregator.Algorithms.
#include <jni.h>

#include <string>

#include "jni/select_nth.h"

namespace {

void Throw(JNIEnv* env, const char* className, const std::string& message) {
  jclass type = env->FindClass(className);
  if (type != nullptr) env->ThrowNew(type, message.c_str());
}

}  // namespace

// The value at rank `nth` of values[first, last) in ascending (ascending > 0)
// or descending order. The order of `values` afterwards is unspecified.
extern "C" JNIEXPORT jfloat JNICALL
Java_com_quilby_norvane_apps_clipweaver_aggregator_Algorithms_nthElement(
    JNIEnv* env, jobject, jfloatArray values, jint first, jint nth, jint last,
    jint ascending) {
  if (env == nullptr) return 0.0f;
  if (values == nullptr) {
    Throw(env, "java/lang/NullPointerException", "nthElement: values is null");
    return 0.0f;
  }
  const jsize length = env->GetArrayLength(values);
  if (!(0 <= first && first <= nth && nth < last && last <= length)) {
    Throw(env, "java/lang/IndexOutOfBoundsException",
          "nthElement: first " + std::to_string(first) + ", nth " + std::to_string(nth) +
              ", last " + std::to_string(last) + " outside 0 <= first <= nth < last <= length " +
              std::to_string(length));
    return 0.0f;
  }
  jfloat* elements = env->GetFloatArrayElements(values, nullptr);
  if (elements == nullptr) return 0.0f;
  const jfloat value = SelectNth(elements, first, nth, last, ascending);
  // The reordering is scratch work, never meant for the caller's array.
  env->ReleaseFloatArrayElements(values, elements, JNI_ABORT);
  return value;
}
