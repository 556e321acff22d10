#include "VLXKDMInstance.h"

#include <string>

#include "CallFrame.h"
#include "ProxyMembers.h"

using namespace corvexa;

namespace corvexa {

// The four out-parameters of GetID.
struct IdentifierOut {
  VLXBoolean& noID;
  VLXBoolean& isText;
  VLXUnicodeString& text;
  VLXBinary& bytes;
};

// The Java name of a class of the binding table ("java/lang/Integer", "[I"), or null for a class
// the table does not hold.
inline const char* TableClassPath(JNIEnv* env, jclass cls)
{
  static const struct {
    Slot slot;
    const char* path;
  } kClasses[] = {
#define CLASS(name, path) {name, path},
#define METHOD(name, member, signature)
#define STATIC(name, member, signature)
#define SETTER_FIRST(name, member, signature)
#define CONSTANT(name, field)
#define RESERVED(name)
#include "BindingTable.def"
#undef CLASS
#undef METHOD
#undef STATIC
#undef SETTER_FIRST
#undef CONSTANT
#undef RESERVED
  };
  const ReplicaStubs* st = FrameAccess::Table();
  for (const auto& c : kClasses)
    if (VLXJBXJNIHelper::IsSameObject(env, cls, st->Class(c.slot))) return c.path;
  return nullptr;
}

// An identifier that is neither a text nor bytes: records a last error naming its class and
// returns VLX_E_FAIL.
inline long RejectIdentifier(JNIEnv* env, jclass cls, const char* name)
{
  const char* path = TableClassPath(env, cls);
  const std::string what = std::string("the identifier is ") +
                           (path ? std::string("a ") + path : std::string("of a Java class the library does not know")) +
                           ", neither a java/lang/String nor a byte array ([B)";
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
      status = RejectIdentifier(env, static_cast<jclass>(cls.get()),
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
