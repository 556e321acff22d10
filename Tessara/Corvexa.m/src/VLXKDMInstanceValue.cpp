// The value holder. The seven types, single and list, are one table (Dispatch::kRows): each row
// names the member that holds the value, the exact Java class of its remote form, and the getter's
// precondition. BuildLocal, InternalBuild, Clean and the getters read the table; none of them
// lists the types again.
#include "VLXKDMInstanceValue.h"

#include "CallFrame.h"
#include "VLXFatalError.h"
#include "VLXJBXJNIUtilities.h"

using namespace corvexa;

namespace {

using V = VLXKDMInstanceValue;

using H = VLXJBXJNIHelper;

// Fixed report path (and lines): callers and their tests match on them; keep them as they are.
const char* const kSource = "Tessara\\Corvexa.m\\src\\VLXKDMInstanceValue.cpp";
const int kLineUnknownClass = 99;
const int kLineNoType = 380;

const char* const kBuildLocal = "VLXKDMInstanceValue::BuildLocal()";
const char* const kBuildRemote = "VLXKDMInstanceValue::BuildRemote()";
const char* const kClean = "VLXKDMInstanceValue::Clean()";
const char* const kInternalBuild = "VLXKDMInstanceValue::InternalBuild(jobject&)";
const char* const kSetHandle = "VLXKDMInstanceValue::SetHandle(JNIEnv*, jobject)";

// Emptying a member when the value leaves its type: lists are emptied, a text becomes empty, an
// instance drops its Java object; the other single values stay as they are.
void Empty(JNIEnv*, int&) {}
void Empty(JNIEnv*, double&) {}
void Empty(JNIEnv*, VLXBoolean&) {}
void Empty(JNIEnv*, VLXTime&) {}
void Empty(JNIEnv*, VLXBinary&) {}
void Empty(JNIEnv*, VLXUnicodeString& text) { text = VLXUnicodeString(); }
void Empty(JNIEnv* env, VLXKDMInstance& instance) { instance.SetHandle(env, nullptr); }
void Empty(JNIEnv*, VLXListValVLXKDMInstance& list) { list.RemoveAll(VLXCollec::FreeMemory); }
template <class E>
void Empty(JNIEnv*, VLXList<E>& list)
{
  list.RemoveAll(1);
}

}  // namespace

struct VLXKDMInstanceValue::Dispatch {
  using V = VLXKDMInstanceValue;

  struct Row {
    Type type;
    bool isArray;
    Slot javaClass;                             // the exact class of the remote form
    long (*build)(JNIEnv*, jobject, V&, bool);  // Java object to the member (and the handle)
    long (*convert)(JNIEnv*, V&, jobject&);     // the member to a new Java object
    void (*empty)(JNIEnv*, V&);                 // the member emptied
    const char* getterText;                     // the getter's precondition, as reported
    int getterLine;
  };

  // Converts object aside; only when that succeeds (and, with attach, the value holds object) does
  // the member change: a failure leaves the value as it was.
  template <class T, T V::*M>
  static long Build(JNIEnv* env, jobject object, V& value, bool attach)
  {
    T built{};
    long status = Values::BuildFromJavaType(env, object, built);
    if (status >= 0 && attach) status = value.ReplaceGlobalRef(env, object);
    if (status >= 0) value.*M = std::move(built);
    return status;
  }
  template <class T, T V::*M>
  static long Convert(JNIEnv* env, V& value, jobject& object)
  {
    return Values::ConvertToJavaType(env, value.*M, object);
  }
  template <class T, T V::*M>
  static void EmptyMember(JNIEnv* env, V& value)
  {
    Empty(env, value.*M);
  }

  // In the order in which BuildLocal compares the Java classes.
  static const Row kRows[14];

  static const Row* Find(Type type, bool isArray)
  {
    for (const Row& row : kRows)
      if (row.type == type && row.isArray == isArray) return &row;
    return nullptr;
  }

  // The row of object's exact Java class, or null.
  static const Row* Recognise(JNIEnv* env, const ReplicaStubs& st, jobject object)
  {
    LocalRef cls(env, H::GetObjectClass(env, object));
    for (const Row& row : kRows)
      if (H::IsSameObject(env, cls.get(), st.Class(row.javaClass))) return &row;
    return nullptr;
  }

