// The call frame: the one sequence that every proxy operation runs around its Java call.
//
//   1. env: the calling thread's environment            (FrameAccess::Start)
//   2. start the Java side once; test the proxy is built (skipped for static and constructor calls)
//   3. a failed start goes to the error translation
//   4. no binding table: VLX_E_FAIL at once; a table that could not be bound: VLX_E_FAIL with a last
//      error naming the missing Java member, and no Java call
//   5. convert the arguments (enumeration constants first, then the rest in parameter order); a
//      failure goes to the error translation (or is returned raw), with no Java call
//   6. call the Java method of the slot (instance, static, or constructor)
//   7. release the arguments' local references
//   8. no exception pending: land the result in the out-parameter (converter, SetHandle, or a
//      primitive written as it came) and release it; an exception pending: leave it alone
//   9. the error translation of the status; a success already known to leave no exception pending
//      (a landing after step 8 found none, or a forwarded operation's) returns VLX_S_OK at once, so
//      that the success path checks for an exception once per Java call
//
// An operation declares its slot, method name text, arguments and out-parameter:
//
//   return Call(*this, "VLXKDMReplica::GetName(VLXUnicodeString&)", Replica_getName).returning(name);
//
// How each native type crosses is said once, by the ArgOf and ResultOf tables below.
#pragma once

#include <cstddef>
#include <string>
#include <tuple>
#include <type_traits>
#include <utility>

#include <jni.h>

#include "ReplicaStubs.h"
#include "VLXBinary.h"
#include "VLXJBXJNIConverter.h"
#include "VLXError.h"
#include "VLXFatalError.h"
#include "VLXJBXException.h"
#include "VLXJBXJNIHelper.h"
#include "VLXJBXJNIUtilities.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceValue.h"
#include "VLXKDMJavaObject.h"
#include "VLXKDMSchemaTypes.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXResult.h"
#include "VLXUnicodeString.h"

namespace corvexa {

// Owns one local reference and deletes it on every path.
class LocalRef {
 public:
  LocalRef(JNIEnv* env, jobject ref) : _env(env), _ref(ref) {}
  ~LocalRef() { reset(); }
  LocalRef(const LocalRef&) = delete;
  LocalRef& operator=(const LocalRef&) = delete;
  jobject get() const { return _ref; }
  // Hands the reference over to the caller, who then owns it.
  jobject release() {
    const jobject ref = _ref;
    _ref = nullptr;
    return ref;
  }
  void reset() {
    if (_ref) VLXJBXJNIHelper::DeleteLocalRef(_env, _ref);
    _ref = nullptr;
  }

 private:
  JNIEnv* _env;
  jobject _ref;
};

// The frame's access to the proxy base's start-up and binding table.
class FrameAccess {
 public:
  // Steps 1 to 3: the environment, the start of the Java side and, for a proxy, the built test.
  static long Start(VLXKDMJavaObject* self, JNIEnv*& env, const char* name) {
    return self ? self->InitJavaAndTestIsBuilt(env, name) : VLXKDMJavaObject::InitJava(env, name);
  }
  static ReplicaStubs* Table() { return VLXKDMJavaObject::_st.load(std::memory_order_acquire); }
  // The bound table for an object attached outside any operation (the Java side is started if no
  // operation has started it); null with the failure in status.
  static const ReplicaStubs* BoundTable(const char* operation, long& status) {
    const ReplicaStubs* st = Table();
    if (!st || !st->IsBound()) {
      JNIEnv* started = nullptr;
      status = VLXKDMJavaObject::InitJava(started, operation);
      if (status < 0) return nullptr;
      st = Table();
      status = !st ? VLX_E_FAIL : !st->IsBound() ? st->ReportUnbound(operation) : VLX_S_OK;
      if (status < 0) return nullptr;
    }
    return st;
  }
  // Attaches proxy to object, whose Java class the binding table's method signature establishes.
  static long Attach(VLXKDMJavaObject& proxy, JNIEnv* env, jobject object) {
    return proxy.ReplaceGlobalRef(env, object);
  }
  // Attaches value to object (not null) and reads its local form; a failure leaves value as it was.
  static long Read(VLXKDMInstanceValue& value, JNIEnv* env, jobject object) { return value.Read(env, object, true); }

