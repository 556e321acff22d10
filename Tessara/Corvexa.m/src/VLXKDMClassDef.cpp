#include "VLXKDMClassDef.h"

#include "CallFrame.h"
#include "ProxyMembers.h"
#include "Variadic.h"

using namespace corvexa;

namespace {
// Fixed report path (and lines): callers and their tests match on them; keep them as they are.
const char* const kSource = "Tessara\\Corvexa.m\\src\\VLXKDMClassDef.cpp";
}  // namespace

VLXKDM_PROXY_DEFINITIONS(VLXKDMClassDef, ClassDef)

long VLXKDMClassDef::Build(const VLXUnicodeString& name)
{
  return Construct(*this, "VLXKDMClassDef::Build(const VLXUnicodeString&)", ClassDef, slot<ClassDef_new_name>)
      .with(name)
      .construct();
}

long VLXKDMClassDef::Build()
{
  return Construct(*this, "VLXKDMClassDef::Build()", ClassDef, slot<ClassDef_new>).construct();
}

long VLXKDMClassDef::GetClassName(VLXUnicodeString& name) const
{
  return Call(*this, "VLXKDMClassDef::GetClassName(VLXUnicodeString&)", slot<ClassDef_getClassName>).returning(name);
}

long VLXKDMClassDef::SetClassName(const VLXUnicodeString& name)
{
  return Call(*this, "VLXKDMClassDef::SetClassName(const VLXUnicodeString&)", slot<ClassDef_setClassName>)
      .with(name)
      .run();
}

long VLXKDMClassDef::GetSuperName(VLXUnicodeString& name) const
{
  return Call(*this, "VLXKDMClassDef::GetSuperName(VLXUnicodeString&)", slot<ClassDef_getSuperName>).returning(name);
}

long VLXKDMClassDef::SetSuperName(const VLXUnicodeString& name)
{
  return Call(*this, "VLXKDMClassDef::SetSuperName(const VLXUnicodeString&)", slot<ClassDef_setSuperName>)
      .with(name)
      .run();
}

long VLXKDMClassDef::GetUuid(VLXUnicodeString& uuid) const
{
  return Call(*this, "VLXKDMClassDef::GetUuid(VLXUnicodeString&)", slot<ClassDef_getUuid>).returning(uuid);
}

long VLXKDMClassDef::SetUuid(const VLXUnicodeString& uuid)
{
  return Call(*this, "VLXKDMClassDef::SetUuid(const VLXUnicodeString&)", slot<ClassDef_setUuid>).with(uuid).run();
}

long VLXKDMClassDef::GetQKAComment(VLXUnicodeString& comment) const
{
  return Call(*this, "VLXKDMClassDef::GetQKAComment(VLXUnicodeString&)", slot<ClassDef_getQKAComment>)
      .returning(comment);
}

long VLXKDMClassDef::SetQKAComment(const VLXUnicodeString& comment)
{
  return Call(*this, "VLXKDMClassDef::SetQKAComment(const VLXUnicodeString&)", slot<ClassDef_setQKAComment>)
      .with(comment)
      .run();
}

long VLXKDMClassDef::GetQKADerivability(VLXUnicodeString& derivability) const
{
  return Call(*this, "VLXKDMClassDef::GetQKADerivability(VLXUnicodeString&)", slot<ClassDef_getQKADerivability>)
      .returning(derivability);
}

long VLXKDMClassDef::SetQKADerivability(const VLXUnicodeString& derivability)
{
  return Call(*this, "VLXKDMClassDef::SetQKADerivability(const VLXUnicodeString&)", slot<ClassDef_setQKADerivability>)
      .with(derivability)
      .run();
}

long VLXKDMClassDef::GetScopeNames(VLXListOfVLXUnicodeString& names) const
{
  return Call(*this, "VLXKDMClassDef::GetScopeNames(VLXListOfVLXUnicodeString&)", slot<ClassDef_getScopeNames>)
      .returning(names);
}