  // The getter of a member: reports a value of another type or kind, then answers the member.
  template <class T>
  static const T& Get(const V& value, const T V::*member, Type type, bool isArray)
  {
    if (value._type != type || (value._isArray != 0) != isArray) {
      const Row* row = Find(type, isArray);
      VLXFatalError(row->getterText, nullptr, nullptr, nullptr, kSource, row->getterLine);
    }
    return value.*member;
  }

  // The setter of a member: the value leaves its former type, then holds a copy of the argument.
  template <class T>
  static void Set(V& value, T V::*member, Type type, bool isArray, const T& argument)
  {
    value.Clean();
    value._type = type;
    value._isArray = isArray;
    value.*member = argument;
  }
};

#define VALUE_ROW(type, isArray, slot, member, text, line)                                                            \
  {                                                                                                                   \
    type, isArray, slot, &Dispatch::Build<decltype(V::member), &V::member>,                                           \
        &Dispatch::Convert<decltype(V::member), &V::member>, &Dispatch::EmptyMember<decltype(V::member), &V::member>, \
        "AssertionFailed:" text, line                                                                                 \
  }

const VLXKDMInstanceValue::Dispatch::Row VLXKDMInstanceValue::Dispatch::kRows[14] = {
    VALUE_ROW(IntegerType, false, Integer, _integer, "_type == IntegerType && !_isArray", 247),
    VALUE_ROW(DoubleType, false, Double, _double, "_type == DoubleType && !_isArray", 252),
    VALUE_ROW(BooleanType, false, Boolean, _boolean, "_type == BooleanType && !_isArray", 257),
    VALUE_ROW(StringType, false, String, _string, "_type == StringType && !_isArray", 262),
    VALUE_ROW(DateType, false, Date, _date, "_type == DateType && !_isArray", 267),
    VALUE_ROW(BinaryType, false, ByteArray, _binary, "_type == BinaryType && !_isArray", 272),
    VALUE_ROW(InstanceType, false, Instance, _instance, "_type == InstanceType && !_isArray", 277),
    VALUE_ROW(IntegerType, true, IntArray, _listOfInteger, "_type == IntegerType && _isArray", 282),
    VALUE_ROW(DoubleType, true, DoubleArray, _listOfDouble, "_type == DoubleType && _isArray", 287),
    VALUE_ROW(BooleanType, true, BooleanArray, _listOfBoolean, "_type == BooleanType && _isArray", 292),
    VALUE_ROW(StringType, true, StringArray, _listOfString, "_type == StringType && _isArray", 297),
    VALUE_ROW(DateType, true, DateArray, _listOfDate, "_type == DateType && _isArray", 302),
    VALUE_ROW(BinaryType, true, ByteArrayArray, _listOfBinary, "_type == BinaryType && _isArray", 307),
    VALUE_ROW(InstanceType, true, InstanceArray, _listOfInstance, "_type == InstanceType && _isArray", 312),
};

#undef VALUE_ROW

// ---- Special members -------------------------------------------------------------------------

VLXKDMInstanceValue::VLXKDMInstanceValue()
    : _integer(0),
      _double(0),
      _boolean(0),
      _listOfInteger(0),
      _listOfDouble(0),
      _isSynchronized(0),
      _isArray(0),
      _type(static_cast<Type>(-1))
{
}

VLXKDMInstanceValue::VLXKDMInstanceValue(const VLXKDMInstanceValue& other) = default;
VLXKDMInstanceValue& VLXKDMInstanceValue::operator=(const VLXKDMInstanceValue& other) = default;
VLXKDMInstanceValue::~VLXKDMInstanceValue() = default;

// ---- Local and remote forms ------------------------------------------------------------------

long VLXKDMInstanceValue::BuildLocal()
{
  JNIEnv* env = nullptr;
  const long started = InitJavaAndTestIsBuilt(env, kBuildLocal);
  if (started < 0) return HandleReplicaError(env, started, kBuildLocal);
  const ReplicaStubs* st = FrameAccess::Table();
  if (!st) return VLX_E_FAIL;
  if (!st->IsBound()) return st->ReportUnbound(kBuildLocal);
  return Read(env, GetHandle(), false);
}

