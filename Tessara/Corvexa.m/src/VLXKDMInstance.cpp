#include "VLXKDMInstance.h"

#include <cstdarg>
#include <string>

#include "CallFrame.h"
#include "ProxyMembers.h"
#include "Variadic.h"
#include "VLXKDMInstanceValue.h"
#include "VLXJBXJNIUtilities.h"
#include "VLXListValVLXKDMInstance.h"

using namespace corvexa;

namespace corvexa {

// The four out-parameters of GetID.
struct IdentifierOut {
  VLXBoolean& noID;
  VLXBoolean& isText;
  VLXUnicodeString& text;
  VLXBinary& bytes;
};

// An identifier that is neither a text nor bytes: records a last error naming its Java class and
// returns VLX_E_FAIL.
inline long RejectIdentifier(JNIEnv* env, jobject identifier, const char* name)
{
  return VLXJBXException::Raise(
      VLX_E_FAIL, VLXJBXMessages::ConversionFailed,
      {name, "the identifier is " + ClassText(env, identifier) + ", neither a java.lang.String nor a byte array"},
      __FILE__, __LINE__);
}

// "getID" answers null, a Java string or a Java byte array; the class is compared by identity.
template <>
struct ResultOf<IdentifierOut> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, IdentifierOut& out, long status)
  {
    LocalRef owned(env, result);
    if (!result) {
      out.noID = 1;
      return status;
    }
    out.noID = 0;
    const ReplicaStubs* st = FrameAccess::Table();
    const LocalRef cls(env, VLXJBXJNIHelper::GetObjectClass(env, result));
    if (VLXJBXJNIHelper::IsSameObject(env, cls.get(), st->Class(String))) {
      status = VLXJBXJNIConverter::BuildFromJavaType(env, result, out.text);
      out.isText = 1;
    } else if (VLXJBXJNIHelper::IsSameObject(env, cls.get(), st->Class(ByteArray))) {
      status = VLXJBXJNIConverter::BuildFromJavaType(env, result, out.bytes);
      out.isText = 0;
    } else {
      status = RejectIdentifier(env, result,
                                "VLXKDMInstance::GetID(VLXBoolean&, VLXBoolean&, VLXUnicodeString&, VLXBinary&)");
    }
    return status;
  }
};

// GetValue's out-parameter, with what names the attribute when it has no value.
template <class Attribute>
struct ValueOut {
  VLXKDMInstanceValue& value;
  const VLXKDMInstance& instance;
  const Attribute& attribute;
  const char* operation;
};

inline std::string AttributeText(const VLXUnicodeString& name) { return std::string("'") + name.c_str() + "'"; }
inline std::string AttributeText(int position) { return "at position " + std::to_string(position); }

// "getValue" answers the attribute's Java value, or null when it has none: the holder is then left
// as it was, and the failure names the attribute and the instance.
template <class Attribute>
struct ResultOf<ValueOut<Attribute>> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, ValueOut<Attribute>& out, long)
  {
    LocalRef owned(env, result);
    if (result) return FrameAccess::Read(out.value, env, result);
    VLXUnicodeString instance;
    const LocalRef text(env, VLXJBXJNIHelper::CallObjectMethod(env, out.instance.GetHandle(),
                                                               FrameAccess::Table()->Method(Instance_toString)));
    if (VLXJBXJNIHelper::ExceptionCheck(env) ||
        VLXJBXJNIConverter::BuildFromJavaString(env, static_cast<jstring>(text.get()), instance) < 0) {
      VLXJBXJNIHelper::ExceptionClear(env);
      instance = VLXUnicodeString("the instance");
    }
    return RejectValue(out.operation,
                       "the attribute " + AttributeText(out.attribute) + " of " + instance.c_str() + " has no value");
  }
};

}  // namespace corvexa

VLXKDM_PROXY_DEFINITIONS(VLXKDMInstance, Instance)

long VLXKDMInstance::GetClassDef(VLXKDMClassDef& classDef) const
{
  return Call(*this, "VLXKDMInstance::GetClassDef(VLXKDMClassDef&)", slot<Instance_getClassDef>).returning(classDef);
}