  // The start of an operation that Java code calls with its own environment: env is replaced by
  // the calling thread's. Returns the bound table, or null with the operation's result in result.
  static const ReplicaStubs* StartJavaFacing(JNIEnv*& env, const char* name, long& result) {
    result = VLXKDMJavaObject::InitJava(env, name);
    if (result < 0) return nullptr;
    const ReplicaStubs* st = Table();
    if (!st) result = VLX_E_FAIL;
    else if (!st->IsBound()) result = st->ReportUnbound(name);
    return st && st->IsBound() ? st : nullptr;
  }
};

// ---- How a native argument reaches Java ------------------------------------------------------
// J: the JNI type passed; To: the conversion; kOwnsRef: To makes a local reference that the frame
// releases; kEarly: converted before the other arguments (enumeration constants).

template <class T, class = void>
struct ArgOf;

template <class Native, class Java>
struct ConvertedArg {  // converted by the platform converter into a new local reference
  using J = Java;
  static constexpr bool kOwnsRef = true;
  static constexpr bool kEarly = false;
  static long To(JNIEnv* env, const Native& value, J& out) {
    return VLXJBXJNIConverter::ConvertToJavaType(env, value, out);
  }
};

template <class T>
struct PassedArg {  // passed as it is
  using J = T;
  static constexpr bool kOwnsRef = false;
  static constexpr bool kEarly = false;
  static long To(JNIEnv*, T value, J& out) {
    out = value;
    return VLX_S_OK;
  }
};

// A text: steps 2 and 3 (or the conversion before it) have found no exception pending.
template <> struct ArgOf<VLXUnicodeString> {
  using J = jstring;
  static constexpr bool kOwnsRef = true;
  static constexpr bool kEarly = false;
  static long To(JNIEnv* env, const VLXUnicodeString& value, J& out) {
    return VLXJBXJNIConverter::ConvertToJavaString(env, value, out);
  }
};
template <> struct ArgOf<VLXListValVLXUnicodeString> : ConvertedArg<VLXListValVLXUnicodeString, jobjectArray> {};
template <> struct ArgOf<VLXBinary> : ConvertedArg<VLXBinary, jbyteArray> {};
template <> struct ArgOf<int> : PassedArg<jint> {};
// Any non-zero byte is true: Java sees only 0 or 1.
template <> struct ArgOf<VLXBoolean> {
  using J = jboolean;
  static constexpr bool kOwnsRef = false;
  static constexpr bool kEarly = false;
  static long To(JNIEnv*, VLXBoolean value, J& out) {
    out = value != 0 ? JNI_TRUE : JNI_FALSE;
    return VLX_S_OK;
  }
};
template <> struct ArgOf<jobject> : PassedArg<jobject> {};

// A proxy argument goes as its handle, without a built test.
template <class P>
struct ArgOf<P, std::enable_if_t<std::is_base_of_v<VLXKDMJavaObject, P>>> {
  using J = jobject;
  static constexpr bool kOwnsRef = false;
  static constexpr bool kEarly = false;
  static long To(JNIEnv*, const P& proxy, J& out) {
    out = proxy.GetHandle();
    return VLX_S_OK;
  }
};

// ---- How a Java result lands in a native out-parameter ---------------------------------------
// Raw: the JNI result type, which picks the Call*Method; Land: stores it and gives the new status
// (an object result's local reference is released here).

template <class T, class = void>
struct ResultOf;

template <class Native>
struct ConvertedResult {  // read by the platform converter
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, Native& out, long) {
    LocalRef owned(env, result);
    return VLXJBXJNIConverter::BuildFromJavaType(env, result, out);
  }
};