long VLXKDMInstanceValue::Read(JNIEnv* env, jobject object, bool attach)
{
  const Dispatch::Row* row = Dispatch::Recognise(env, *FrameAccess::Table(), object);
  if (!row) {
    VLXFatalError("AssertionFailed:_type != (Type) -1", nullptr, nullptr, nullptr, kSource, kLineUnknownClass);
    return HandleReplicaError(
        env, RejectValue(kBuildLocal, "the Java object is of none of the classes of an attribute value"), kBuildLocal);
  }
  const long status = row->build(env, object, *this, attach);
  if (status < 0) return status;
  _type = row->type;
  _isArray = row->isArray;
  _isSynchronized = true;
  return VLX_S_OK;
}

long VLXKDMInstanceValue::AcceptObject(JNIEnv* env, jobject object)
{
  // Whatever happens, the Java object no longer stands for the local value.
  _isSynchronized = false;
  long status = VLX_S_OK;
  const ReplicaStubs* st = FrameAccess::BoundTable(kSetHandle, status);
  if (!st) return status;
  if (Dispatch::Recognise(env, *st, object)) return VLX_S_OK;
  return RejectValue(kSetHandle,
                     "the Java object is " + ClassText(env, object) + ", none of the classes of an attribute value");
}

long VLXKDMInstanceValue::BuildRemote()
{
  JNIEnv* env = nullptr;
  long status = InitJava(env, kBuildRemote);
  if (status < 0) return HandleReplicaError(env, status, kBuildRemote);
  // A value whose Java object was released is made again: a value never goes to Java as null.
  if (_isSynchronized && GetHandle()) return VLX_S_OK;

  jobject object = nullptr;
  status = InternalBuild(object);
  if (status < 0) return HandleReplicaError(env, status, kBuildRemote);
  // A single instance's object is the instance proxy's own global reference: not ours to delete.
  LocalRef made(env, _type == InstanceType && !_isArray ? nullptr : object);
  status = SetHandle(env, object);
  if (status >= 0) _isSynchronized = true;
  return HandleReplicaError(env, status, kBuildRemote);
}

long VLXKDMInstanceValue::InternalBuild(jobject& object)
{
  JNIEnv* env = nullptr;
  const long status = InitJava(env, kInternalBuild);
  if (status < 0) return HandleReplicaError(env, status, kInternalBuild);
  const Dispatch::Row* row = Dispatch::Find(_type, _isArray != 0);
  if (!row) {
    VLXFatalError("AssertionFailed:_type != (Type) -1", nullptr, nullptr, nullptr, kSource, kLineNoType);
    return HandleReplicaError(env, RejectValue(kInternalBuild, "the value has no type"), kInternalBuild);
  }
  return row->convert(env, *this, object);
}

void VLXKDMInstanceValue::Clean()
{
  // Even when the Java side cannot be reached, the value stops claiming that its Java object is
  // the Java form of what it now holds.
  _isSynchronized = false;
  JNIEnv* env = nullptr;
  const long status = InitJava(env, kClean);
  if (status < 0) {
    HandleReplicaError(env, status, kClean);
    return;
  }
  SetHandle(env, nullptr);
  if (const Dispatch::Row* row = Dispatch::Find(_type, _isArray != 0)) row->empty(env, *this);
}

VLXKDMInstanceValue::Type VLXKDMInstanceValue::GetType() { return _type; }

VLXBoolean VLXKDMInstanceValue::IsMultiValuated() const { return _isArray; }

// ---- Getters and setters ---------------------------------------------------------------------

