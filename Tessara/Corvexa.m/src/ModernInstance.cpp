// corvexa::Instance: typed values read straight from the Java object the attribute holds (one call
// frame, no value holder), and written through the call frame as their Java form.
#include <climits>
#include <cstring>

#include "ModernSupport.h"

namespace corvexa {

namespace {

using Helper = VLXJBXJNIHelper;

// The smallest and largest milliseconds a time_point holds.
constexpr long long kMinMs = std::chrono::duration_cast<std::chrono::milliseconds>(time_point::duration::min()).count();
constexpr long long kMaxMs = std::chrono::duration_cast<std::chrono::milliseconds>(time_point::duration::max()).count();

long long MillisecondsOf(time_point t)
{
  return std::chrono::floor<std::chrono::milliseconds>(t.time_since_epoch()).count();
}

// What a read lands in: the value, whether there was one, and what names the read in a refusal.
template <class T>
struct Typed {
  T& value;
  const char* operation;
  std::string_view attribute;
  const char* wanted;
  bool has = false;
};

template <class T>
long Mismatch(JNIEnv* env, jobject object, Typed<T>& out)
{
  return RejectValue(out.operation, "the attribute '" + std::string(out.attribute) + "' holds " +
                                        ClassText(env, object) + ", not " + out.wanted);
}

bool Is(JNIEnv* env, jobject object, Slot cls)
{
  return Helper::IsInstanceOf(env, object, FrameAccess::Table()->Class(cls));
}

long ReadDate(JNIEnv* env, jobject date, time_point& out)
{
  const long long ms = Helper::CallLongMethod(env, date, FrameAccess::Table()->Method(Date_getTime));
  if (Helper::ExceptionCheck(env)) return VLX_E_FAIL;
  if (ms < kMinMs || ms > kMaxMs)
    return RejectValue("corvexa::Instance::get<time_point>",
                       "the date of " + std::to_string(ms) + " ms lies beyond what a time_point holds");
  out = time_point(std::chrono::duration_cast<time_point::duration>(std::chrono::milliseconds(ms)));
  return VLX_S_OK;
}

// The conversions from the attribute's Java object (not null) to the native value.
template <class T>
long Convert(JNIEnv* env, jobject object, Typed<T>& out);

template <>
long Convert(JNIEnv* env, jobject object, Typed<int>& out)
{
  if (!Is(env, object, Integer)) return Mismatch(env, object, out);
  out.value = Helper::CallIntMethod(env, object, FrameAccess::Table()->Method(Integer_intValue));
  return Helper::ExceptionCheck(env) ? VLX_E_FAIL : VLX_S_OK;
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<double>& out)
{
  if (!Is(env, object, Double)) return Mismatch(env, object, out);
  out.value = Helper::CallDoubleMethod(env, object, FrameAccess::Table()->Method(Double_doubleValue));
  return Helper::ExceptionCheck(env) ? VLX_E_FAIL : VLX_S_OK;
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<bool>& out)
{
  if (!Is(env, object, Boolean)) return Mismatch(env, object, out);
  out.value = Helper::CallBooleanMethod(env, object, FrameAccess::Table()->Method(Boolean_booleanValue)) == JNI_TRUE;
  return Helper::ExceptionCheck(env) ? VLX_E_FAIL : VLX_S_OK;
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<std::string>& out)
{
  if (!Is(env, object, String)) return Mismatch(env, object, out);
  VLXUnicodeString text;
  const long status = VLXJBXJNIConverter::BuildFromJavaString(env, static_cast<jstring>(object), text);
  if (status >= 0) out.value = Text(text);
  return status;
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<time_point>& out)
{
  return Is(env, object, Slot::Date) ? ReadDate(env, object, out.value) : Mismatch(env, object, out);
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<bytes>& out)
{
  if (!Is(env, object, ByteArray)) return Mismatch(env, object, out);
  const auto array = static_cast<jbyteArray>(object);
  bytes read(static_cast<std::size_t>(Helper::GetArrayLength(env, array)));
  if (!read.empty())
    env->GetByteArrayRegion(array, 0, static_cast<jsize>(read.size()), reinterpret_cast<jbyte*>(read.data()));
  out.value.swap(read);
  return Helper::ExceptionCheck(env) ? VLX_E_FAIL : VLX_S_OK;
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<InstanceHandle>& out)
{
  if (!Is(env, object, Slot::Instance)) return Mismatch(env, object, out);
  VLXKDMInstance proxy;
  const long status = FrameAccess::Attach(proxy, env, object);
  if (status >= 0) out.value = InstanceHandle(proxy);
  return status;
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<std::vector<int>>& out)
{
  if (!Is(env, object, IntArray)) return Mismatch(env, object, out);
  const auto array = static_cast<jintArray>(object);
  std::vector<int> read(static_cast<std::size_t>(Helper::GetArrayLength(env, array)));
  if (!read.empty()) env->GetIntArrayRegion(array, 0, static_cast<jsize>(read.size()), read.data());
  out.value.swap(read);
  return Helper::ExceptionCheck(env) ? VLX_E_FAIL : VLX_S_OK;
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<std::vector<double>>& out)
{
  if (!Is(env, object, DoubleArray)) return Mismatch(env, object, out);
  const auto array = static_cast<jdoubleArray>(object);
  std::vector<double> read(static_cast<std::size_t>(Helper::GetArrayLength(env, array)));
  if (!read.empty()) env->GetDoubleArrayRegion(array, 0, static_cast<jsize>(read.size()), read.data());
  out.value.swap(read);
  return Helper::ExceptionCheck(env) ? VLX_E_FAIL : VLX_S_OK;
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<std::vector<bool>>& out)
{
  if (!Is(env, object, BooleanArray)) return Mismatch(env, object, out);
  const auto array = static_cast<jbooleanArray>(object);
  std::vector<jboolean> flags(static_cast<std::size_t>(Helper::GetArrayLength(env, array)));
  if (!flags.empty()) env->GetBooleanArrayRegion(array, 0, static_cast<jsize>(flags.size()), flags.data());
  out.value.assign(flags.size(), false);
  for (std::size_t i = 0; i < flags.size(); ++i) out.value[i] = flags[i] != JNI_FALSE;
  return Helper::ExceptionCheck(env) ? VLX_E_FAIL : VLX_S_OK;
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<std::vector<std::string>>& out)
{
  if (!Is(env, object, StringArray)) return Mismatch(env, object, out);
  VLXListValVLXUnicodeString texts;
  const long status = VLXJBXJNIConverter::BuildFromJavaType(env, object, texts);
  if (status < 0) return status;
  out.value.clear();
  out.value.reserve(static_cast<std::size_t>(texts.Size()));
  for (const VLXUnicodeString& text : texts) out.value.push_back(Text(text));
  return VLX_S_OK;
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<std::vector<time_point>>& out)
{
  if (!Is(env, object, DateArray)) return Mismatch(env, object, out);
  const auto array = static_cast<jobjectArray>(object);
  std::vector<time_point> read(static_cast<std::size_t>(Helper::GetArrayLength(env, array)));
  for (std::size_t i = 0; i < read.size(); ++i) {
    const LocalRef date(env, Helper::GetObjectArrayElement(env, array, static_cast<jsize>(i)));
    if (!date.get())
      return RejectValue(out.operation, "a date of the attribute '" + std::string(out.attribute) + "' is null");
    const long status = ReadDate(env, date.get(), read[i]);
    if (status < 0) return status;
  }
  out.value.swap(read);
  return VLX_S_OK;
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<std::vector<bytes>>& out)
{
  if (!Is(env, object, ByteArrayArray)) return Mismatch(env, object, out);
  VLXListValVLXBinary buffers;
  const long status = Values::BuildFromJavaType(env, object, buffers);
  if (status < 0) return status;
  out.value.clear();
  for (const VLXBinary& b : buffers) {
    const auto* data = reinterpret_cast<const std::byte*>(b.getData());
    out.value.emplace_back(data, data + b.getLength());
  }
  return VLX_S_OK;
}
template <>
long Convert(JNIEnv* env, jobject object, Typed<std::vector<InstanceHandle>>& out)
{
  if (!Is(env, object, InstanceArray)) return Mismatch(env, object, out);
  VLXListValVLXKDMInstance proxies;
  const long status = FrameAccess::Build(proxies, env, object);
  if (status < 0) return status;
  out.value.clear();
  for (const VLXKDMInstance& proxy : proxies) out.value.emplace_back(proxy);
  return VLX_S_OK;
}

}  // namespace

// "getValue" answers the attribute's Java object, or null when it has none.
template <class T>
struct ResultOf<Typed<T>> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, Typed<T>& out, long status)
  {
    const LocalRef owned(env, result);
    out.has = result != nullptr;
    return result ? Convert(env, result, out) : status;
  }
};

