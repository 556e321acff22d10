// Counts the JNI functions the calling thread calls, by putting a counting copy of the JVM's
// function table in front of its environment for a while. For telling where an operation's time
// goes (how many JNI calls of each kind it makes); never used while timing.
#pragma once

#include <jni.h>

#include <array>
#include <cstdint>

namespace corvexa_bench {

enum JniFunction {
  kExceptionCheck,
  kIsInstanceOf,
  kGetObjectClass,
  kIsSameObject,
  kNewGlobalRef,
  kDeleteGlobalRef,
  kDeleteLocalRef,
  kNewString,
  kGetStringLength,
  kGetStringRegion,
  kCallMethod,   // every Call<Type>Method and CallStatic<Type>Method of the V form, and NewObjectV
  kNewArray,     // NewIntArray, NewByteArray, NewObjectArray
  kArrayRegion,  // Set/Get<Type>ArrayRegion for int and byte
  kJniFunctionCount
};

// The names of the counted functions, for printing.
const char* JniFunctionName(JniFunction function);

using JniCounts = std::array<std::uint64_t, kJniFunctionCount>;

// Installs the counting table on env (the calling thread's) and zeroes the counts.
void StartCountingJni(JNIEnv* env);
// Puts the JVM's own table back and returns the counts.
JniCounts StopCountingJni(JNIEnv* env);

}  // namespace corvexa_bench
