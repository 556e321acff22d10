// corvexa::Replica, Model, Instances, ClassDef, AttributeDef and Error over the proxies.
#include <atomic>
#include <cerrno>
#include <climits>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iterator>
#include <unistd.h>

#include "ModernSupport.h"
#include "VLXError.h"
#include "VLXJBXException.h"

namespace corvexa {

// ---- Errors -----------------------------------------------------------------------------------

Error::Error(long code, std::string operation, std::string cause, std::string id, std::vector<std::string> parameters)
    : std::runtime_error(operation + ": " + cause + (id.empty() ? std::string() : " [" + id + "]")),
      _code(code),
      _operation(std::move(operation)),
      _cause(std::move(cause)),
      _id(std::move(id)),
      _parameters(std::move(parameters))
{
}

namespace {

[[noreturn]] void ThrowWith(long code, const std::string& operation, const std::string* cause)
{
  std::string text, id;
  std::vector<std::string> parameters;
  if (VLXError* error = VLXError::VLXGetOperationError()) {
    id = error->GetId();
    // A refused argument's text repeats the operation: its cause is the second parameter.
    text = id == VLXJBXMessages::InvalidArgument && error->GetNLSParameterCount() == 2 ? Text(error->GetNLSParameter(2))
                                                                                       : Text(error->GetMessageText());
    for (int i = 1; i <= error->GetNLSParameterCount(); ++i) parameters.push_back(Text(error->GetNLSParameter(i)));
    error->Release();
  } else {
    text = "failed with result code " + std::to_string(code);
  }
  throw Error(code, operation, cause ? *cause : text, id, parameters);
}

}  // namespace

void Throw(long code, const std::string& operation) { ThrowWith(code, operation, nullptr); }

std::string Named(const char* operation, std::string_view argument)
{
  return std::string(operation) + "(\"" + std::string(argument) + "\")";
}

void Refuse(const char* operation, std::string_view argument, const std::string& why)
{
  const std::string named = argument.empty() ? std::string(operation) : Named(operation, argument);
  const long code =
      VLXJBXException::Raise(VLX_E_INVALIDARG, VLXJBXMessages::InvalidArgument, {named, why}, __FILE__, __LINE__);
  ThrowWith(code, named, &why);
}

namespace {

std::string Get(const VLXKDMClassDef& proxy, long (VLXKDMClassDef::*getter)(VLXUnicodeString&) const,
                const char* operation)
{
  VLXUnicodeString text;
  Check((proxy.*getter)(text), operation);
  return Text(text);
}

// A flag read by getter from proxy.
template <class Proxy>
bool Flag(const Proxy& proxy, long (Proxy::*getter)(VLXBoolean&) const, const char* operation)
{
  VLXBoolean flag = 0;
  Check((proxy.*getter)(flag), operation);
  return flag != 0;
}

// The enumeration of the proxy API for a modern type, and back.
VLXKDMAttributeType::Type ProxyType(Type type) { return static_cast<VLXKDMAttributeType::Type>(type); }

}  // namespace

// ---- AttributeDef ----------------------------------------------------------------------------

std::string AttributeDef::name() const
{
  VLXUnicodeString text;
  Check(_proxy.GetAttributeName(text), "corvexa::AttributeDef::name");
  return Text(text);
}

Type AttributeDef::type() const
{
  VLXKDMAttributeType::Type type = VLXKDMAttributeType::String;
  Check(_proxy.GetAttributeType(type), "corvexa::AttributeDef::type");
  return static_cast<Type>(type);
}

bool AttributeDef::multi_valued() const
{
  return Flag(_proxy, &VLXKDMAttributeDef::IsMultiValuated, "corvexa::AttributeDef::multi_valued");
}

bool AttributeDef::mandatory() const
{
  return Flag(_proxy, &VLXKDMAttributeDef::IsMandatory, "corvexa::AttributeDef::mandatory");
}

bool AttributeDef::unique() const
{
  return Flag(_proxy, &VLXKDMAttributeDef::IsUnique, "corvexa::AttributeDef::unique");
}

int AttributeDef::length() const
{
  int length = 0;
  Check(_proxy.GetLength(length), "corvexa::AttributeDef::length");
  return length > 0 ? length : 0;
}

std::vector<std::string> AttributeDef::targets() const
{
  VLXListValVLXUnicodeString names;
  Check(_proxy.GetTargetNames(names), "corvexa::AttributeDef::targets");
  std::vector<std::string> out;
  for (const VLXUnicodeString& name : names) out.push_back(Text(name));
  return out;
}

std::string AttributeDef::comment() const
{
  VLXUnicodeString text;
  Check(_proxy.GetQKAComment(text), "corvexa::AttributeDef::comment");
  return Text(text);
}

// ---- ClassDef --------------------------------------------------------------------------------

std::string ClassDef::name() const { return Get(_proxy, &VLXKDMClassDef::GetClassName, "corvexa::ClassDef::name"); }

std::string ClassDef::super_name() const
{
  return Get(_proxy, &VLXKDMClassDef::GetSuperName, "corvexa::ClassDef::super_name");
}

std::string ClassDef::comment() const
{
  return Get(_proxy, &VLXKDMClassDef::GetQKAComment, "corvexa::ClassDef::comment");
}

bool ClassDef::is_abstract() const
{
  return Flag(_proxy, &VLXKDMClassDef::IsAbstract, "corvexa::ClassDef::is_abstract");
}

namespace {

void AppendOwn(const VLXKDMClassDef& cls, std::vector<AttributeHandle>& out, const char* operation)
{
  VLXKDMAttributeDefList list;
  Check(cls.GetAttributes(list), operation);
  int count = 0;
  Check(list.GetCount(count), operation);
  for (int i = 0; i < count; ++i) {
    VLXKDMAttributeDef item;
    Check(list.GetItem(i, item), operation);
    out.emplace_back(item);
  }
}

}  // namespace

std::vector<AttributeHandle> ClassDef::own_attributes() const
{
  std::vector<AttributeHandle> out;
  AppendOwn(_proxy, out, "corvexa::ClassDef::own_attributes");
  return out;
}

std::vector<AttributeHandle> ClassDef::attributes() const
{
  const char* const operation = "corvexa::ClassDef::attributes";
  // The chain from this class up to its root (a replica refuses chains over 1000 classes).
  std::vector<VLXKDMClassDef> chain{_proxy};
  while (_replica.GetHandle() != nullptr && chain.size() <= 1000) {
    VLXUnicodeString super;
    Check(chain.back().GetSuperName(super), operation);
    if (super.GetLengthInByte() == 0) break;
    VLXKDMClassDef parent;
    Check(_replica.GetClassDef(super, parent), operation);
    if (parent.GetHandle() == nullptr) break;
    chain.push_back(parent);
  }
  std::vector<AttributeHandle> out;
  for (auto it = chain.rbegin(); it != chain.rend(); ++it) AppendOwn(*it, out, operation);
  return out;
}

AttributeHandle ClassDef::attribute(std::string_view name) const
{
  for (const AttributeHandle& a : attributes())
    if (a.name() == name) return a;
  Refuse("corvexa::ClassDef::attribute", name,
         "the class '" + this->name() + "' has no attribute '" + std::string(name) + "'");
}

// ---- Instances and Model ---------------------------------------------------------------------

Instances::Instances(const VLXKDMInstanceSet& proxy) : _proxy(proxy)
{
  int count = 0;
  Check(_proxy.GetCount(count), "corvexa::Instances::size");
  _size = static_cast<std::size_t>(count);
}

InstanceHandle Instances::at(std::size_t position) const
{
  if (position >= _size)
    Refuse("corvexa::Instances::at", std::to_string(position),
           "position " + std::to_string(position) + " is out of range (size " + std::to_string(_size) + ")");
  InstanceHandle out;
  Check(_proxy.GetItem(static_cast<int>(position), out._proxy), "corvexa::Instances::at");
  return out;
}

ClassHandle Model::class_def() const
{
  VLXKDMClassDef cls;
  Check(_proxy.GetClassDef(cls), "corvexa::Model::class_def");
  VLXKDMReplica replica;
  Check(_proxy.GetReplica(replica), "corvexa::Model::class_def");
  return ClassHandle(cls, replica);
}

std::string Model::name() const
{
  VLXKDMClassDef cls;
  Check(_proxy.GetClassDef(cls), "corvexa::Model::name");
  return Get(cls, &VLXKDMClassDef::GetClassName, "corvexa::Model::name");
}

Instances Model::instances() const
{
  VLXKDMInstanceSet set;
  Check(_proxy.GetInstances(set), "corvexa::Model::instances");
  return Instances(set);
}

InstanceHandle Model::create()
{
  InstanceHandle out;
  Check(_proxy.CreateInstance(out._proxy), "corvexa::Model::create");
  return out;
}

void Model::remove(const InstanceHandle& instance)
{
  if (!instance) Refuse("corvexa::Model::remove", {}, "an empty Instance handle");
  VLXKDMInstanceSet set;
  Check(_proxy.GetInstances(set), "corvexa::Model::remove");
  Check(set.Remove(instance._proxy), "corvexa::Model::remove");
}

namespace {

template <class Owner, class Id>
std::optional<InstanceHandle> Find(Owner& owner, const Id& id, const char* operation)
{
  VLXKDMInstance found;
  Check(owner.FindInstance(id, found), operation);
  if (found.GetHandle() == nullptr) return std::nullopt;
  return InstanceHandle(found);
}

VLXBoolean Platform(bool v) { return v ? 1 : 0; }
VLXUnicodeString Platform(const std::string& v) { return Text(v); }
VLXBinary Platform(const bytes& v) { return Binary(v); }
template <class T>
const T& Platform(const T& v)
{
  return v;
}
// A platform value list of the elements of a vector.
template <class List, class T>
List ListOf(const std::vector<T>& values)
{
  List out(static_cast<int>(values.size()));
  for (const auto& v : values) out.Append(Platform(v));
  return out;
}

}  // namespace

std::optional<InstanceHandle> Model::find(std::string_view id) const
{
  return Find(_proxy, Text(id), "corvexa::Model::find");
}
std::optional<InstanceHandle> Model::find(const bytes& id) const
{
  return Find(_proxy, Binary(id), "corvexa::Model::find(bytes)");
}

#define CORVEXA_VALUE(Native, Setter, form) \
  Model::Value Model::Value::of(Native v)   \
  {                                         \
    Value value;                            \
    value.holder.Setter(form);              \
    return value;                           \
  }
CORVEXA_VALUE(int, SetInteger, v)
CORVEXA_VALUE(double, SetDouble, v)
CORVEXA_VALUE(bool, SetBoolean, v ? 1 : 0)
CORVEXA_VALUE(std::string_view, SetString, Text(v))
CORVEXA_VALUE(const bytes&, SetBinary, Binary(v))
CORVEXA_VALUE(const std::vector<int>&, SetListOfInteger, ListOf<VLXRawCollint>(v))
CORVEXA_VALUE(const std::vector<double>&, SetListOfDouble, ListOf<VLXRawColldouble>(v))
CORVEXA_VALUE(const std::vector<bool>&, SetListOfBoolean, ListOf<VLXListValVLXBoolean>(v))
CORVEXA_VALUE(const std::vector<std::string>&, SetListOfString, ListOf<VLXListValVLXUnicodeString>(v))
CORVEXA_VALUE(const std::vector<bytes>&, SetListOfBinary, ListOf<VLXListValVLXBinary>(v))
#undef CORVEXA_VALUE

Model::Value Model::Value::of(const InstanceHandle& v)
{
  if (!v) Refuse("corvexa::Model::select", {}, "an empty Instance handle cannot be a value");
  Value value;
  value.holder.SetInstance(v._proxy);
  return value;
}

ModelHandle::Value ModelHandle::Value::of(const std::vector<InstanceHandle>& v)
{
  Value value;
  VLXListValVLXKDMInstance list(static_cast<int>(v.size()));
  for (const InstanceHandle& one : v) list.Append(of(one).holder.GetInstance());
  value.holder.SetListOfInstance(list);
  return value;
}

std::vector<InstanceHandle> Model::select_value(std::string_view attribute, const Value& value,
                                                bool with_subclasses) const
{
  const char* const operation = "corvexa::Model::select";
  VLXKDMInstanceValue holder(value.holder);
  VLXListValVLXKDMInstance found;
  const VLXBoolean subclasses = with_subclasses ? 1 : 0;
  // A value without type goes as null (no value), which the value holder cannot send.
  auto call = Call(_proxy, operation, slot<Model_selectInstances>);
  Check(holder.GetType() == static_cast<VLXKDMInstanceValue::Type>(-1)
            ? call.with(Text(attribute), jobject(nullptr), subclasses).returning(found)
            : call.with(Text(attribute), Remote(holder), subclasses).returning(found),
        operation, attribute);
  return std::vector<InstanceHandle>(found.begin(), found.end());
}

std::vector<InstanceHandle> Model::select_without_value(std::string_view attribute, bool with_subclasses) const
{
  return select_value(attribute, Value{}, with_subclasses);
}

// ---- Replica ---------------------------------------------------------------------------------

ReplicaHandle Replica::create(std::string_view name)
{
  ReplicaHandle out;
  Check(name.empty() ? out._proxy.Build() : out._proxy.Build(Text(name)), "corvexa::Replica::create", name);
  return out;
}

ReplicaHandle Replica::read_xml_file(const std::string& path)
{
  ReplicaHandle out;
  Check(VLXKDMReplica::ReadFromXmlFile(Text(path), out._proxy), "corvexa::Replica::read_xml_file", path);
  return out;
}

ReplicaHandle Replica::read_xml_string(std::string_view xml)
{
  ReplicaHandle out;
  Check(VLXKDMReplica::ReadFromXmlString(Text(xml), out._proxy), "corvexa::Replica::read_xml_string");
  return out;
}

ReplicaHandle Replica::read_binary_file(const std::string& path)
{
  ReplicaHandle out;
  Check(VLXKDMReplica::ReadBinaryFile(Text(path), out._proxy), "corvexa::Replica::read_binary_file", path);
  return out;
}

ReplicaHandle Replica::from_binary(const bytes& data)
{
  ReplicaHandle out;  // deflated or not as the header says
  Check(VLXKDMReplica::GetReplicaFromBinary(Binary(data), out._proxy), "corvexa::Replica::from_binary");
  return out;
}

void Replica::insert_schema_file(const std::string& path)
{
  Check(_proxy.InsertSchemaFile(Text(path)), "corvexa::Replica::insert_schema_file", path);
}
void Replica::insert_schema_string(std::string_view xsd)
{
  Check(_proxy.InsertSchemaString(Text(xsd)), "corvexa::Replica::insert_schema_string");
}
void Replica::populate_from_xml_file(const std::string& path)
{
  Check(_proxy.PopulatesFromXmlFile(Text(path)), "corvexa::Replica::populate_from_xml_file", path);
}
void Replica::populate_from_xml_string(std::string_view xml)
{
  Check(_proxy.PopulatesFromXmlString(Text(xml)), "corvexa::Replica::populate_from_xml_string");
}

std::string Replica::xml(bool with_schema, bool with_state) const
{
  VLXUnicodeString text;
  Check(_proxy.GetXml(with_schema ? 1 : 0, with_state ? 1 : 0, text), "corvexa::Replica::xml");
  return Text(text);
}

std::string Replica::xsd() const
{
  VLXUnicodeString text;
  Check(_proxy.GetXsd(text), "corvexa::Replica::xsd");
  return Text(text);
}

bytes Replica::binary(Compression compression) const
{
  VLXBinary data;
  Check(VLXKDMReplica::GetBinaryFromReplica(_proxy, compression == Compression::on ? 1 : 0, data),
        "corvexa::Replica::binary");
  return Bytes(data);
}

// Files are streamed by the Java side into a temporary file renamed into place when complete.
void Replica::write_xml_file(const std::string& path, bool with_schema, bool with_state) const
{
  Check(_proxy.WriteXmlFile(Text(path), with_schema ? 1 : 0, with_state ? 1 : 0), "corvexa::Replica::write_xml_file",
        path);
}

void Replica::write_xsd_file(const std::string& path) const
{
  Check(_proxy.WriteXsdFile(Text(path)), "corvexa::Replica::write_xsd_file", path);
}

void Replica::write_binary_file(const std::string& path, Compression compression) const
{
  Check(_proxy.WriteBinaryFile(Text(path), compression == Compression::on ? 1 : 0),
        "corvexa::Replica::write_binary_file", path);
}

std::string Replica::name() const
{
  VLXUnicodeString text;
  Check(_proxy.GetName(text), "corvexa::Replica::name");
  return Text(text);
}

void Replica::set_name(std::string_view name) { Check(_proxy.SetName(Text(name)), "corvexa::Replica::set_name", name); }

std::vector<ModelHandle> Replica::models() const
{
  VLXKDMModelSet set;
  Check(_proxy.GetModels(set), "corvexa::Replica::models");
  int count = 0;
  Check(set.GetCount(count), "corvexa::Replica::models");
  std::vector<ModelHandle> out;
  out.reserve(static_cast<std::size_t>(count));
  for (int i = 0; i < count; ++i) {
    VLXKDMModel model;
    Check(set.GetItem(i, model), "corvexa::Replica::models");
    out.emplace_back(model);
  }
  return out;
}

std::vector<ClassHandle> Replica::classes() const
{
  std::vector<ClassHandle> out;
  for (const ModelHandle& model : models()) {
    VLXKDMClassDef cls;
    Check(model._proxy.GetClassDef(cls), "corvexa::Replica::classes");
    out.emplace_back(cls, _proxy);
  }
  return out;
}

ClassHandle Replica::class_def(std::string_view name) const
{
  VLXKDMClassDef cls;
  Check(_proxy.GetClassDef(Text(name), cls), "corvexa::Replica::class_def", name);
  if (cls.GetHandle() == nullptr)
    Refuse("corvexa::Replica::class_def", name, "the replica has no class '" + std::string(name) + "'");
  return ClassHandle(cls, _proxy);
}

ModelHandle Replica::model(std::string_view class_name) const
{
  VLXKDMModelSet set;
  Check(_proxy.GetModels(set), "corvexa::Replica::model", class_name);
  VLXKDMModel model;
  Check(set.GetItem(Text(class_name), model), "corvexa::Replica::model", class_name);
  if (model.GetHandle() == nullptr)
    Refuse("corvexa::Replica::model", class_name, "the replica has no class '" + std::string(class_name) + "'");
  return ModelHandle(model);
}

ClassHandle Replica::define(const ClassDeclaration& declaration)
{
  const char* const operation = "corvexa::Replica::define";
  const std::string_view name = declaration.name();
  VLXKDMClassDef cls;
  Check(cls.Build(Text(name)), operation, name);
  if (!declaration.super_name().empty()) Check(cls.SetSuperName(Text(declaration.super_name())), operation, name);
  if (declaration.is_abstract()) Check(cls.SetAbstract(1), operation, name);
  if (!declaration.comment_text().empty()) Check(cls.SetQKAComment(Text(declaration.comment_text())), operation, name);
  VLXKDMAttributeDefList list;
  Check(cls.GetAttributes(list), operation, name);
  for (const AttributeDeclaration& a : declaration.attributes()) {
    const std::string named = declaration.name() + "." + a.name();
    if (a.type() < Type::integer || a.type() > Type::reference)
      Refuse(operation, named, "the type " + std::to_string(static_cast<int>(a.type())) + " is not a corvexa::Type");
    VLXKDMAttributeDef def;
    Check(def.Build(Text(a.name()), ProxyType(a.type())), operation, named);
    if (a.is_multi_valued()) Check(def.SetMultiValuation(1), operation, named);
    if (a.is_mandatory()) Check(def.SetMandatory(1), operation, named);
    if (a.is_unique()) Check(def.SetUnicity(1), operation, named);
    if (a.max_length() > 0) Check(def.SetLength(a.max_length()), operation, named);
    if (!a.targets().empty()) {
      VLXListValVLXUnicodeString targets;
      for (const std::string& t : a.targets()) targets.Append(Text(t));
      Check(def.SetTargetNames(targets), operation, named);
    }
    if (!a.comment_text().empty()) Check(def.SetQKAComment(Text(a.comment_text())), operation, named);
    Check(list.Add(def), operation, named);
  }
  VLXKDMModel model;
  Check(model.Build(cls), operation, name);
  VLXKDMModelSet set;
  Check(_proxy.GetModels(set), operation, name);
  Check(set.Add(model), operation, name);
  return ClassHandle(cls, _proxy);
}

std::optional<InstanceHandle> Replica::find(std::string_view id) const
{
  return Find(_proxy, Text(id), "corvexa::Replica::find");
}
std::optional<InstanceHandle> Replica::find(const bytes& id) const
{
  return Find(_proxy, Binary(id), "corvexa::Replica::find(bytes)");
}

void Replica::commit() { Check(_proxy.Commit(), "corvexa::Replica::commit"); }

ReplicaHandle Replica::from_java(JNIEnv* env, jobject replica)
{
  ReplicaHandle out;
  Check(out._proxy.BuildFromJavaType(env, replica), "corvexa::Replica::from_java");
  return out;
}

jobject Replica::to_java(JNIEnv* env) const
{
  jobject out = nullptr;
  Check(_proxy.ConvertToJavaType(env, out), "corvexa::Replica::to_java");
  return out;
}

}  // namespace corvexa