template <class Native, class Java>
struct PrimitiveResult {  // written as it came; the status stays
  using Raw = Java;
  static long Land(JNIEnv*, Java result, Native& out, long status) {
    out = result;
    return status;
  }
};

// Every method answering a VLXUnicodeString is declared to return a java.lang.String, and step 8
// has found no exception: the text is read without checking either again.
template <> struct ResultOf<VLXUnicodeString> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, VLXUnicodeString& out, long) {
    LocalRef owned(env, result);
    return VLXJBXJNIConverter::BuildFromJavaString(env, static_cast<jstring>(result), out);
  }
};
template <> struct ResultOf<VLXListValVLXUnicodeString> : ConvertedResult<VLXListValVLXUnicodeString> {};
template <> struct ResultOf<VLXBinary> : ConvertedResult<VLXBinary> {};
template <> struct ResultOf<int> : PrimitiveResult<int, jint> {};
template <> struct ResultOf<VLXBoolean> : PrimitiveResult<VLXBoolean, jboolean> {};

// A returned Java object is attached to the out-proxy, even when it is null.
template <class P>
struct ResultOf<P, std::enable_if_t<std::is_base_of_v<VLXKDMJavaObject, P>>> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, P& out, long) {
    LocalRef owned(env, result);
    return FrameAccess::Attach(out, env, result);
  }
};

// A void method: nothing lands, the status stays.
struct NoResult {};
template <> struct ResultOf<NoResult> {
  using Raw = void;
};

// An operation that ends in another operation of the library (forwardTo): no Java call of its
// own; the other operation's result is the status.
struct Forwarded {
  using Raw = void;
};

// ---- Schema enumerations ---------------------------------------------------------------------
// Each native enumeration stands for the Java constants in consecutive slots of the binding table,
// in value order. A getter that finds a null or unknown object writes the enumeration's default;
// the aggregation type has none and then leaves the caller's value alone.

template <class E>
struct EnumTable;
template <> struct EnumTable<VLXKDMAttributeType::Type> {
  static constexpr const char* kName = "VLXKDMAttributeType::Type";
  static constexpr Slot kFirst = AttributeType_Integer;
  static constexpr int kCount = 7;
  static constexpr bool kHasDefault = true;
  static constexpr VLXKDMAttributeType::Type kDefault = VLXKDMAttributeType::String;
};
template <> struct EnumTable<VLXKDMAccessMode::Mode> {
  static constexpr const char* kName = "VLXKDMAccessMode::Mode";
  static constexpr Slot kFirst = AccessMode_Read;
  static constexpr int kCount = 3;
  static constexpr bool kHasDefault = true;
  static constexpr VLXKDMAccessMode::Mode kDefault = VLXKDMAccessMode::Read;
};
template <> struct EnumTable<VLXKDMAggregationType::Type> {
  static constexpr const char* kName = "VLXKDMAggregationType::Type";
  static constexpr Slot kFirst = AggregationType_Composition;
  static constexpr int kCount = 2;
  static constexpr bool kHasDefault = false;
  static constexpr VLXKDMAggregationType::Type kDefault = VLXKDMAggregationType::Composition;
};
template <> struct EnumTable<VLXKDMClassType::Type> {
  static constexpr const char* kName = "VLXKDMClassType::Type";
  static constexpr Slot kFirst = ClassType_Class;
  static constexpr int kCount = 2;
  static constexpr bool kHasDefault = true;
  static constexpr VLXKDMClassType::Type kDefault = VLXKDMClassType::Class;
};
template <> struct EnumTable<VLXKDMVisibility::Mode> {
  static constexpr const char* kName = "VLXKDMVisibility::Mode";
  static constexpr Slot kFirst = Visibility_Public;
  static constexpr int kCount = 3;
  static constexpr bool kHasDefault = true;
  static constexpr VLXKDMVisibility::Mode kDefault = VLXKDMVisibility::Public;
};

// Where a broken enumeration argument is reported: the assertion text, source path and line.
struct Assertion {
  const char* message;
  const char* file;
  int line;
};