int VLXKDMInstanceValue::GetInteger() const { return Dispatch::Get(*this, &V::_integer, IntegerType, false); }
double VLXKDMInstanceValue::GetDouble() const { return Dispatch::Get(*this, &V::_double, DoubleType, false); }
VLXBoolean VLXKDMInstanceValue::GetBoolean() const { return Dispatch::Get(*this, &V::_boolean, BooleanType, false); }
const VLXUnicodeString& VLXKDMInstanceValue::GetString() const
{
  return Dispatch::Get(*this, &V::_string, StringType, false);
}
const VLXTime& VLXKDMInstanceValue::GetDate() const { return Dispatch::Get(*this, &V::_date, DateType, false); }
const VLXBinary& VLXKDMInstanceValue::GetBinary() const { return Dispatch::Get(*this, &V::_binary, BinaryType, false); }
const VLXKDMInstance& VLXKDMInstanceValue::GetInstance() const
{
  return Dispatch::Get(*this, &V::_instance, InstanceType, false);
}
const VLXRawCollint& VLXKDMInstanceValue::GetListOfInteger() const
{
  return Dispatch::Get(*this, &V::_listOfInteger, IntegerType, true);
}
const VLXRawColldouble& VLXKDMInstanceValue::GetListOfDouble() const
{
  return Dispatch::Get(*this, &V::_listOfDouble, DoubleType, true);
}
const VLXListValVLXBoolean& VLXKDMInstanceValue::GetListOfBoolean() const
{
  return Dispatch::Get(*this, &V::_listOfBoolean, BooleanType, true);
}
const VLXListValVLXUnicodeString& VLXKDMInstanceValue::GetListOfString() const
{
  return Dispatch::Get(*this, &V::_listOfString, StringType, true);
}
const VLXListValVLXTime& VLXKDMInstanceValue::GetListOfDate() const
{
  return Dispatch::Get(*this, &V::_listOfDate, DateType, true);
}
const VLXListValVLXBinary& VLXKDMInstanceValue::GetListOfBinary() const
{
  return Dispatch::Get(*this, &V::_listOfBinary, BinaryType, true);
}
const VLXListValVLXKDMInstance& VLXKDMInstanceValue::GetListOfInstance() const
{
  return Dispatch::Get(*this, &V::_listOfInstance, InstanceType, true);
}

void VLXKDMInstanceValue::SetInteger(int value) { Dispatch::Set(*this, &V::_integer, IntegerType, false, value); }
void VLXKDMInstanceValue::SetDouble(double value) { Dispatch::Set(*this, &V::_double, DoubleType, false, value); }
void VLXKDMInstanceValue::SetBoolean(VLXBoolean value)
{
  Dispatch::Set(*this, &V::_boolean, BooleanType, false, value);
}
void VLXKDMInstanceValue::SetString(const VLXUnicodeString& value)
{
  Dispatch::Set(*this, &V::_string, StringType, false, value);
}
void VLXKDMInstanceValue::SetDate(const VLXTime& value) { Dispatch::Set(*this, &V::_date, DateType, false, value); }
void VLXKDMInstanceValue::SetBinary(const VLXBinary& value)
{
  Dispatch::Set(*this, &V::_binary, BinaryType, false, value);
}
void VLXKDMInstanceValue::SetInstance(const VLXKDMInstance& value)
{
  Dispatch::Set(*this, &V::_instance, InstanceType, false, value);
}
void VLXKDMInstanceValue::SetListOfInteger(const VLXRawCollint& value)
{
  Dispatch::Set(*this, &V::_listOfInteger, IntegerType, true, value);
}
void VLXKDMInstanceValue::SetListOfDouble(const VLXRawColldouble& value)
{
  Dispatch::Set(*this, &V::_listOfDouble, DoubleType, true, value);
}
void VLXKDMInstanceValue::SetListOfBoolean(const VLXListValVLXBoolean& value)
{
  Dispatch::Set(*this, &V::_listOfBoolean, BooleanType, true, value);
}
void VLXKDMInstanceValue::SetListOfString(const VLXListValVLXUnicodeString& value)
{
  Dispatch::Set(*this, &V::_listOfString, StringType, true, value);
}
void VLXKDMInstanceValue::SetListOfDate(const VLXListValVLXTime& value)
{
  Dispatch::Set(*this, &V::_listOfDate, DateType, true, value);
}
void VLXKDMInstanceValue::SetListOfBinary(const VLXListValVLXBinary& value)
{
  Dispatch::Set(*this, &V::_listOfBinary, BinaryType, true, value);
}
void VLXKDMInstanceValue::SetListOfInstance(const VLXListValVLXKDMInstance& value)
{
  Dispatch::Set(*this, &V::_listOfInstance, InstanceType, true, value);
}