long VLXKDMInstance::GetID(VLXBoolean& noID, VLXBoolean& isText, VLXUnicodeString& text, VLXBinary& bytes) const
{
  return Call(*this, "VLXKDMInstance::GetID(VLXBoolean&, VLXBoolean&, VLXUnicodeString&, VLXBinary&)",
              slot<Instance_getID>)
      .returning(IdentifierOut{noID, isText, text, bytes});
}

long VLXKDMInstance::SetID(const VLXUnicodeString& id)
{
  return Call(*this, "VLXKDMInstance::SetID(const VLXUnicodeString&)", slot<Instance_setID>).with(id).run();
}

long VLXKDMInstance::SetID(const VLXBinary& id)
{
  return Call(*this, "VLXKDMInstance::SetID(const VLXBinary&)", slot<Instance_setID>).with(id).run();
}

long VLXKDMInstance::IsCreated(VLXBoolean& created) const
{
  return Call(*this, "VLXKDMInstance::IsCreated(VLXBoolean&)", slot<Instance_isCreated>).returning(created);
}

long VLXKDMInstance::IsModified(VLXBoolean& modified) const
{
  return Call(*this, "VLXKDMInstance::IsModified(VLXBoolean&)", slot<Instance_isModified>).returning(modified);
}

long VLXKDMInstance::IsDeleted(VLXBoolean& deleted) const
{
  return Call(*this, "VLXKDMInstance::IsDeleted(VLXBoolean&)", slot<Instance_isDeleted>).returning(deleted);
}

long VLXKDMInstance::IsValuated(const VLXUnicodeString& name, VLXBoolean& valuated) const
{
  return Call(*this, "VLXKDMInstance::IsValuated(const VLXUnicodeString&, VLXBoolean&)", slot<Instance_isValuatedNamed>)
      .rawConversionCode()
      .with(name)
      .returning(valuated);
}

long VLXKDMInstance::IsValuated(int position, VLXBoolean& valuated) const
{
  return Call(*this, "VLXKDMInstance::IsValuated(int, VLXBoolean&)", slot<Instance_isValuatedAt>)
      .with(position)
      .returning(valuated);
}

long VLXKDMInstance::ClearValue(const VLXUnicodeString& name)
{
  return Call(*this, "VLXKDMInstance::ClearValue(const VLXUnicodeString&)", slot<Instance_clearValueNamed>)
      .with(name)
      .run();
}

long VLXKDMInstance::ClearValue(int position)
{
  return Call(*this, "VLXKDMInstance::ClearValue(int)", slot<Instance_clearValueAt>).with(position).run();
}

long VLXKDMInstance::ToString(VLXUnicodeString& text) const
{
  return Call(*this, "VLXKDMInstance::ToString(VLXUnicodeString&)", slot<Instance_toString>).returning(text);
}

long VLXKDMInstance::ToString(VLXBoolean withValues, VLXUnicodeString& text) const
{
  return Call(*this, "VLXKDMInstance::ToString(VLXBoolean, VLXUnicodeString&)", slot<Instance_toStringWithValues>)
      .with(withValues)
      .returning(text);
}

// ---- Values ----------------------------------------------------------------------------------

long VLXKDMInstance::GetValue(const VLXUnicodeString& name, VLXKDMInstanceValue& value) const
{
  const char* const text = "VLXKDMInstance::GetValue(const VLXUnicodeString&, VLXKDMInstanceValue&)";
  return Call(*this, text, slot<Instance_getValueNamed>)
      .rawConversionCode()
      .with(name)
      .returning(ValueOut<VLXUnicodeString>{value, *this, name, text});
}

long VLXKDMInstance::GetValue(int position, VLXKDMInstanceValue& value) const
{
  const char* const text = "VLXKDMInstance::GetValue(int, VLXKDMInstanceValue&)";
  return Call(*this, text, slot<Instance_getValueAt>)
      .with(position)
      .returning(ValueOut<int>{value, *this, position, text});
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, VLXKDMInstanceValue& value)
{
  return Call(*this, "VLXKDMInstance::SetValue(const VLXUnicodeString&, VLXKDMInstanceValue&)",
              slot<Instance_setValueNamed>)
      .with(name, Remote(value))
      .run();
}