// An enumeration argument: sent as its Java constant, mapped before any other argument. A value
// without a constant is a broken precondition, reported through VLXFatalError; if the handler
// returns, the operation fails with an invalid-argument error and Java is not called.
template <class E>
struct EnumArg {
  E value;
  Assertion assertion;
};
template <class E>
EnumArg<E> Enum(E value, Assertion assertion) { return EnumArg<E>{value, assertion}; }

// Records that value is none of the enumerators of the enumeration name; returns VLX_E_INVALIDARG.
inline long RejectEnumerator(const char* name, int value) {
  VLXJBXException* error = new VLXJBXException(VLXJBXMessages::InvalidArgument);
  const std::string what = std::string("the enumeration ") + name;
  const std::string why = "the value " + std::to_string(value) + " is none of its enumerators";
  const VLXUnicodeString parameters[2] = {VLXUnicodeString(what.c_str()), VLXUnicodeString(why.c_str())};
  error->SetNLSRequestParams(2, parameters);
  VLXError::VLXCleanLastError();
  VLXError::GetReturn(2, error, nullptr, __FILE__, __LINE__);
  return VLX_E_INVALIDARG;
}

template <class E>
struct ArgOf<EnumArg<E>> {
  using J = jobject;
  static constexpr bool kOwnsRef = false;
  static constexpr bool kEarly = true;
  static long To(JNIEnv*, const EnumArg<E>& arg, J& out) {
    using Table = EnumTable<E>;
    const int value = static_cast<int>(arg.value);
    out = value >= 0 && value < Table::kCount
              ? FrameAccess::Table()->Constant(static_cast<Slot>(Table::kFirst + value))
              : nullptr;
    if (out) return VLX_S_OK;
    VLXFatalError(arg.assertion.message, nullptr, nullptr, nullptr, arg.assertion.file, arg.assertion.line);
    return RejectEnumerator(Table::kName, value);
  }
};

// An enumeration out-parameter: the returned Java object compared by identity with the constants.
template <class E>
struct EnumOut {
  E& value;
};
template <class E>
EnumOut<E> Enum(E& value) { return EnumOut<E>{value}; }

template <class E>
struct ResultOf<EnumOut<E>> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, EnumOut<E>& out, long status) {
    using Table = EnumTable<E>;
    if (!result) {
      if (Table::kHasDefault) out.value = Table::kDefault;
      return status;
    }
    const ReplicaStubs* st = FrameAccess::Table();
    int found = -1;
    for (int value = 0; value < Table::kCount && found < 0; ++value) {
      const jobject constant = st->Constant(static_cast<Slot>(Table::kFirst + value));
      if (constant && VLXJBXJNIHelper::IsSameObject(env, result, constant)) found = value;
    }
    VLXJBXJNIHelper::DeleteLocalRef(env, result);
    if (found >= 0)
      out.value = static_cast<E>(found);
    else if (Table::kHasDefault)
      out.value = Table::kDefault;
    return status;
  }
};

// ---- Attribute values -------------------------------------------------------------------------
// The value converters, the value holder and how attribute values cross in the frame.

// The value converters of the proxy base and the platform's, as one public overload set, for the
// frame and the value holder, which convert only once the Java side is started with no exception
// pending: a text then goes without that check.
struct Values : VLXKDMJavaObject {
  using VLXKDMJavaObject::BuildFromJavaType;
  using VLXKDMJavaObject::ConvertToJavaType;
  static long ConvertToJavaType(JNIEnv* env, const VLXUnicodeString& input, jobject& output) {
    jstring text = nullptr;
    const long status = VLXJBXJNIConverter::ConvertToJavaString(env, input, text);
    if (status >= 0) output = text;
    return status;
  }
  template <class Native>
  static auto ConvertToJavaType(JNIEnv* env, const Native& input, jobject& output)
      -> decltype(VLXJBXJNIConverter::ConvertToJavaType(env, input, output)) {
    return VLXJBXJNIConverter::ConvertToJavaType(env, input, output);
  }
  template <class Native>
  static auto BuildFromJavaType(JNIEnv* env, jobject input, Native& output)
      -> decltype(VLXJBXJNIConverter::BuildFromJavaType(env, input, output)) {
    return VLXJBXJNIConverter::BuildFromJavaType(env, input, output);
  }
};