// A date sent as a java.util.Date of its milliseconds, a list of them as a Date[].
struct Millis {
  long long ms;
};
struct MillisList {
  const std::vector<time_point>& dates;
};
template <>
struct ArgOf<Millis> {
  using J = jobject;
  static constexpr bool kOwnsRef = true;
  static constexpr bool kEarly = false;
  static long To(JNIEnv* env, const Millis& arg, J& out)
  {
    const ReplicaStubs* st = FrameAccess::Table();
    out = Helper::NewObject(env, st->Class(Slot::Date), st->Method(Date_new), static_cast<jlong>(arg.ms));
    return out && !Helper::ExceptionCheck(env) ? VLX_S_OK : VLX_E_FAIL;
  }
};
template <>
struct ArgOf<MillisList> {
  using J = jobject;
  static constexpr bool kOwnsRef = true;
  static constexpr bool kEarly = false;
  static long To(JNIEnv* env, const MillisList& arg, J& out)
  {
    const ReplicaStubs* st = FrameAccess::Table();
    LocalRef array(env, Helper::NewObjectArray(env, static_cast<jsize>(arg.dates.size()), st->Class(Date), nullptr));
    if (!array.get()) return VLX_E_FAIL;
    for (std::size_t i = 0; i < arg.dates.size(); ++i) {
      jobject date = nullptr;
      if (ArgOf<Millis>::To(env, Millis{MillisecondsOf(arg.dates[i])}, date) < 0) return VLX_E_FAIL;
      const LocalRef owned(env, date);
      Helper::SetObjectArrayElement(env, static_cast<jobjectArray>(array.get()), static_cast<jsize>(i), date);
    }
    out = array.release();
    return VLX_S_OK;
  }
};

