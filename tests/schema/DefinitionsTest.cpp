// Class definitions, attribute definitions and attribute lists against the real replica package.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "JavaTestSupport.h"
#include "VLXKDMAttributeDef.h"
#include "VLXKDMAttributeDefList.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMReplica.h"

using namespace corvexa_test;

namespace {

std::vector<std::string> Texts(const VLXListOfVLXUnicodeString& list)
{
  std::vector<std::string> out;
  for (int i = 1; i <= list.Size(); ++i) out.push_back(Text(list[i]));
  return out;
}

VLXListOfVLXUnicodeString List(std::initializer_list<const char*> texts)
{
  VLXListOfVLXUnicodeString list;
  for (const char* t : texts) list.Append(VLXUnicodeString(t));
  return list;
}

TEST(ClassDefinitions, PropertiesAreStoredAndReadBack)
{
  VLXKDMClassDef part;
  ASSERT_EQ(VLX_S_OK, part.Build(VLXUnicodeString("Part")));
  VLXUnicodeString text;
  ASSERT_EQ(VLX_S_OK, part.GetClassName(text));
  EXPECT_EQ("Part", Text(text));

  const struct {
    long (VLXKDMClassDef::*set)(const VLXUnicodeString&);
    long (VLXKDMClassDef::*get)(VLXUnicodeString&);
    const char* value;
  } texts[] = {
      {&VLXKDMClassDef::SetClassName, &VLXKDMClassDef::GetClassName, "Component"},
      {&VLXKDMClassDef::SetSuperName, &VLXKDMClassDef::GetSuperName, "Item"},
      {&VLXKDMClassDef::SetUuid, &VLXKDMClassDef::GetUuid, "6f1c2a94-0d55-4b4e-9c43-1a2b3c4d5e6f"},
      {&VLXKDMClassDef::SetQKAComment, &VLXKDMClassDef::GetQKAComment, "a part \xE2\x80\x94 with a dash"},
      {&VLXKDMClassDef::SetQKADerivability, &VLXKDMClassDef::GetQKADerivability, "derivable"},
  };
  for (const auto& t : texts) {
    SCOPED_TRACE(t.value);
    ASSERT_EQ(VLX_S_OK, (part.*t.set)(VLXUnicodeString(t.value)));
    ASSERT_EQ(VLX_S_OK, (part.*t.get)(text));
    EXPECT_EQ(t.value, Text(text));
  }

  const struct {
    long (VLXKDMClassDef::*set)(VLXBoolean);
    long (VLXKDMClassDef::*get)(VLXBoolean&);
  } flags[] = {{&VLXKDMClassDef::SetAbstract, &VLXKDMClassDef::IsAbstract},
               {&VLXKDMClassDef::SetExtensibility, &VLXKDMClassDef::IsExtensible},
               {&VLXKDMClassDef::SetPersistency, &VLXKDMClassDef::IsPersistent}};
  for (const auto& f : flags) {
    for (VLXBoolean value : {VLXBoolean(1), VLXBoolean(0)}) {
      ASSERT_EQ(VLX_S_OK, (part.*f.set)(value));
      VLXBoolean back = 7;
      ASSERT_EQ(VLX_S_OK, (part.*f.get)(back));
      EXPECT_EQ(value, back);
    }
  }
  ASSERT_EQ(VLX_S_OK, part.ToString(text));
  EXPECT_NE(std::string::npos, Text(text).find("Component")) << Text(text);
}

TEST(ClassDefinitions, VariadicScopeNamesSendWhatTheListFormSends)
{
  VLXKDMClassDef part;
  ASSERT_EQ(VLX_S_OK, part.Build(VLXUnicodeString("Part")));
  VLXListOfVLXUnicodeString back;

  ASSERT_EQ(VLX_S_OK, part.SetScopeNames(3, "plant", "line \xC3\xA9", "cell"));
  ASSERT_EQ(VLX_S_OK, part.GetScopeNames(back));
  EXPECT_EQ((std::vector<std::string>{"plant", "line \xC3\xA9", "cell"}), Texts(back));
  ASSERT_EQ(VLX_S_OK, part.SetScopeNames(List({"plant", "line \xC3\xA9", "cell"})));
  VLXListOfVLXUnicodeString fromList;
  ASSERT_EQ(VLX_S_OK, part.GetScopeNames(fromList));
  EXPECT_EQ(Texts(back), Texts(fromList));

  // A negative count is refused and changes nothing; a count of 0 sets an empty list.
  EXPECT_EQ(VLX_E_INVALIDARG, part.SetScopeNames(-1));
  EXPECT_EQ("invalid argument to VLXKDMClassDef::SetScopeNames(int, ...): the count -1 is negative",
            PeekLastError().text);
  ASSERT_EQ(VLX_S_OK, part.GetScopeNames(back));
  EXPECT_EQ(3, back.Size());
  ASSERT_EQ(VLX_S_OK, part.SetScopeNames(0));
  ASSERT_EQ(VLX_S_OK, part.GetScopeNames(back));
  EXPECT_EQ(0, back.Size());

  // Failures carry the list form's name.
  VLXKDMClassDef unbuilt;
  ClearLastError();
  EXPECT_EQ(VLX_E_FAIL, unbuilt.SetScopeNames(2, "a", "b"));
  EXPECT_EQ("VLXKDMClassDef::SetScopeNames(const VLXListOfVLXUnicodeString&)", PeekLastError().parameters[0]);
}

TEST(AttributeDefinitions, PropertiesListsAndVariadicTargets)
{
  VLXKDMAttributeDef owner;
  ASSERT_EQ(VLX_S_OK, owner.Build(VLXUnicodeString("owner"), VLXKDMAttributeType::Relationship));
  VLXUnicodeString text;
  ASSERT_EQ(VLX_S_OK, owner.GetAttributeName(text));
  EXPECT_EQ("owner", Text(text));

  VLXListOfVLXUnicodeString back;
  ASSERT_EQ(VLX_S_OK, owner.SetTargetNames(2, "Person", "Company"));
  ASSERT_EQ(VLX_S_OK, owner.GetTargetNames(back));
  EXPECT_EQ((std::vector<std::string>{"Person", "Company"}), Texts(back));
  ASSERT_EQ(VLX_S_OK, owner.SetTargetNames(0));
  ASSERT_EQ(VLX_S_OK, owner.GetTargetNames(back));
  EXPECT_EQ(0, back.Size());
  ASSERT_EQ(VLX_S_OK, owner.SetTargetRefs(3, "ref-1", "ref-2", "ref-3"));
  ASSERT_EQ(VLX_S_OK, owner.GetTargetRefs(back));
  EXPECT_EQ((std::vector<std::string>{"ref-1", "ref-2", "ref-3"}), Texts(back));
  EXPECT_EQ(VLX_E_INVALIDARG, owner.SetTargetRefs(-1));
  ASSERT_EQ(VLX_S_OK, owner.GetTargetRefs(back));
  EXPECT_EQ(3, back.Size());

  for (int length : {0, 40, -1}) {
    ASSERT_EQ(VLX_S_OK, owner.SetLength(length));
    int read = 12345;
    ASSERT_EQ(VLX_S_OK, owner.GetLength(read));
    EXPECT_EQ(length, read);
  }
  const struct {
    long (VLXKDMAttributeDef::*set)(VLXBoolean);
    long (VLXKDMAttributeDef::*get)(VLXBoolean&);
  } flags[] = {{&VLXKDMAttributeDef::SetMandatory, &VLXKDMAttributeDef::IsMandatory},
               {&VLXKDMAttributeDef::SetMultiValuation, &VLXKDMAttributeDef::IsMultiValuated},
               {&VLXKDMAttributeDef::SetUnicity, &VLXKDMAttributeDef::IsUnique}};
  for (const auto& f : flags) {
    for (VLXBoolean value : {VLXBoolean(1), VLXBoolean(0)}) {
      ASSERT_EQ(VLX_S_OK, (owner.*f.set)(value));
      VLXBoolean read = 9;
      ASSERT_EQ(VLX_S_OK, (owner.*f.get)(read));
      EXPECT_EQ(value, read);
    }
  }
  ASSERT_EQ(VLX_S_OK, owner.SetUuid(VLXUnicodeString("u-1")));
  ASSERT_EQ(VLX_S_OK, owner.GetUuid(text));
  EXPECT_EQ("u-1", Text(text));
  ASSERT_EQ(VLX_S_OK, owner.SetQKAComment(VLXUnicodeString("who owns it")));
  ASSERT_EQ(VLX_S_OK, owner.GetQKAComment(text));
  EXPECT_EQ("who owns it", Text(text));

  VLXKDMAttributeDef unbuilt;
  ClearLastError();
  EXPECT_EQ(VLX_E_FAIL, unbuilt.SetTargetRefs(1, "x"));
  EXPECT_EQ("VLXKDMAttributeDef::SetTargetRefs(const VLXListOfVLXUnicodeString&)", PeekLastError().parameters.at(0));
  ClearLastError();
  EXPECT_EQ(VLX_E_FAIL, unbuilt.SetTargetNames(1, "x"));
  EXPECT_EQ("VLXKDMAttributeDef::SetTargetNames(const VLXListOfVLXUnicodeString&)", PeekLastError().parameters.at(0));
}

TEST(AttributeDefinitions, RawAndTranslatedConversionFailures)
{
  const VLXUnicodeString bad("bad \xC3\x28");
  VLXListOfVLXUnicodeString badList;
  badList.Append(VLXUnicodeString("fine"));
  badList.Append(bad);

  VLXKDMAttributeDef attribute;
  ASSERT_EQ(VLX_S_OK, attribute.Build(VLXUnicodeString("a"), VLXKDMAttributeType::String));
  // Raw: the converter's own code.
  EXPECT_EQ(VLX_E_INVALIDARG, attribute.SetQKAComment(bad));
  EXPECT_EQ(VLX_E_INVALIDARG, attribute.SetTargetNames(badList));
  VLXKDMAttributeDef other(attribute);
  EXPECT_EQ(VLX_E_INVALIDARG, other.Build(bad, VLXKDMAttributeType::Integer));
  EXPECT_TRUE(other == attribute);  // nothing was created
  // Translated.
  EXPECT_EQ(VLX_E_FAIL, attribute.SetUuid(bad));
  EXPECT_EQ(VLX_E_FAIL, attribute.SetTargetRefs(badList));
  VLXKDMClassDef classDef;
  EXPECT_EQ(VLX_E_FAIL, classDef.SetQKAComment(bad));  // unbuilt: the built test comes first
  ASSERT_EQ(VLX_S_OK, classDef.Build(VLXUnicodeString("C")));
  EXPECT_EQ(VLX_E_FAIL, classDef.SetQKAComment(bad));
  EXPECT_EQ(VLX_E_FAIL, classDef.Build(bad));
}

TEST(AttributeLists, AddFindCountAndRemoveThroughTheClass)
{
  VLXKDMClassDef part;
  ASSERT_EQ(VLX_S_OK, part.Build(VLXUnicodeString("Part")));
  VLXKDMAttributeDefList attributes;
  ASSERT_EQ(VLX_S_OK, part.GetAttributes(attributes));

  const char* names[] = {"serial", "weight", "label"};
  const VLXKDMAttributeType::Type types[] = {VLXKDMAttributeType::Integer, VLXKDMAttributeType::Double,
                                             VLXKDMAttributeType::String};
  std::vector<VLXKDMAttributeDef> defs(3);
  for (int i = 0; i < 3; ++i) {
    ASSERT_EQ(VLX_S_OK, defs[i].Build(VLXUnicodeString(names[i]), types[i]));
    ASSERT_EQ(VLX_S_OK, attributes.Add(defs[i]));
  }
  int count = -1;
  ASSERT_EQ(VLX_S_OK, attributes.GetCount(count));
  EXPECT_EQ(3, count);

  VLXKDMAttributeDef item;
  ASSERT_EQ(VLX_S_OK, attributes.GetItem(1, item));
  EXPECT_TRUE(item == defs[1]);
  ASSERT_EQ(VLX_S_OK, attributes.GetItem(VLXUnicodeString("label"), item));
  EXPECT_TRUE(item == defs[2]);
  VLXKDMClassDef owner;
  ASSERT_EQ(VLX_S_OK, item.GetClassDef(owner));
  EXPECT_TRUE(owner == part);

  int position = 99;
  ASSERT_EQ(VLX_S_OK, attributes.IndexOf(defs[2], position));
  EXPECT_EQ(2, position);
  ASSERT_EQ(VLX_S_OK, attributes.IndexOf(VLXUnicodeString("absent"), position));
  EXPECT_EQ(-1, position);
  VLXBoolean included = 5;
  ASSERT_EQ(VLX_S_OK, attributes.Includes(VLXUnicodeString("weight"), included));
  EXPECT_EQ(1, included);

  // Out of range: the Java side's error, the out-proxy untouched.
  EXPECT_EQ(VLX_E_FAIL, attributes.GetItem(3, item));
  EXPECT_TRUE(item == defs[2]);
  EXPECT_EQ(VLX_E_FAIL, attributes.GetItem(-1, item));

  ASSERT_EQ(VLX_S_OK, attributes.Remove(VLXUnicodeString("serial")));
  ASSERT_EQ(VLX_S_OK, attributes.Remove(0));
  ASSERT_EQ(VLX_S_OK, attributes.Remove(defs[2]));
  ASSERT_EQ(VLX_S_OK, attributes.GetCount(count));
  EXPECT_EQ(0, count);
  EXPECT_EQ(VLX_E_FAIL, attributes.Remove(defs[2]));  // no longer there
  ASSERT_EQ(VLX_S_OK, attributes.Includes(VLXUnicodeString("weight"), included));
  EXPECT_EQ(0, included);

  // An unattached list changes nothing.
  VLXKDMAttributeDefList unattached;
  EXPECT_EQ(VLX_E_FAIL, unattached.Add(defs[0]));
  EXPECT_EQ(VLX_E_FAIL, unattached.GetCount(count));
  EXPECT_EQ(0, count);
}

}  // namespace