// The Java class of object (not null) for an error text: "a java.lang.Long".
inline std::string ClassText(JNIEnv* env, jobject object) {
  VLXUnicodeString name;
  return VLXJBXJNIUtilities::GetClassName(env, object, name) < 0 ? std::string("of a class whose name cannot be read")
                                                                 : std::string("a ") + name.c_str();
}

// Records that operation was given a value it cannot take (why says which and why) as the thread's
// last error; returns VLX_E_INVALIDARG.
inline long RejectValue(const char* operation, const std::string& why) {
  VLXJBXException* error = new VLXJBXException(VLXJBXMessages::InvalidArgument);
  const VLXUnicodeString parameters[2] = {VLXUnicodeString(operation), VLXUnicodeString(why.c_str())};
  error->SetNLSRequestParams(2, parameters);
  VLXError::VLXCleanLastError();
  VLXError::GetReturn(2, error, nullptr, __FILE__, __LINE__);
  return VLX_E_INVALIDARG;
}

// A native value sent as its Java object, made by the value converters: .with(name, AsJava(42)).
// The object is released after the call, except a single instance's, which is the proxy's own.
template <class T>
struct JavaForm {
  const T& value;
};
template <class T>
JavaForm<T> AsJava(const T& value) { return JavaForm<T>{value}; }

template <class T>
struct ArgOf<JavaForm<T>> {
  using J = jobject;
  static constexpr bool kOwnsRef = !std::is_same_v<T, VLXKDMInstance>;
  static constexpr bool kEarly = false;
  static long To(JNIEnv* env, const JavaForm<T>& arg, J& out) { return Values::ConvertToJavaType(env, arg.value, out); }
};

// A value holder sent as its Java object: BuildRemote runs first, before any other argument is
// converted, and its failure stops the operation; then the holder's own handle goes to Java.
struct RemoteForm {
  VLXKDMInstanceValue& value;
};
inline RemoteForm Remote(VLXKDMInstanceValue& value) { return RemoteForm{value}; }

template <>
struct ArgOf<RemoteForm> {
  using J = jobject;
  static constexpr bool kOwnsRef = false;
  static constexpr bool kEarly = true;
  static long To(JNIEnv*, const RemoteForm& arg, J& out) {
    const long status = arg.value.BuildRemote();
    if (status < 0) return status;
    out = arg.value.GetHandle();
    return VLX_S_OK;
  }
};
// A holder passed bare would go without its Java form: pass Remote(value) instead.
template <>
struct ArgOf<VLXKDMInstanceValue>;

// A returned attribute value read into the holder; a failure, or a null answer (no value), leaves
// the holder exactly as it was. (GetValue lands through its own out-parameter, which also names the
// attribute when it has no value.)
template <>
struct ResultOf<VLXKDMInstanceValue> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, VLXKDMInstanceValue& out, long) {
    LocalRef owned(env, result);
    if (!result) return RejectValue("VLXKDMInstanceValue::BuildLocal()", "the Java method answered no value");
    return FrameAccess::Read(out, env, result);
  }
};

// ---- The frame -------------------------------------------------------------------------------

enum class Target { Handle, Class, Constructor };

template <class... A>
class Bound;

class Call {
 public:
  // An instance method of a built proxy.
  Call(VLXKDMJavaObject& self, const char* name, Slot method)
      : _self(&self), _name(name), _method(method), _class(SlotCount), _target(Target::Handle) {}

  // A static method of the class in slot cls; no proxy is needed.
  static Call Static(const char* name, Slot cls, Slot method) {
    return Call(nullptr, name, method, cls, Target::Class);
  }
  // A new Java object of the class in slot cls, made by constructor ctor and attached to self; self
  // need not be built.
  static Call Construct(VLXKDMJavaObject& self, const char* name, Slot cls, Slot ctor) {
    Call call(nullptr, name, ctor, cls, Target::Constructor);
    call._created = &self;
    return call;
  }

