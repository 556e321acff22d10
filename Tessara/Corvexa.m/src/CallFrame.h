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
// How each native type crosses is said once, by the ArgOf and ResultOf tables of Crossings.h,
// EnumCrossings.h and ValueCrossings.h.
#pragma once

#include <cstddef>
#include <string_view>
#include <tuple>
#include <type_traits>
#include <utility>

#include "Crossings.h"
#include "EnumCrossings.h"
#include "ValueCrossings.h"

namespace corvexa {

// ---- The frame -------------------------------------------------------------------------------

enum class Target { Handle, Class, Constructor };

// A binding-table slot known at compile time: slot<Replica_getName>. The frame checks the slot's
// JNI signature against the C++ types that cross at the call (SignatureFits below).
template <Slot S>
struct SlotTag {
};
template <Slot S>
inline constexpr SlotTag<S> slot{};

// ---- The signature check ----------------------------------------------------------------------
// A row's JNI signature must fit the JNI types its call passes and receives: a drift between the
// binding table and a call site fails the build instead of the user's process.

// The length of the JNI type at the start of t ("I", "[B", "Ljava/lang/String;").
constexpr std::size_t JniTypeLength(std::string_view t)
{
  std::size_t i = 0;
  while (i < t.size() && t[i] == '[') ++i;
  if (i < t.size() && t[i] == 'L')
    while (i < t.size() && t[i] != ';') ++i;
  return i + 1;
}

// Whether a value of the JNI type J passes for the JNI type t (any reference passes for an Object).
template <class J>
constexpr bool JniFits(std::string_view t)
{
  if constexpr (std::is_pointer_v<J>)
    if (t == "Ljava/lang/Object;") return true;
  if constexpr (std::is_void_v<J>)
    return t == "V";
  else if constexpr (std::is_same_v<J, jint>)
    return t == "I";
  else if constexpr (std::is_same_v<J, jboolean>)
    return t == "Z";
  else if constexpr (std::is_same_v<J, jdouble>)
    return t == "D";
  else if constexpr (std::is_same_v<J, jlong>)
    return t == "J";
  else if constexpr (std::is_same_v<J, jstring>)
    return t == "Ljava/lang/String;";
  else if constexpr (std::is_same_v<J, jbyteArray>)
    return t == "[B";
  else if constexpr (std::is_same_v<J, jobjectArray>)
    return t.size() > 1 && t[0] == '[' && (t[1] == 'L' || t[1] == '[');
  else if constexpr (std::is_same_v<J, jobject>)
    return !t.empty() && (t[0] == 'L' || t[0] == '[');
  else
    return false;
}

// Whether the row of slot S is a method whose parameters are J... and whose result is Raw (a
// constructor's is its new object).
template <Slot S, class Raw, class... J>
constexpr bool SignatureFits()
{
  const BindingRow row = kBindingRows[S];
  if (row.signature == nullptr) return false;
  const std::string_view signature(row.signature);
  if (signature.empty() || signature[0] != '(') return false;
  std::size_t at = 1;
  bool fits = true;
  [[maybe_unused]] auto parameter = [&](bool one) {
    if (!fits || at >= signature.size() || signature[at] == ')') return fits = false;
    const std::size_t length = JniTypeLength(signature.substr(at));
    fits = one;
    at += length;
    return fits;
  };
  (parameter(JniFits<J>(signature.substr(at, JniTypeLength(signature.substr(at))))), ...);
  if (!fits || at >= signature.size() || signature[at] != ')') return false;
  const std::string_view result = signature.substr(at + 1);
  if (std::string_view(row.name) == "<init>") return result == "V" && std::is_same_v<Raw, jobject>;
  return JniFits<Raw>(result);
}

// ---- The frame -------------------------------------------------------------------------------

template <Slot S, class... A>
class Bound;

template <Slot S>
class Call {
 public:
  // An instance method of a built proxy.
  Call(VLXKDMJavaObject& self, const char* name, SlotTag<S>)
      : _self(&self), _name(name), _class(SlotCount), _target(Target::Handle)
  {
  }
  // The same for an operation that changes nothing on the native side (a const getter): the proxy
  // is only read, the Java call goes through its handle.
  Call(const VLXKDMJavaObject& self, const char* name, SlotTag<S>)
      : Call(const_cast<VLXKDMJavaObject&>(self), name, slot<S>)
  {
  }
  // A static method of the class in slot cls (CallStatic), or a constructor of that class whose new
  // object is attached to created (Construct).
  Call(const char* name, Slot cls, Target target, VLXKDMJavaObject* created)
      : _self(nullptr), _created(created), _name(name), _class(cls), _target(target)
  {
  }

  // The rest of a frame that an operation forwarding here has started on env (steps 1 to 3 done
  // for the same proxy, no exception pending); null runs the whole frame.
  Call& startedOn(JNIEnv* env)
  {
    _started = env;
    return *this;
  }

  // A failed argument conversion returns the converter's code as it is, untranslated.
  Call& rawConversionCode()
  {
    _rawConversionCode = true;
    return *this;
  }

  // The arguments, in the Java method's parameter order.
  template <class... A>
  Bound<S, A...> with(const A&... args) const;
  // Shorthands for a method without arguments.
  template <class Out>
  long returning(Out&& out) const;
  long run() const;
  long construct() const;

 private:
  template <Slot, class...>
  friend class Bound;