long VLXKDMInstance::SetValue(int position, VLXKDMInstanceValue& value)
{
  return Call(*this, "VLXKDMInstance::SetValue(int, VLXKDMInstanceValue&)", slot<Instance_setValueAt>)
      .with(position, Remote(value))
      .run();
}

template <class Attribute>
long VLXKDMInstance::SetObject(JNIEnv* started, const Attribute& attribute, jobject object)
{
  constexpr bool kAt = std::is_same_v<Attribute, int>;
  constexpr Slot kSetValue = kAt ? Instance_setValueAt : Instance_setValueNamed;
  return Call(*this,
              kAt ? "VLXKDMInstance::SetValue(int, jobject)"
                  : "VLXKDMInstance::SetValue(const VLXUnicodeString&, jobject)",
              slot<kSetValue>)
      .startedOn(started)
      .with(attribute, object)
      .run();
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, jobject object) { return SetObject(nullptr, name, object); }

long VLXKDMInstance::SetValue(int position, jobject object) { return SetObject(nullptr, position, object); }

// The typed setter's own frame converts the value; the Java call is the private SetValue's, in the
// same frame.
template <class Attribute, class T>
long VLXKDMInstance::SetConverted(const char* methodName, const Attribute& attribute, const T& value)
{
  constexpr Slot setValue = std::is_same_v<Attribute, int> ? Instance_setValueAt : Instance_setValueNamed;
  return Call(*this, methodName, slot<setValue>).with(AsJava(value)).forwardTo([&](JNIEnv* env, jobject object) {
    return SetObject(env, attribute, object);
  });
}

// ---- Typed setters ---------------------------------------------------------------------------

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, int value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, int)", name, value);
}

long VLXKDMInstance::SetValue(int position, int value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, int)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, double value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, double)", name, value);
}

long VLXKDMInstance::SetValue(int position, double value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, double)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, VLXBoolean value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, VLXBoolean)", name, value);
}

long VLXKDMInstance::SetValue(int position, VLXBoolean value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, VLXBoolean)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, bool value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, bool)", name, VLXBoolean(value ? 1 : 0));
}

long VLXKDMInstance::SetValue(int position, bool value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, bool)", position, VLXBoolean(value ? 1 : 0));
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, const VLXUnicodeString& value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXUnicodeString&)", name, value);
}

long VLXKDMInstance::SetValue(int position, const VLXUnicodeString& value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, const VLXUnicodeString&)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, const VLXTime& value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXTime&)", name, value);
}

long VLXKDMInstance::SetValue(int position, const VLXTime& value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, const VLXTime&)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, const VLXBinary& value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXBinary&)", name, value);
}

long VLXKDMInstance::SetValue(int position, const VLXBinary& value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, const VLXBinary&)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, const VLXKDMInstance& value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXKDMInstance&)", name, value);
}

long VLXKDMInstance::SetValue(int position, const VLXKDMInstance& value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, const VLXKDMInstance&)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, const VLXListOfInt& value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfInt&)", name, value);
}

long VLXKDMInstance::SetValue(int position, const VLXListOfInt& value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, const VLXListOfInt&)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, const VLXListOfDouble& value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfDouble&)", name, value);
}

long VLXKDMInstance::SetValue(int position, const VLXListOfDouble& value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, const VLXListOfDouble&)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, const VLXListOfVLXBoolean& value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfVLXBoolean&)", name, value);
}

long VLXKDMInstance::SetValue(int position, const VLXListOfVLXBoolean& value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, const VLXListOfVLXBoolean&)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, const VLXListOfVLXUnicodeString& value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfVLXUnicodeString&)", name,
                      value);
}

long VLXKDMInstance::SetValue(int position, const VLXListOfVLXUnicodeString& value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, const VLXListOfVLXUnicodeString&)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, const VLXListOfVLXTime& value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfVLXTime&)", name, value);
}

long VLXKDMInstance::SetValue(int position, const VLXListOfVLXTime& value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, const VLXListOfVLXTime&)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, const VLXListOfVLXBinary& value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfVLXBinary&)", name, value);
}

long VLXKDMInstance::SetValue(int position, const VLXListOfVLXBinary& value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, const VLXListOfVLXBinary&)", position, value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, const VLXListOfVLXKDMInstance& value)
{
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfVLXKDMInstance&)", name, value);
}