  // The rest of a frame that an operation forwarding here has started on env (steps 1 to 3 done
  // for the same proxy, no exception pending); null runs the whole frame.
  Call& startedOn(JNIEnv* env) {
    _started = env;
    return *this;
  }

  // A failed argument conversion returns the converter's code as it is, untranslated.
  Call& rawConversionCode() {
    _rawConversionCode = true;
    return *this;
  }

  // The arguments, in the Java method's parameter order.
  template <class... A>
  Bound<A...> with(const A&... args) const;
  // Shorthands for a method without arguments.
  template <class Out>
  long returning(Out&& out) const;
  long run() const;
  long construct() const;

 private:
  template <class... A>
  friend class Bound;

  Call(VLXKDMJavaObject* self, const char* name, Slot method, Slot cls, Target target)
      : _self(self), _name(name), _method(method), _class(cls), _target(target) {}

  VLXKDMJavaObject* _self;
  VLXKDMJavaObject* _created = nullptr;
  JNIEnv* _started = nullptr;
  const char* _name;
  Slot _method;
  Slot _class;
  Target _target;
  bool _rawConversionCode = false;
};

template <class... A>
class Bound {
 public:
  Bound(const Call& call, const A&... args) : _call(call), _args(args...) {}

  // The method returns a value that lands in out.
  template <class Out>
  long returning(Out&& out) {
    return Execute<ResultOf<std::decay_t<Out>>>(out);
  }
  // The method returns nothing.
  long run() {
    NoResult none;
    return Execute<ResultOf<NoResult>>(none);
  }
  // The constructor's new object is attached to the proxy given to Call::Construct.
  long construct() { return Execute<ResultOf<VLXKDMJavaObject>>(*_call._created); }
  // In place of step 6, the environment and the converted arguments go to next, which makes the
  // Java call through an operation of the library (usually started on that environment); its result
  // is the status that step 9 translates under this operation's name.
  template <class Next>
  long forwardTo(Next&& next) {
    return Execute<Forwarded>(next);
  }

 private:
  using JArgs = std::tuple<typename ArgOf<A>::J...>;
  static constexpr std::size_t kArity = sizeof...(A);

  template <class Result, class Out>
  long Execute(Out& out) {
    const char* const name = _call._name;
    JNIEnv* env = _call._started;                                                   // 1
    long status = VLX_S_OK;
    if (!env) {
      status = FrameAccess::Start(_call._self, env, name);                          // 2
      if (status < 0) return VLXKDMJavaObject::HandleReplicaError(env, status, name);  // 3
    }
    ReplicaStubs* st = FrameAccess::Table();                                        // 4
    if (!st) return VLX_E_FAIL;
    if (!st->IsBound()) return st->ReportUnbound(name);

    JArgs jargs{};                                                                  // 5
    const long converted = ConvertAll(env, jargs, std::index_sequence_for<A...>{});
    if (converted < 0) {
      ReleaseAll(env, jargs, std::index_sequence_for<A...>{});
      return _call._rawConversionCode ? converted
                                      : VLXKDMJavaObject::HandleReplicaError(env, converted, name);
    }
    if (kArity > 0) status = converted;

    using Raw = typename Result::Raw;                                               // 6
    if constexpr (std::is_same_v<Result, Forwarded>) {
      status = std::apply([&](auto... j) { return out(env, j...); }, jargs);
      ReleaseAll(env, jargs, std::index_sequence_for<A...>{});                      // 7
      // The other operation ran the whole frame: its success leaves no exception pending.
      if (status >= 0) return VLX_S_OK;
    } else if constexpr (std::is_void_v<Raw>) {
      Invoke<void>(env, *st, jargs);
      ReleaseAll(env, jargs, std::index_sequence_for<A...>{});                      // 7
    } else {
      const Raw result = Invoke<Raw>(env, *st, jargs);
      ReleaseAll(env, jargs, std::index_sequence_for<A...>{});                      // 7
      if (!VLXJBXJNIHelper::ExceptionCheck(env)) {                                  // 8
        status = Result::Land(env, result, out, status);
        // A landing that succeeds leaves no exception behind: the converters and the value
        // holder fail on any exception they meet.
        if (status >= 0) return VLX_S_OK;
      }
    }
    return VLXKDMJavaObject::HandleReplicaError(env, status, name);                 // 9
  }