long VLXKDMClassDef::SetScopeNames(const VLXListOfVLXUnicodeString& names)
{
  return Call(*this, "VLXKDMClassDef::SetScopeNames(const VLXListOfVLXUnicodeString&)", slot<ClassDef_setScopeNames>)
      .with(names)
      .run();
}

long VLXKDMClassDef::SetScopeNames(int count, ...)
{
  VLXKDM_GATHER_THEN(VLXListValVLXUnicodeString, GatherTexts, "VLXKDMClassDef::SetScopeNames(int, ...)", SetScopeNames);
}

long VLXKDMClassDef::IsAbstract(VLXBoolean& isAbstract) const
{
  return Call(*this, "VLXKDMClassDef::IsAbstract(VLXBoolean&)", slot<ClassDef_isAbstract>).returning(isAbstract);
}

long VLXKDMClassDef::SetAbstract(VLXBoolean isAbstract)
{
  return Call(*this, "VLXKDMClassDef::SetAbstract(VLXBoolean)", slot<ClassDef_setAbstract>).with(isAbstract).run();
}

long VLXKDMClassDef::IsExtensible(VLXBoolean& isExtensible) const
{
  return Call(*this, "VLXKDMClassDef::IsExtensible(VLXBoolean&)", slot<ClassDef_isExtensible>).returning(isExtensible);
}

long VLXKDMClassDef::SetExtensibility(VLXBoolean isExtensible)
{
  return Call(*this, "VLXKDMClassDef::SetExtensibility(VLXBoolean)", slot<ClassDef_setExtensibility>)
      .with(isExtensible)
      .run();
}

long VLXKDMClassDef::IsPersistent(VLXBoolean& isPersistent) const
{
  return Call(*this, "VLXKDMClassDef::IsPersistent(VLXBoolean&)", slot<ClassDef_isPersistent>).returning(isPersistent);
}

long VLXKDMClassDef::SetPersistency(VLXBoolean isPersistent)
{
  return Call(*this, "VLXKDMClassDef::SetPersistency(VLXBoolean)", slot<ClassDef_setPersistency>)
      .with(isPersistent)
      .run();
}

long VLXKDMClassDef::GetClassType(VLXKDMClassType::Type& type) const
{
  return Call(*this, "VLXKDMClassDef::GetClassType(VLXKDMClassType::Type&)", slot<ClassDef_getClassType>)
      .returning(Enum(type));
}

long VLXKDMClassDef::SetClassType(VLXKDMClassType::Type type)
{
  return Call(*this, "VLXKDMClassDef::SetClassType(VLXKDMClassType::Type)", slot<ClassDef_setClassType>)
      .with(Enum(type, {"AssertionFailed:type != NULL", kSource, 341}))
      .run();
}

long VLXKDMClassDef::GetSoftwareVisibility(VLXKDMVisibility::Mode& visibility) const
{
  return Call(*this, "VLXKDMClassDef::GetSoftwareVisibility(VLXKDMVisibility::Mode&)",
              slot<ClassDef_getSoftwareVisibility>)
      .returning(Enum(visibility));
}

long VLXKDMClassDef::SetSoftwareVisibility(VLXKDMVisibility::Mode visibility)
{
  return Call(*this, "VLXKDMClassDef::SetSoftwareVisibility(VLXKDMVisibility::Mode)",
              slot<ClassDef_setSoftwareVisibility>)
      .with(Enum(visibility, {"AssertionFailed:vis != NULL", kSource, 211}))
      .run();
}

long VLXKDMClassDef::GetAttributes(VLXKDMAttributeDefList& attributes) const
{
  return Call(*this, "VLXKDMClassDef::GetAttributes(VLXKDMAttributeDefList&)", slot<ClassDef_getAttributes>)
      .returning(attributes);
}

long VLXKDMClassDef::ToString(VLXUnicodeString& text) const
{
  return Call(*this, "VLXKDMClassDef::ToString(VLXUnicodeString&)", slot<ClassDef_toString>).returning(text);
}