// ---- Reads ------------------------------------------------------------------------------------

namespace {

template <class T>
bool Read(const VLXKDMInstance& proxy, std::string_view attribute, T& value, const char* operation, const char* wanted)
{
  Typed<T> out{value, operation, attribute, wanted};
  Check(Call(proxy, operation, slot<Instance_getValueNamed>).with(Text(attribute)).returning(out), operation,
        attribute);
  return out.has;
}

}  // namespace

#define CORVEXA_READ(T, wanted)                                                          \
  bool Instance::read(std::string_view attribute, T& value) const                        \
  {                                                                                      \
    return Read(_proxy, attribute, value, "corvexa::Instance::get<" wanted ">", wanted); \
  }
CORVEXA_READ(int, "int")
CORVEXA_READ(double, "double")
CORVEXA_READ(bool, "bool")
CORVEXA_READ(std::string, "std::string")
CORVEXA_READ(time_point, "time_point")
CORVEXA_READ(bytes, "bytes")
CORVEXA_READ(InstanceHandle, "Instance")
CORVEXA_READ(std::vector<int>, "std::vector<int>")
CORVEXA_READ(std::vector<double>, "std::vector<double>")
CORVEXA_READ(std::vector<bool>, "std::vector<bool>")
CORVEXA_READ(std::vector<std::string>, "std::vector<std::string>")
CORVEXA_READ(std::vector<time_point>, "std::vector<time_point>")
CORVEXA_READ(std::vector<bytes>, "std::vector<bytes>")
CORVEXA_READ(std::vector<InstanceHandle>, "std::vector<Instance>")
#undef CORVEXA_READ

void Instance::no_value(std::string_view attribute) const
{
  Refuse("corvexa::Instance::get", attribute, "the attribute '" + std::string(attribute) + "' has no value");
}

bool Instance::has_value(std::string_view attribute) const
{
  VLXBoolean valuated = 0;
  Check(_proxy.IsValuated(Text(attribute), valuated), "corvexa::Instance::has_value", attribute);
  return valuated != 0;
}

// ---- Writes -----------------------------------------------------------------------------------

namespace {

template <class Arg>
void Write(VLXKDMInstance& proxy, std::string_view attribute, const Arg& arg, const char* operation)
{
  Check(Call(proxy, operation, slot<Instance_setValueNamed>).with(Text(attribute), arg).run(), operation, attribute);
}

// An instance value must refer to an instance: an empty handle is refused here.
void Referring(const InstanceHandle& value, const char* operation, std::string_view attribute)
{
  if (!value) Refuse(operation, attribute, "an empty Instance handle cannot be a value");
}

}  // namespace