long VLXKDMInstance::SetValue(int position, const VLXListOfVLXKDMInstance& value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, const VLXListOfVLXKDMInstance&)", position, value);
}

// ---- Variadic setters ------------------------------------------------------------------------
// Each gathers its count values, then runs its list twin. A null binary or text pointer gives the
// empty value; a null time or instance pointer is refused, as a negative count is.

namespace {

template <class T>
T ValueAt(const T* pointer)
{
  return pointer ? *pointer : T();
}

// The conversions, as lambdas so that the gathering loop inlines them. Any non-zero boolean
// argument is true.
constexpr auto kTruth = [](int b) { return static_cast<VLXBoolean>(b != 0); };
constexpr auto kSame = [](auto value) { return value; };

long GatherBinaries(const char* op, int n, va_list a, VLXListValVLXBinary& l)
{
  return Gather<const VLXBinary*>(op, n, a, l, ValueAt<VLXBinary>);
}
long GatherBooleans(const char* op, int n, va_list a, VLXListValVLXBoolean& l)
{
  return Gather<int>(op, n, a, l, kTruth);
}
long GatherDates(const char* op, int n, va_list a, VLXListValVLXTime& l)
{
  return Gather<const VLXTime*, true>(op, n, a, l, ValueAt<VLXTime>);
}
long GatherDoubles(const char* op, int n, va_list a, VLXRawColldouble& l) { return Gather<double>(op, n, a, l, kSame); }
long GatherInstances(const char* op, int n, va_list a, VLXListValVLXKDMInstance& l)
{
  return Gather<const VLXKDMInstance*, true>(op, n, a, l, ValueAt<VLXKDMInstance>);
}
long GatherIntegers(const char* op, int n, va_list a, VLXRawCollint& l) { return Gather<int>(op, n, a, l, kSame); }

}  // namespace

#define VLXKDM_VARIADIC_SETTER(Operation, Attribute, List, gather)                               \
  long VLXKDMInstance::Operation(Attribute attribute, int count, ...)                            \
  {                                                                                              \
    VLXKDM_GATHER_THEN(List, gather, "VLXKDMInstance::" #Operation "(" #Attribute ", int, ...)", \
                       [&](const List& list) { return SetValue(attribute, list); });             \
  }

VLXKDM_VARIADIC_SETTER(SetValueBinaries, const VLXUnicodeString&, VLXListValVLXBinary, GatherBinaries)
VLXKDM_VARIADIC_SETTER(SetValueBinaries, int, VLXListValVLXBinary, GatherBinaries)
VLXKDM_VARIADIC_SETTER(SetValueBooleans, const VLXUnicodeString&, VLXListValVLXBoolean, GatherBooleans)
VLXKDM_VARIADIC_SETTER(SetValueBooleans, int, VLXListValVLXBoolean, GatherBooleans)
VLXKDM_VARIADIC_SETTER(SetValueDates, const VLXUnicodeString&, VLXListValVLXTime, GatherDates)
VLXKDM_VARIADIC_SETTER(SetValueDates, int, VLXListValVLXTime, GatherDates)
VLXKDM_VARIADIC_SETTER(SetValueDoubles, const VLXUnicodeString&, VLXRawColldouble, GatherDoubles)
VLXKDM_VARIADIC_SETTER(SetValueDoubles, int, VLXRawColldouble, GatherDoubles)
VLXKDM_VARIADIC_SETTER(SetValueInstances, const VLXUnicodeString&, VLXListValVLXKDMInstance, GatherInstances)
VLXKDM_VARIADIC_SETTER(SetValueInstances, int, VLXListValVLXKDMInstance, GatherInstances)
VLXKDM_VARIADIC_SETTER(SetValueIntegers, const VLXUnicodeString&, VLXRawCollint, GatherIntegers)
VLXKDM_VARIADIC_SETTER(SetValueIntegers, int, VLXRawCollint, GatherIntegers)
VLXKDM_VARIADIC_SETTER(SetValueStrings, const VLXUnicodeString&, VLXListValVLXUnicodeString, GatherTexts)
VLXKDM_VARIADIC_SETTER(SetValueStrings, int, VLXListValVLXUnicodeString, GatherTexts)

#undef VLXKDM_VARIADIC_SETTER
