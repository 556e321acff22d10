#include "VLXKDMAttributeDef.h"

#include "CallFrame.h"
#include "ProxyMembers.h"
#include "VLXKDMClassDef.h"
#include "Variadic.h"

using namespace corvexa;

namespace {
// Fixed report path (and lines): callers and their tests match on them; keep them as they are.
const char* const kSource = "Tessara\\Corvexa.m\\src\\VLXKDMAttributeDef.cpp";
}  // namespace

VLXKDM_PROXY_DEFINITIONS(VLXKDMAttributeDef, AttributeDef)

long VLXKDMAttributeDef::Build(const VLXUnicodeString& name, VLXKDMAttributeType::Type type)
{
  return Construct(*this, "VLXKDMAttributeDef::Build(const VLXUnicodeString&, VLXKDMAttributeType::Type)", AttributeDef,
                   slot<AttributeDef_new_name_type>)
      .rawConversionCode()
      .with(name, Enum(type, {"AssertionFailed:type != NULL", kSource, 41}))
      .construct();
}

long VLXKDMAttributeDef::GetAttributeName(VLXUnicodeString& name) const
{
  return Call(*this, "VLXKDMAttributeDef::GetAttributeName(VLXUnicodeString&)", slot<AttributeDef_getAttributeName>)
      .returning(name);
}

long VLXKDMAttributeDef::GetAttributeType(VLXKDMAttributeType::Type& type) const
{
  return Call(*this, "VLXKDMAttributeDef::GetAttributeType(VLXKDMAttributeType::Type&)",
              slot<AttributeDef_getAttributeType>)
      .returning(Enum(type));
}

long VLXKDMAttributeDef::GetUuid(VLXUnicodeString& uuid) const
{
  return Call(*this, "VLXKDMAttributeDef::GetUuid(VLXUnicodeString&)", slot<AttributeDef_getUuid>).returning(uuid);
}

long VLXKDMAttributeDef::SetUuid(const VLXUnicodeString& uuid)
{
  return Call(*this, "VLXKDMAttributeDef::SetUuid(const VLXUnicodeString&)", slot<AttributeDef_setUuid>)
      .with(uuid)
      .run();
}

long VLXKDMAttributeDef::GetQKAComment(VLXUnicodeString& comment) const
{
  return Call(*this, "VLXKDMAttributeDef::GetQKAComment(VLXUnicodeString&)", slot<AttributeDef_getQKAComment>)
      .returning(comment);
}

long VLXKDMAttributeDef::SetQKAComment(const VLXUnicodeString& comment)
{
  return Call(*this, "VLXKDMAttributeDef::SetQKAComment(const VLXUnicodeString&)", slot<AttributeDef_setQKAComment>)
      .rawConversionCode()
      .with(comment)
      .run();
}

long VLXKDMAttributeDef::GetTargetNames(VLXListOfVLXUnicodeString& names) const
{
  return Call(*this, "VLXKDMAttributeDef::GetTargetNames(VLXListOfVLXUnicodeString&)",
              slot<AttributeDef_getTargetNames>)
      .returning(names);
}

long VLXKDMAttributeDef::SetTargetNames(const VLXListOfVLXUnicodeString& names)
{
  return Call(*this, "VLXKDMAttributeDef::SetTargetNames(const VLXListOfVLXUnicodeString&)",
              slot<AttributeDef_setTargetNames>)
      .rawConversionCode()
      .with(names)
      .run();
}

long VLXKDMAttributeDef::SetTargetNames(int count, ...)
{
  VLXKDM_GATHER_THEN(VLXListValVLXUnicodeString, GatherTexts, "VLXKDMAttributeDef::SetTargetNames(int, ...)",
                     SetTargetNames);
}

long VLXKDMAttributeDef::GetTargetRefs(VLXListOfVLXUnicodeString& refs) const
{
  return Call(*this, "VLXKDMAttributeDef::GetTargetRefs(VLXListOfVLXUnicodeString&)", slot<AttributeDef_getTargetRefs>)
      .returning(refs);
}

long VLXKDMAttributeDef::SetTargetRefs(const VLXListOfVLXUnicodeString& refs)
{
  return Call(*this, "VLXKDMAttributeDef::SetTargetRefs(const VLXListOfVLXUnicodeString&)",
              slot<AttributeDef_setTargetRefs>)
      .with(refs)
      .run();
}

long VLXKDMAttributeDef::SetTargetRefs(int count, ...)
{
  VLXKDM_GATHER_THEN(VLXListValVLXUnicodeString, GatherTexts, "VLXKDMAttributeDef::SetTargetRefs(int, ...)",
                     SetTargetRefs);
}