void Instance::set(std::string_view attribute, int value)
{
  Write(_proxy, attribute, AsJava(value), "corvexa::Instance::set(int)");
}
void Instance::set(std::string_view attribute, double value)
{
  Write(_proxy, attribute, AsJava(value), "corvexa::Instance::set(double)");
}
void Instance::set(std::string_view attribute, bool value)
{
  const VLXBoolean flag = value ? 1 : 0;
  Write(_proxy, attribute, AsJava(flag), "corvexa::Instance::set(bool)");
}
void Instance::set(std::string_view attribute, std::string_view value)
{
  Write(_proxy, attribute, AsJava(Text(value)), "corvexa::Instance::set(std::string)");
}
void Instance::set(std::string_view attribute, time_point value)
{
  Write(_proxy, attribute, Millis{MillisecondsOf(value)}, "corvexa::Instance::set(time_point)");
}
void Instance::set(std::string_view attribute, const bytes& value)
{
  Write(_proxy, attribute, AsJava(Binary(value)), "corvexa::Instance::set(bytes)");
}
void Instance::set(std::string_view attribute, const InstanceHandle& value)
{
  const char* const operation = "corvexa::Instance::set(Instance)";
  Referring(value, operation, attribute);
  Write(_proxy, attribute, AsJava(value._proxy), operation);
}
void Instance::set(std::string_view attribute, const std::vector<int>& values)
{
  VLXRawCollint list;
  list.Assign(values.data(), Length(values.size()));
  Write(_proxy, attribute, AsJava(list), "corvexa::Instance::set(std::vector<int>)");
}
void Instance::set(std::string_view attribute, const std::vector<double>& values)
{
  VLXRawColldouble list;
  list.Assign(values.data(), Length(values.size()));
  Write(_proxy, attribute, AsJava(list), "corvexa::Instance::set(std::vector<double>)");
}
void Instance::set(std::string_view attribute, const std::vector<bool>& values)
{
  VLXListValVLXBoolean list(static_cast<int>(values.size()));
  for (bool v : values) list.Append(v ? 1 : 0);
  Write(_proxy, attribute, AsJava(list), "corvexa::Instance::set(std::vector<bool>)");
}
void Instance::set(std::string_view attribute, const std::vector<std::string>& values)
{
  VLXListValVLXUnicodeString list(static_cast<int>(values.size()));
  for (const std::string& v : values) list.Append(Text(v));
  Write(_proxy, attribute, AsJava(list), "corvexa::Instance::set(std::vector<std::string>)");
}
void Instance::set(std::string_view attribute, const std::vector<time_point>& values)
{
  Write(_proxy, attribute, MillisList{values}, "corvexa::Instance::set(std::vector<time_point>)");
}
void Instance::set(std::string_view attribute, const std::vector<bytes>& values)
{
  VLXListValVLXBinary list(static_cast<int>(values.size()));
  for (const bytes& v : values) list.Append(Binary(v));
  Write(_proxy, attribute, AsJava(list), "corvexa::Instance::set(std::vector<bytes>)");
}
void Instance::set(std::string_view attribute, const std::vector<InstanceHandle>& values)
{
  const char* const operation = "corvexa::Instance::set(std::vector<Instance>)";
  VLXListValVLXKDMInstance list(static_cast<int>(values.size()));
  for (const InstanceHandle& v : values) {
    Referring(v, operation, attribute);
    list.Append(v._proxy);
  }
  Write(_proxy, attribute, AsJava(list), operation);
}

void Instance::clear(std::string_view attribute)
{
  Check(_proxy.ClearValue(Text(attribute)), "corvexa::Instance::clear", attribute);
}

// ---- Identifier, states, text -------------------------------------------------------------------

std::optional<std::string> Instance::id() const
{
  VLXBoolean none = 1, isText = 0;
  VLXUnicodeString text;
  VLXBinary data;
  Check(_proxy.GetID(none, isText, text, data), "corvexa::Instance::id");
  return none || !isText ? std::nullopt : std::optional<std::string>(Text(text));
}

std::optional<bytes> Instance::bytes_id() const
{
  VLXBoolean none = 1, isText = 0;
  VLXUnicodeString text;
  VLXBinary data;
  Check(_proxy.GetID(none, isText, text, data), "corvexa::Instance::bytes_id");
  if (none || isText) return std::nullopt;
  const auto* begin = reinterpret_cast<const std::byte*>(data.getData());
  return bytes(begin, begin + data.getLength());
}

void Instance::set_id(std::string_view id) { Check(_proxy.SetID(Text(id)), "corvexa::Instance::set_id", id); }

void Instance::set_id(const bytes& id) { Check(_proxy.SetID(Binary(id)), "corvexa::Instance::set_id(bytes)"); }

#define CORVEXA_STATE(member, Getter)                           \
  bool Instance::member() const                                 \
  {                                                             \
    VLXBoolean state = 0;                                       \
    Check(_proxy.Getter(state), "corvexa::Instance::" #member); \
    return state != 0;                                          \
  }
CORVEXA_STATE(is_created, IsCreated)
CORVEXA_STATE(is_modified, IsModified)
CORVEXA_STATE(is_deleted, IsDeleted)
#undef CORVEXA_STATE

std::string Instance::class_name() const
{
  VLXKDMClassDef cls;
  Check(_proxy.GetClassDef(cls), "corvexa::Instance::class_name");
  VLXUnicodeString name;
  Check(cls.GetClassName(name), "corvexa::Instance::class_name");
  return Text(name);
}

std::string Instance::to_string(bool with_values) const
{
  VLXUnicodeString text;
  Check(_proxy.ToString(with_values ? 1 : 0, text), "corvexa::Instance::to_string");
  return Text(text);
}

}  // namespace corvexa
