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
  VLXUnicodeString javaName;
  const std::string what = "the identifier is " +
                           (VLXJBXJNIUtilities::GetClassName(env, identifier, javaName) < 0
                                ? std::string("of a Java class whose name cannot be read")
                                : std::string("a ") + javaName.c_str()) +
                           ", neither a java.lang.String nor a byte array";
  VLXJBXException* error = new VLXJBXException(VLXJBXMessages::ConversionFailed);
  const VLXUnicodeString parameters[2] = {VLXUnicodeString(name), VLXUnicodeString(what.c_str())};
  error->SetNLSRequestParams(2, parameters);
  VLXError::VLXCleanLastError();
  VLXError::GetReturn(2, error, nullptr, __FILE__, __LINE__);
  return VLX_E_FAIL;
}

// "getID" answers null, a Java string or a Java byte array; the class is compared by identity.
template <>
struct ResultOf<IdentifierOut> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, IdentifierOut& out, long status) {
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

}  // namespace corvexa

VLXKDM_PROXY_DEFINITIONS(VLXKDMInstance)

long VLXKDMInstance::GetClassDef(VLXKDMClassDef& classDef)
{
  return Call(*this, "VLXKDMInstance::GetClassDef(VLXKDMClassDef&)", Instance_getClassDef).returning(classDef);
}

long VLXKDMInstance::GetID(VLXBoolean& noID, VLXBoolean& isText, VLXUnicodeString& text, VLXBinary& bytes)
{
  return Call(*this, "VLXKDMInstance::GetID(VLXBoolean&, VLXBoolean&, VLXUnicodeString&, VLXBinary&)", Instance_getID)
      .returning(IdentifierOut{noID, isText, text, bytes});
}

long VLXKDMInstance::SetID(const VLXUnicodeString& id)
{
  return Call(*this, "VLXKDMInstance::SetID(const VLXUnicodeString&)", Instance_setID).with(id).run();
}

long VLXKDMInstance::SetID(const VLXBinary& id)
{
  return Call(*this, "VLXKDMInstance::SetID(const VLXBinary&)", Instance_setID).with(id).run();
}

long VLXKDMInstance::IsCreated(VLXBoolean& created)
{
  return Call(*this, "VLXKDMInstance::IsCreated(VLXBoolean&)", Instance_isCreated).returning(created);
}

long VLXKDMInstance::IsModified(VLXBoolean& modified)
{
  return Call(*this, "VLXKDMInstance::IsModified(VLXBoolean&)", Instance_isModified).returning(modified);
}

long VLXKDMInstance::IsDeleted(VLXBoolean& deleted)
{
  return Call(*this, "VLXKDMInstance::IsDeleted(VLXBoolean&)", Instance_isDeleted).returning(deleted);
}

long VLXKDMInstance::IsValuated(const VLXUnicodeString& name, VLXBoolean& valuated)
{
  return Call(*this, "VLXKDMInstance::IsValuated(const VLXUnicodeString&, VLXBoolean&)", Instance_isValuatedNamed)
      .rawConversionCode()
      .with(name)
      .returning(valuated);
}

long VLXKDMInstance::IsValuated(int position, VLXBoolean& valuated)
{
  return Call(*this, "VLXKDMInstance::IsValuated(int, VLXBoolean&)", Instance_isValuatedAt)
      .with(position)
      .returning(valuated);
}

long VLXKDMInstance::ClearValue(const VLXUnicodeString& name)
{
  return Call(*this, "VLXKDMInstance::ClearValue(const VLXUnicodeString&)", Instance_clearValueNamed).with(name).run();
}

long VLXKDMInstance::ClearValue(int position)
{
  return Call(*this, "VLXKDMInstance::ClearValue(int)", Instance_clearValueAt).with(position).run();
}

long VLXKDMInstance::ToString(VLXUnicodeString& text)
{
  return Call(*this, "VLXKDMInstance::ToString(VLXUnicodeString&)", Instance_toString).returning(text);
}

long VLXKDMInstance::ToString(VLXBoolean withValues, VLXUnicodeString& text)
{
  return Call(*this, "VLXKDMInstance::ToString(VLXBoolean, VLXUnicodeString&)", Instance_toStringWithValues)
      .with(withValues)
      .returning(text);
}

// ---- Values ----------------------------------------------------------------------------------

long VLXKDMInstance::GetValue(const VLXUnicodeString& name, VLXKDMInstanceValue& value)
{
  return Call(*this, "VLXKDMInstance::GetValue(const VLXUnicodeString&, VLXKDMInstanceValue&)", Instance_getValueNamed)
      .rawConversionCode()
      .with(name)
      .returning(value);
}

long VLXKDMInstance::GetValue(int position, VLXKDMInstanceValue& value)
{
  return Call(*this, "VLXKDMInstance::GetValue(int, VLXKDMInstanceValue&)", Instance_getValueAt)
      .with(position)
      .returning(value);
}