  // Converts the arguments, enumeration constants first; stops at the first failure. Returns the
  // last conversion's code.
  template <std::size_t... I>
  long ConvertAll(JNIEnv* env, JArgs& jargs, std::index_sequence<I...>) {
    long status = VLX_S_OK;
    [[maybe_unused]] auto one = [&](auto& jarg, const auto& arg) {
      using T = std::decay_t<decltype(arg)>;
      status = ArgOf<T>::To(env, arg, jarg);
      return status >= 0;
    };
    const bool early = (... && (!ArgOf<A>::kEarly || one(std::get<I>(jargs), std::get<I>(_args))));
    if (early) (void)(... && (ArgOf<A>::kEarly || one(std::get<I>(jargs), std::get<I>(_args))));
    return status;
  }

  template <std::size_t... I>
  static void ReleaseAll(JNIEnv* env, JArgs& jargs, std::index_sequence<I...>) {
    [[maybe_unused]] auto one = [env](auto& jarg, bool owns) {
      if constexpr (std::is_pointer_v<std::decay_t<decltype(jarg)>>) {
        if (owns && jarg) VLXJBXJNIHelper::DeleteLocalRef(env, jarg);
        jarg = nullptr;
      }
    };
    (one(std::get<I>(jargs), ArgOf<A>::kOwnsRef), ...);
  }

  // Step 6: the Call*Method that fits the target and the Java return type.
  template <class Raw>
  Raw Invoke(JNIEnv* env, const ReplicaStubs& st, JArgs& jargs) {
    const jmethodID method = st.Method(_call._method);
    return std::apply(
        [&](auto... j) -> Raw {
          switch (_call._target) {
            case Target::Constructor:
              if constexpr (std::is_same_v<Raw, jobject>)
                return VLXJBXJNIHelper::NewObject(env, st.Class(_call._class), method, j...);
              break;
            case Target::Class:
              if constexpr (std::is_void_v<Raw>)
                return VLXJBXJNIHelper::CallStaticVoidMethod(env, st.Class(_call._class), method, j...);
              else if constexpr (std::is_same_v<Raw, jobject>)
                return VLXJBXJNIHelper::CallStaticObjectMethod(env, st.Class(_call._class), method, j...);
              break;
            case Target::Handle: {
              const jobject self = _call._self->GetHandle();
              if constexpr (std::is_void_v<Raw>)
                return VLXJBXJNIHelper::CallVoidMethod(env, self, method, j...);
              else if constexpr (std::is_same_v<Raw, jobject>)
                return VLXJBXJNIHelper::CallObjectMethod(env, self, method, j...);
              else if constexpr (std::is_same_v<Raw, jboolean>)
                return VLXJBXJNIHelper::CallBooleanMethod(env, self, method, j...);
              else if constexpr (std::is_same_v<Raw, jint>)
                return VLXJBXJNIHelper::CallIntMethod(env, self, method, j...);
              break;
            }
          }
          return Raw();
        },
        jargs);
  }

  const Call& _call;
  std::tuple<const A&...> _args;
};

template <class... A>
Bound<A...> Call::with(const A&... args) const {
  return Bound<A...>(*this, args...);
}
template <class Out>
long Call::returning(Out&& out) const {
  return with().returning(std::forward<Out>(out));
}
inline long Call::run() const { return with().run(); }
inline long Call::construct() const { return with().construct(); }

}  // namespace corvexa