  VLXKDMJavaObject* _self;
  VLXKDMJavaObject* _created = nullptr;
  JNIEnv* _started = nullptr;
  const char* _name;
  Slot _class;
  Target _target;
  bool _rawConversionCode = false;
};

// A static method of the class in slot cls; no proxy is needed.
template <Slot S>
Call<S> CallStatic(const char* name, Slot cls, SlotTag<S>)
{
  return Call<S>(name, cls, Target::Class, nullptr);
}
// A new Java object of the class in slot cls, made by constructor S and attached to self; self
// need not be built.
template <Slot S>
Call<S> Construct(VLXKDMJavaObject& self, const char* name, Slot cls, SlotTag<S>)
{
  return Call<S>(name, cls, Target::Constructor, &self);
}

template <Slot S, class... A>
class Bound {
 public:
  Bound(const Call<S>& call, const A&... args) : _call(call), _args(args...) {}

  // The method returns a value that lands in out.
  template <class Out>
  long returning(Out&& out)
  {
    return Execute<ResultOf<std::decay_t<Out>>>(out);
  }
  // The method returns nothing.
  long run()
  {
    NoResult none;
    return Execute<ResultOf<NoResult>>(none);
  }
  // The constructor's new object is attached to the proxy given to Call::Construct.
  long construct() { return Execute<ResultOf<VLXKDMJavaObject>>(*_call._created); }
  // In place of step 6, the environment and the converted arguments go to next, which makes the
  // Java call through an operation of the library (usually started on that environment); its result
  // is the status that step 9 translates under this operation's name.
  template <class Next>
  long forwardTo(Next&& next)
  {
    return Execute<Forwarded>(next);
  }

 private:
  using JArgs = std::tuple<typename ArgOf<A>::J...>;
  static constexpr std::size_t kArity = sizeof...(A);

  template <class Result, class Out>
  long Execute(Out& out)
  {
    // A forwarded operation makes its Java call through another, which is checked there.
    static_assert(
        std::is_same_v<Result, Forwarded> || SignatureFits<S, typename Result::Raw, typename ArgOf<A>::J...>(),
        "the binding table's signature of this slot does not fit the types the call passes");
    const char* const name = _call._name;
    JNIEnv* env = _call._started;  // 1
    long status = VLX_S_OK;
    if (!env) {
      status = FrameAccess::Start(_call._self, env, name);                             // 2
      if (status < 0) return VLXKDMJavaObject::HandleReplicaError(env, status, name);  // 3
    }
    ReplicaStubs* st = FrameAccess::Table();  // 4
    if (!st) return VLX_E_FAIL;
    if (!st->IsBound()) return st->ReportUnbound(name);

    JArgs jargs{};  // 5
    const long converted = ConvertAll(env, jargs, std::index_sequence_for<A...>{});
    if (converted < 0) {
      ReleaseAll(env, jargs, std::index_sequence_for<A...>{});
      return _call._rawConversionCode ? converted : VLXKDMJavaObject::HandleReplicaError(env, converted, name);
    }
    if (kArity > 0) status = converted;

    using Raw = typename Result::Raw;  // 6
    if constexpr (std::is_same_v<Result, Forwarded>) {
      status = std::apply([&](auto... j) { return out(env, j...); }, jargs);
      ReleaseAll(env, jargs, std::index_sequence_for<A...>{});  // 7
      // The other operation ran the whole frame: its success leaves no exception pending.
      if (status >= 0) return VLX_S_OK;
    } else if constexpr (std::is_void_v<Raw>) {
      Invoke<void>(env, *st, jargs);
      ReleaseAll(env, jargs, std::index_sequence_for<A...>{});  // 7
    } else {
      const Raw result = Invoke<Raw>(env, *st, jargs);
      ReleaseAll(env, jargs, std::index_sequence_for<A...>{});  // 7
      if (!VLXJBXJNIHelper::ExceptionCheck(env)) {              // 8
        status = Result::Land(env, result, out, status);
        // A landing that succeeds leaves no exception behind: the converters and the value
        // holder fail on any exception they meet.
        if (status >= 0) return VLX_S_OK;
      }
    }
    return VLXKDMJavaObject::HandleReplicaError(env, status, name);  // 9
  }

  // Converts the arguments, enumeration constants first; stops at the first failure. Returns the
  // last conversion's code.
  template <std::size_t... I>
  long ConvertAll(JNIEnv* env, JArgs& jargs, std::index_sequence<I...>)
  {
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
  static void ReleaseAll(JNIEnv* env, JArgs& jargs, std::index_sequence<I...>)
  {
    [[maybe_unused]] auto one = [env](auto& jarg, bool owns) {
      if constexpr (std::is_pointer_v<std::decay_t<decltype(jarg)>>) {
        if (owns) LocalRef(env, jarg);  // taken over and deleted here
        jarg = nullptr;
      }
    };
    (one(std::get<I>(jargs), ArgOf<A>::kOwnsRef), ...);
  }

  // Step 6: the Call*Method that fits the target and the Java return type.
  template <class Raw>
  Raw Invoke(JNIEnv* env, const ReplicaStubs& st, JArgs& jargs)
  {
    const jmethodID method = st.Method(S);
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
              else if constexpr (std::is_same_v<Raw, jlong>)
                return VLXJBXJNIHelper::CallStaticLongMethod(env, st.Class(_call._class), method, j...);
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

  const Call<S>& _call;
  std::tuple<const A&...> _args;
};

template <Slot S>
template <class... A>
Bound<S, A...> Call<S>::with(const A&... args) const
{
  return Bound<S, A...>(*this, args...);
}
template <Slot S>
template <class Out>
long Call<S>::returning(Out&& out) const
{
  return with().returning(std::forward<Out>(out));
}
template <Slot S>
long Call<S>::run() const
{
  return with().run();
}
template <Slot S>
long Call<S>::construct() const
{
  return with().construct();
}

}  // namespace corvexa
