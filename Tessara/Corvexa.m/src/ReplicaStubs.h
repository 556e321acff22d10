// The binding table: every Java class reference, method identifier and enumeration constant that
// the library uses, resolved once per process by init() and only read afterwards, by any thread,
// without a lock. The rows are declared once, in BindingTable.def.
#pragma once

#include <atomic>
#include <jni.h>

namespace corvexa {

// Named slot numbers, in table order.
enum Slot : int {
#define CLASS(name, path) name,
#define METHOD(name, member, signature) name,
#define STATIC(name, member, signature) name,
#define SETTER_FIRST(name, member, signature) name,
#define CONSTANT(name, field) name,
#define RESERVED(name) name,
#include "BindingTable.def"
#undef CLASS
#undef METHOD
#undef STATIC
#undef SETTER_FIRST
#undef CONSTANT
#undef RESERVED
  SlotCount
};
static_assert(SlotCount == 212, "the binding table has 212 slots");

enum class BindingKind { Class, Method, Static, SetterFirst, Constant, Reserved };

// One row of the binding table, as declared.
struct BindingRow {
  BindingKind kind;
  const char* name;       // class path, member or field name
  const char* signature;  // methods only
};

// The rows in slot order: read by init() and, at compile time, by the frame's signature check.
inline constexpr BindingRow kBindingRows[] = {
#define CLASS(name, path) {BindingKind::Class, path, nullptr},
#define METHOD(name, member, signature) {BindingKind::Method, member, signature},
#define STATIC(name, member, signature) {BindingKind::Static, member, signature},
#define SETTER_FIRST(name, member, signature) {BindingKind::SetterFirst, member, signature},
#define CONSTANT(name, field) {BindingKind::Constant, field, nullptr},
#define RESERVED(name) {BindingKind::Reserved, nullptr, nullptr},
#include "BindingTable.def"
#undef CLASS
#undef METHOD
#undef STATIC
#undef SETTER_FIRST
#undef CONSTANT
#undef RESERVED
};
static_assert(sizeof(kBindingRows) / sizeof(kBindingRows[0]) == SlotCount, "one row per slot");

}  // namespace corvexa

class ReplicaStubs {
 public:
  // Sets no slot: init() fills them.
  ReplicaStubs();
  ReplicaStubs(const ReplicaStubs&) = delete;
  ReplicaStubs& operator=(const ReplicaStubs&) = delete;

  // Resolves every row of the table, in slot order, through _env. The first failed lookup ends it
  // with the translated failure; what was resolved before stays, the rest stays unset.
  long init(JNIEnv* env);

  jclass Class(corvexa::Slot slot) const { return static_cast<jclass>(_slot[slot]); }
  jmethodID Method(corvexa::Slot slot) const { return static_cast<jmethodID>(_slot[slot]); }
  jobject Constant(corvexa::Slot slot) const { return static_cast<jobject>(_slot[slot]); }

  // True once init() has resolved every row. Operations never call Java through a table that is
  // not bound.
  bool IsBound() const { return _state.load(std::memory_order_acquire) == kBound; }
  // True once init() has returned, whether it bound everything or stopped at a missing member.
  bool IsSettled() const { return _state.load(std::memory_order_acquire) != kFilling; }
  // After binding: fails, recording why, when the replica package's version is not the library's.
  long CheckVersion();
  // Fails the operation methodName because the Java side could not be bound: records a last error
  // naming the first missing class or member and returns VLX_E_FAIL.
  long ReportUnbound(const char* methodName) const;

  // The class path of a class slot ("com/velmora/tessara/kdmreplica/Instance"), or null for a slot
  // of another kind.
  static const char* ClassPath(corvexa::Slot slot);

  // The environment passed to init(), used by the calls init makes and by nothing else.
  static JNIEnv* _env;

 private:
  enum State : int { kFilling, kBound, kFailed };

  void* _slot[corvexa::SlotCount];
  std::atomic<int> _state;
  char _missing[512];  // what the first failed lookup was looking for
};