long VLXKDMInstance::SetValue(const VLXUnicodeString& name, VLXKDMInstanceValue& value)
{
  return Call(*this, "VLXKDMInstance::SetValue(const VLXUnicodeString&, VLXKDMInstanceValue&)", Instance_setValueNamed)
      .with(name, Remote(value))
      .run();
}

long VLXKDMInstance::SetValue(int position, VLXKDMInstanceValue& value)
{
  return Call(*this, "VLXKDMInstance::SetValue(int, VLXKDMInstanceValue&)", Instance_setValueAt)
      .with(position, Remote(value))
      .run();
}

template <class Attribute>
long VLXKDMInstance::SetObject(JNIEnv* started, const Attribute& attribute, jobject object)
{
  constexpr bool kAt = std::is_same_v<Attribute, int>;
  return Call(*this, kAt ? "VLXKDMInstance::SetValue(int, jobject)" : "VLXKDMInstance::SetValue(const VLXUnicodeString&, jobject)",
              kAt ? Instance_setValueAt : Instance_setValueNamed)
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
  const Slot setValue = std::is_same_v<Attribute, int> ? Instance_setValueAt : Instance_setValueNamed;
  return Call(*this, methodName, setValue).with(AsJava(value)).forwardTo([&](JNIEnv* env, jobject object) {
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
  return SetConverted("VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfVLXKDMInstance&)", name,
                      value);
}

long VLXKDMInstance::SetValue(int position, const VLXListOfVLXKDMInstance& value)
{
  return SetConverted("VLXKDMInstance::SetValue(int, const VLXListOfVLXKDMInstance&)", position, value);
}

// ---- Variadic setters ------------------------------------------------------------------------
// Each gathers its count values, then runs its list twin; a null pointer gives the empty value.

namespace {

template <class T>
T ValueAt(const T* pointer)
{
  return pointer ? *pointer : T();
}

VLXListValVLXBinary GatherBinaries(int count, va_list args)
{
  return Gather<VLXListValVLXBinary, const VLXBinary*>(count, args, ValueAt<VLXBinary>);
}

VLXListValVLXBoolean GatherBooleans(int count, va_list args)
{
  return Gather<VLXListValVLXBoolean, int>(count, args, [](int b) { return static_cast<VLXBoolean>(b & 0xFF); });
}

VLXListValVLXTime GatherDates(int count, va_list args)
{
  return Gather<VLXListValVLXTime, const VLXTime*>(count, args, ValueAt<VLXTime>);
}

VLXRawColldouble GatherDoubles(int count, va_list args)
{
  return Gather<VLXRawColldouble, double>(count, args, [](double d) { return d; });
}

VLXListValVLXKDMInstance GatherInstances(int count, va_list args)
{
  return Gather<VLXListValVLXKDMInstance, const VLXKDMInstance*>(count, args, ValueAt<VLXKDMInstance>);
}

VLXRawCollint GatherIntegers(int count, va_list args)
{
  return Gather<VLXRawCollint, int>(count, args, [](int n) { return n; });
}

}  // namespace

#define VLXKDM_VARIADIC_SETTER(Operation, Attribute, gather) \
  long VLXKDMInstance::Operation(Attribute attribute, int count, ...) \
  {                                                                   \
    va_list args;                                                     \
    va_start(args, count);                                            \
    const auto values = gather(count, args);                          \
    va_end(args);                                                     \
    return SetValue(attribute, values);                               \
  }

VLXKDM_VARIADIC_SETTER(SetValueBinaries, const VLXUnicodeString&, GatherBinaries)
VLXKDM_VARIADIC_SETTER(SetValueBinaries, int, GatherBinaries)
VLXKDM_VARIADIC_SETTER(SetValueBooleans, const VLXUnicodeString&, GatherBooleans)
VLXKDM_VARIADIC_SETTER(SetValueBooleans, int, GatherBooleans)
VLXKDM_VARIADIC_SETTER(SetValueDates, const VLXUnicodeString&, GatherDates)
VLXKDM_VARIADIC_SETTER(SetValueDates, int, GatherDates)
VLXKDM_VARIADIC_SETTER(SetValueDoubles, const VLXUnicodeString&, GatherDoubles)
VLXKDM_VARIADIC_SETTER(SetValueDoubles, int, GatherDoubles)
VLXKDM_VARIADIC_SETTER(SetValueInstances, const VLXUnicodeString&, GatherInstances)
VLXKDM_VARIADIC_SETTER(SetValueInstances, int, GatherInstances)
VLXKDM_VARIADIC_SETTER(SetValueIntegers, const VLXUnicodeString&, GatherIntegers)
VLXKDM_VARIADIC_SETTER(SetValueIntegers, int, GatherIntegers)
VLXKDM_VARIADIC_SETTER(SetValueStrings, const VLXUnicodeString&, GatherTexts)
VLXKDM_VARIADIC_SETTER(SetValueStrings, int, GatherTexts)

#undef VLXKDM_VARIADIC_SETTER