long VLXKDMAttributeDef::GetAggregationType(VLXKDMAggregationType::Type& type) const
{
  return Call(*this, "VLXKDMAttributeDef::GetAggregationType(VLXKDMAggregationType::Type&)",
              slot<AttributeDef_getAggregationType>)
      .returning(Enum(type));
}

long VLXKDMAttributeDef::SetAggregationType(VLXKDMAggregationType::Type type)
{
  return Call(*this, "VLXKDMAttributeDef::SetAggregationType(VLXKDMAggregationType::Type)",
              slot<AttributeDef_setAggregationType>)
      .with(Enum(type, {"AssertionFailed:agg != NULL", kSource, 139}))
      .run();
}

long VLXKDMAttributeDef::GetAccessMode(VLXKDMAccessMode::Mode& mode) const
{
  return Call(*this, "VLXKDMAttributeDef::GetAccessMode(VLXKDMAccessMode::Mode&)", slot<AttributeDef_getAccessMode>)
      .returning(Enum(mode));
}

long VLXKDMAttributeDef::SetAccessMode(VLXKDMAccessMode::Mode mode)
{
  return Call(*this, "VLXKDMAttributeDef::SetAccessMode(VLXKDMAccessMode::Mode)", slot<AttributeDef_setAccessMode>)
      .with(Enum(mode, {"AssertionFailed:mode != NULL", kSource, 245}))
      .run();
}

long VLXKDMAttributeDef::GetSoftwareVisibility(VLXKDMVisibility::Mode& visibility) const
{
  return Call(*this, "VLXKDMAttributeDef::GetSoftwareVisibility(VLXKDMVisibility::Mode&)",
              slot<AttributeDef_getSoftwareVisibility>)
      .returning(Enum(visibility));
}

long VLXKDMAttributeDef::SetSoftwareVisibility(VLXKDMVisibility::Mode visibility)
{
  return Call(*this, "VLXKDMAttributeDef::SetSoftwareVisibility(VLXKDMVisibility::Mode)",
              slot<AttributeDef_setSoftwareVisibility>)
      .with(Enum(visibility, {"AssertionFailed:vis != NULL", kSource, 290}))
      .run();
}

long VLXKDMAttributeDef::GetLength(int& length) const
{
  return Call(*this, "VLXKDMAttributeDef::GetLength(int&)", slot<AttributeDef_getLength>).returning(length);
}

long VLXKDMAttributeDef::SetLength(int length)
{
  return Call(*this, "VLXKDMAttributeDef::SetLength(int)", slot<AttributeDef_setLength>).with(length).run();
}

long VLXKDMAttributeDef::IsMandatory(VLXBoolean& isMandatory) const
{
  return Call(*this, "VLXKDMAttributeDef::IsMandatory(VLXBoolean&)", slot<AttributeDef_isMandatory>)
      .returning(isMandatory);
}

long VLXKDMAttributeDef::SetMandatory(VLXBoolean isMandatory)
{
  return Call(*this, "VLXKDMAttributeDef::SetMandatory(VLXBoolean)", slot<AttributeDef_setMandatory>)
      .with(isMandatory)
      .run();
}

long VLXKDMAttributeDef::IsMultiValuated(VLXBoolean& isMultiValuated) const
{
  return Call(*this, "VLXKDMAttributeDef::IsMultiValuated(VLXBoolean&)", slot<AttributeDef_isMultiValuated>)
      .returning(isMultiValuated);
}

long VLXKDMAttributeDef::SetMultiValuation(VLXBoolean isMultiValuated)
{
  return Call(*this, "VLXKDMAttributeDef::SetMultiValuation(VLXBoolean)", slot<AttributeDef_setMultiValuation>)
      .with(isMultiValuated)
      .run();
}

long VLXKDMAttributeDef::IsUnique(VLXBoolean& isUnique) const
{
  return Call(*this, "VLXKDMAttributeDef::IsUnique(VLXBoolean&)", slot<AttributeDef_isUnique>).returning(isUnique);
}

long VLXKDMAttributeDef::SetUnicity(VLXBoolean isUnique)
{
  return Call(*this, "VLXKDMAttributeDef::SetUnicity(VLXBoolean)", slot<AttributeDef_setUnicity>).with(isUnique).run();
}

long VLXKDMAttributeDef::GetClassDef(VLXKDMClassDef& classDef) const
{
  return Call(*this, "VLXKDMAttributeDef::GetClassDef(VLXKDMClassDef&)", slot<AttributeDef_getClassDef>)
      .returning(classDef);
}

long VLXKDMAttributeDef::ToString(VLXUnicodeString& text) const
{
  return Call(*this, "VLXKDMAttributeDef::ToString(VLXUnicodeString&)", slot<AttributeDef_toString>).returning(text);
}
