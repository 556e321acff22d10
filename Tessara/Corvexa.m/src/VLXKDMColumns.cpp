// The batch of columns: the operations on its native values (shape, values to write, values read).
// The column buffers are in ColumnStore.h, the transfers in VLXKDMColumnTransfers.cpp.
#include "VLXKDMColumns.h"

#include <algorithm>
#include <climits>
#include <string>
#include <vector>

#include "CallFrame.h"
#include "ColumnStore.h"
#include "VLXKDMInstance.h"
#include "VLXKDMModel.h"
#include "VLXListValVLXKDMInstance.h"

using namespace corvexa;
using H = VLXJBXJNIHelper;

namespace {

using Store = VLXKDMColumns::Store;

// ---- Native values into the batch --------------------------------------------------------------

// A scalar into row's slot of a single-valued column.
template <class T, class V>
long PutScalar(Store& s, const char* op, long column, long row, int type, std::vector<T> Column::*slots, V value)
{
  long status = VLX_S_OK;
  Column* c = s.At(op, column, row, type, false, status);
  if (!c) return status;
  (c->*slots)[row] = static_cast<T>(value);
  c->has[row] = JNI_TRUE;
  return VLX_S_OK;
}

// A row's items appended to a pool: append(pool) adds them (false: refused, status set).
template <class T, class Append>
long PutItems(Store& s, const char* op, long column, long row, int type, bool multi, std::vector<T> Column::*pool,
              Append append)
{
  long status = VLX_S_OK;
  Column* c = s.At(op, column, row, type, multi, status);
  if (!c) return status;
  std::vector<T>& items = c->*pool;
  const std::size_t before = items.size();
  if (!append(items, status)) {
    items.resize(before);
    return status;
  }
  if (items.size() > static_cast<std::size_t>(INT_MAX)) {
    items.resize(before);
    return RejectValue(op, std::string("column '") + c->name.c_str() + "' would pass the largest Java array");
  }
  c->spans[row] = Span{static_cast<jint>(before), static_cast<jint>(items.size() - before)};
  c->has[row] = JNI_TRUE;
  return VLX_S_OK;
}

// UTF-8 text appended to units as UTF-16; false for ill-formed UTF-8.
bool AppendText(const char* op, const char* utf8, int length, std::vector<jchar>& units, long& status,
                const std::string& what)
{
  if (length < 0 || (!utf8 && length > 0)) {
    status = RejectValue(op, what + " has no bytes or a negative length");
    return false;
  }
  // An ASCII start is copied as it is; the rest, from the first other byte, is checked, then decoded.
  const std::size_t at = units.size();
  units.resize(at + static_cast<std::size_t>(length));
  jchar* out = units.data() + at;
  int i = 0;
  for (; i < length && static_cast<unsigned char>(utf8[i]) < 0x80; ++i) out[i] = static_cast<unsigned char>(utf8[i]);
  if (i == length) return true;
  const char* reason = nullptr;
  const int bad = VLXUnicodeString::FirstMalformedOffset(utf8 + i, length - i, &reason);
  if (bad >= 0) {
    units.resize(at);
    status = RejectValue(
        op, "the byte at offset " + std::to_string(i + bad) + " of " + what + " is not valid UTF-8 (" + reason + ")");
    return false;
  }
  units.resize(at + static_cast<std::size_t>(i + VLXUnicodeString::DecodeUtf8(utf8 + i, length - i, out + i)));
  return true;
}

bool AppendBytes(const char* op, const unsigned char* data, int length, std::vector<jbyte>& bytes, long& status)
{
  if (length < 0 || (!data && length > 0)) {
    status = RejectValue(op, "the binary has no bytes or a negative length");
    return false;
  }
  bytes.insert(bytes.end(), reinterpret_cast<const jbyte*>(data), reinterpret_cast<const jbyte*>(data) + length);
  return true;
}

// The pieces of a list of texts or binaries: each appended by add(index) to the units or bytes.
template <class Add>
bool AppendPieces(Column& c, int count, std::size_t (*size)(const Column&), Add add)
{
  for (int i = 1; i <= count; ++i) {
    const std::size_t at = size(c);
    if (!add(i)) return false;
    c.pieces.push_back(Span{static_cast<jint>(at), static_cast<jint>(size(c) - at)});
  }
  return true;
}

bool TimeToMillis(const char* op, const VLXTime& time, jlong& ms, long& status)
{
  if (Milliseconds(time, ms)) return true;
  status = RejectValue(op, "the time " + std::to_string(static_cast<long long>(time.Gettime_t())) +
                               " s is beyond the range of a Java date");
  return false;
}

// The calling thread's environment with the Java side started; null with the failure in status.
JNIEnv* Env(const char* op, long& status)
{
  JNIEnv* env = nullptr;
  status = FrameAccess::Start(nullptr, env, op);
  if (status < 0) return nullptr;
  if (!FrameAccess::BoundTable(op, status)) return nullptr;
  return env;
}

// Room in the column's Instance[] for `more` items past the used ones (copying into a larger
// array when needed).
long InstanceRoom(JNIEnv* env, Column& c, jint more, jint fixed, const char* op)
{
  const ReplicaStubs* st = FrameAccess::Table();
  const jobjectArray old = static_cast<jobjectArray>(c.instances.GetGlobalRef());
  const jint capacity = old ? H::GetArrayLength(env, old) : 0;
  const long long need = fixed > 0 ? fixed : static_cast<long long>(c.instanceCount) + more;
  if (need <= capacity) return VLX_S_OK;
  if (need > INT_MAX)
    return RejectValue(op, std::string("column '") + c.name.c_str() + "' would pass the largest Java array");
  const jint size =
      fixed > 0 ? fixed : static_cast<jint>(std::min<long long>(INT_MAX, std::max<long long>(16, 2 * need)));
  LocalRef grown(env, H::NewObjectArray(env, size, st->Class(Instance), nullptr));
  if (!grown.get()) return VLXKDMJavaObject::HandleReplicaError(env, VLX_E_OUTOFMEMORY, op);
  for (jint i = 0; i < c.instanceCount; ++i) {
    LocalRef item(env, H::GetObjectArrayElement(env, old, i));
    H::SetObjectArrayElement(env, static_cast<jobjectArray>(grown.get()), i, item.get());
  }
  return c.instances.SetGlobalRef(env, grown.get());
}

}  // namespace

// ---- The operations ----------------------------------------------------------------------------

VLXKDMColumns::VLXKDMColumns() : _store(new Store) {}

VLXKDMColumns::~VLXKDMColumns() { delete _store; }

long VLXKDMColumns::Reset(long rows)
{
  if (rows < 0 || rows > INT_MAX)
    return RejectValue("VLXKDMColumns::Reset(long)",
                       "a batch has 0 to " + std::to_string(INT_MAX) + " rows, not " + std::to_string(rows));
  _store->Reset(static_cast<jint>(rows));
  return VLX_S_OK;
}

long VLXKDMColumns::GetRowCount(long& rows) const
{
  rows = _store->rows;
  return VLX_S_OK;
}

long VLXKDMColumns::GetColumnCount(long& columns) const
{
  columns = static_cast<long>(_store->used);
  return VLX_S_OK;
}

long VLXKDMColumns::AddColumn(const VLXUnicodeString& attribute, VLXKDMAttributeType::Type type, VLXBoolean multiValued,
                              long& column)
{
  if (type < AT::Integer || type > AT::Relationship)
    return RejectValue(
        "VLXKDMColumns::AddColumn(const VLXUnicodeString&, VLXKDMAttributeType::Type, VLXBoolean, long&)",
        "the type " + std::to_string(static_cast<int>(type)) + " is not an attribute type");
  _store->Add(attribute, type, multiValued != 0);
  column = static_cast<long>(_store->used - 1);
  return VLX_S_OK;
}

long VLXKDMColumns::AddColumn(const VLXUnicodeString& attribute, long& column)
{
  _store->Add(attribute, kUnknownType, false);
  column = static_cast<long>(_store->used - 1);
  return VLX_S_OK;
}

long VLXKDMColumns::GetColumn(long column, VLXUnicodeString& attribute, int& type, VLXBoolean& multiValued) const
{
  if (column < 0 || static_cast<std::size_t>(column) >= _store->used)
    return RejectValue(
        "VLXKDMColumns::GetColumn(long, VLXUnicodeString&, int&, VLXBoolean&)",
        "the batch has no column " + std::to_string(column) + " (it has " + std::to_string(_store->used) + ")");
  const Column& c = *_store->columns[static_cast<std::size_t>(column)];
  attribute = c.name;
  type = c.type;
  multiValued = c.multi ? 1 : 0;
  return VLX_S_OK;
}

// ---- Values to write ----

long VLXKDMColumns::SetInteger(long column, long row, int value)
{
  return PutScalar(*_store, "VLXKDMColumns::SetInteger(long, long, int)", column, row, AT::Integer, &Column::ints,
                   value);
}

long VLXKDMColumns::SetDouble(long column, long row, double value)
{
  return PutScalar(*_store, "VLXKDMColumns::SetDouble(long, long, double)", column, row, AT::Double, &Column::doubles,
                   value);
}

long VLXKDMColumns::SetBoolean(long column, long row, VLXBoolean value)
{
  return PutScalar(*_store, "VLXKDMColumns::SetBoolean(long, long, VLXBoolean)", column, row, AT::Boolean,
                   &Column::booleans, value != 0 ? JNI_TRUE : JNI_FALSE);
}

long VLXKDMColumns::SetTime(long column, long row, const VLXTime& value)
{
  static const char kOp[] = "VLXKDMColumns::SetTime(long, long, const VLXTime&)";
  jlong ms = 0;
  long status = VLX_S_OK;
  if (!TimeToMillis(kOp, value, ms, status)) return status;
  return PutScalar(*_store, kOp, column, row, AT::Date, &Column::millis, ms);
}

long VLXKDMColumns::SetMilliseconds(long column, long row, long long milliseconds)
{
  return PutScalar(*_store, "VLXKDMColumns::SetMilliseconds(long, long, long long)", column, row, AT::Date,
                   &Column::millis, milliseconds);
}

long VLXKDMColumns::SetText(long column, long row, const VLXUnicodeString& value)
{
  static const char kOp[] = "VLXKDMColumns::SetText(long, long, const VLXUnicodeString&)";
  return PutItems(*_store, kOp, column, row, AT::String, false, &Column::units,
                  [&](std::vector<jchar>& units, long& status) {
                    return AppendText(kOp, value.c_str(), value.GetLengthInByte(), units, status, "the text");
                  });
}

long VLXKDMColumns::SetText(long column, long row, const char* utf8, int length)
{
  static const char kOp[] = "VLXKDMColumns::SetText(long, long, const char*, int)";
  return PutItems(*_store, kOp, column, row, AT::String, false, &Column::units,
                  [&](std::vector<jchar>& units, long& status) {
                    return AppendText(kOp, utf8, length, units, status, "the text");
                  });
}

long VLXKDMColumns::SetBinary(long column, long row, const VLXBinary& value)
{
  return SetBinary(column, row, value.getData(), value.getLength());
}

long VLXKDMColumns::SetBinary(long column, long row, const unsigned char* bytes, int length)
{
  static const char kOp[] = "VLXKDMColumns::SetBinary(long, long, const unsigned char*, int)";
  return PutItems(
      *_store, kOp, column, row, AT::Binary, false, &Column::bytes,
      [&](std::vector<jbyte>& pool, long& status) { return AppendBytes(kOp, bytes, length, pool, status); });
}

long VLXKDMColumns::SetInstance(long column, long row, const VLXKDMInstance& value)
{
  static const char kOp[] = "VLXKDMColumns::SetInstance(long, long, const VLXKDMInstance&)";
  long status = VLX_S_OK;
  Column* c = _store->At(kOp, column, row, AT::Relationship, false, status);
  JNIEnv* env = c ? Env(kOp, status) : nullptr;
  if (!env) return status;
  status = InstanceRoom(env, *c, 0, _store->rows, kOp);
  if (status < 0) return status;
  H::SetObjectArrayElement(env, static_cast<jobjectArray>(c->instances.GetGlobalRef()), static_cast<jsize>(row),
                           value.GetHandle());
  c->has[row] = JNI_TRUE;
  return VLX_S_OK;
}

long VLXKDMColumns::SetIntegers(long column, long row, const VLXRawCollint& values)
{
  return PutItems(*_store, "VLXKDMColumns::SetIntegers(long, long, const VLXRawCollint&)", column, row, AT::Integer,
                  true, &Column::ints, [&](std::vector<jint>& pool, long&) {
                    pool.insert(pool.end(), values.Data(), values.Data() + values.Size());
                    return true;
                  });
}

long VLXKDMColumns::SetDoubles(long column, long row, const VLXRawColldouble& values)
{
  return PutItems(*_store, "VLXKDMColumns::SetDoubles(long, long, const VLXRawColldouble&)", column, row, AT::Double,
                  true, &Column::doubles, [&](std::vector<jdouble>& pool, long&) {
                    pool.insert(pool.end(), values.Data(), values.Data() + values.Size());
                    return true;
                  });
}

long VLXKDMColumns::SetBooleans(long column, long row, const VLXListValVLXBoolean& values)
{
  return PutItems(*_store, "VLXKDMColumns::SetBooleans(long, long, const VLXListValVLXBoolean&)", column, row,
                  AT::Boolean, true, &Column::booleans, [&](std::vector<jboolean>& pool, long&) {
                    for (int i = 1; i <= values.Size(); ++i) pool.push_back(values[i] != 0 ? JNI_TRUE : JNI_FALSE);
                    return true;
                  });
}

long VLXKDMColumns::SetTimes(long column, long row, const VLXListValVLXTime& values)
{
  static const char kOp[] = "VLXKDMColumns::SetTimes(long, long, const VLXListValVLXTime&)";
  return PutItems(*_store, kOp, column, row, AT::Date, true, &Column::millis,
                  [&](std::vector<jlong>& pool, long& status) {
                    for (int i = 1; i <= values.Size(); ++i) {
                      jlong ms = 0;
                      if (!TimeToMillis(kOp, values[i], ms, status)) return false;
                      pool.push_back(ms);
                    }
                    return true;
                  });
}

namespace {
std::size_t UnitCount(const Column& c) { return c.units.size(); }
std::size_t ByteCount(const Column& c) { return c.bytes.size(); }

// A list of texts or binaries into row's pieces: add(index) appends element index's units or bytes.
template <class Add>
long PutPieceList(Store& s, const char* op, long column, long row, int type, int count,
                  std::size_t (*size)(const Column&), Add add)
{
  long status = VLX_S_OK;
  Column* c = s.At(op, column, row, type, true, status);
  if (!c) return status;
  const std::size_t pieces = c->pieces.size(), units = c->units.size(), bytes = c->bytes.size();
  if (!AppendPieces(*c, count, size, [&](int i) { return add(*c, i, status); }) ||
      c->pieces.size() > static_cast<std::size_t>(INT_MAX) || size(*c) > static_cast<std::size_t>(INT_MAX)) {
    c->pieces.resize(pieces);
    c->units.resize(units);
    c->bytes.resize(bytes);
    return status < 0
               ? status
               : RejectValue(op, std::string("column '") + c->name.c_str() + "' would pass the largest Java array");
  }
  c->spans[row] = Span{static_cast<jint>(pieces), static_cast<jint>(c->pieces.size() - pieces)};
  c->has[row] = JNI_TRUE;
  return VLX_S_OK;
}
}  // namespace

long VLXKDMColumns::SetTexts(long column, long row, const VLXListValVLXUnicodeString& values)
{
  static const char kOp[] = "VLXKDMColumns::SetTexts(long, long, const VLXListValVLXUnicodeString&)";
  return PutPieceList(*_store, kOp, column, row, AT::String, values.Size(), UnitCount,
                      [&](Column& c, int i, long& status) {
                        return AppendText(kOp, values[i].c_str(), values[i].GetLengthInByte(), c.units, status,
                                          "element " + std::to_string(i) + " of the list");
                      });
}

long VLXKDMColumns::SetBinaries(long column, long row, const VLXListValVLXBinary& values)
{
  static const char kOp[] = "VLXKDMColumns::SetBinaries(long, long, const VLXListValVLXBinary&)";
  return PutPieceList(*_store, kOp, column, row, AT::Binary, values.Size(), ByteCount,
                      [&](Column& c, int i, long& status) {
                        return AppendBytes(kOp, values[i].getData(), values[i].getLength(), c.bytes, status);
                      });
}

long VLXKDMColumns::SetInstances(long column, long row, const VLXListValVLXKDMInstance& values)
{
  static const char kOp[] = "VLXKDMColumns::SetInstances(long, long, const VLXListValVLXKDMInstance&)";
  long status = VLX_S_OK;
  Column* c = _store->At(kOp, column, row, AT::Relationship, true, status);
  JNIEnv* env = c ? Env(kOp, status) : nullptr;
  if (!env) return status;
  status = InstanceRoom(env, *c, values.Size(), 0, kOp);
  if (status < 0) return status;
  const jobjectArray pool = static_cast<jobjectArray>(c->instances.GetGlobalRef());
  for (int i = 1; i <= values.Size(); ++i)
    H::SetObjectArrayElement(env, pool, c->instanceCount + i - 1, values[i].GetHandle());
  c->spans[row] = Span{c->instanceCount, values.Size()};
  c->instanceCount += values.Size();
  c->has[row] = JNI_TRUE;
  return VLX_S_OK;
}

// ---- Values read ----

long VLXKDMColumns::HasValue(long column, long row, VLXBoolean& hasValue) const
{
  long status = VLX_S_OK;
  const Column* c =
      _store->At("VLXKDMColumns::HasValue(long, long, VLXBoolean&)", column, row, kUnknownType, false, status);
  if (!c) return status;
  hasValue = c->has[row] ? 1 : 0;
  return VLX_S_OK;
}

namespace {
// A single-valued scalar of a row that has one.
template <class T, class V>
long GetScalar(const Store& s, const char* op, long column, long row, int type, const std::vector<T> Column::*slots,
               V& value)
{
  long status = VLX_S_OK;
  const Column* c = s.Read(op, column, row, type, false, status);
  if (!c) return status;
  value = static_cast<V>((c->*slots)[row]);
  return VLX_S_OK;
}

// A list of scalars of a row that has one, each converted by into(list, item).
template <class T, class List, class Into>
long GetList(const Store& s, const char* op, long column, long row, int type, const std::vector<T> Column::*pool,
             List& values, Into into)
{
  long status = VLX_S_OK;
  const Column* c = s.Read(op, column, row, type, true, status);
  if (!c) return status;
  List list(c->spans[row].count);
  for (jint i = 0; i < c->spans[row].count; ++i) into(list, (c->*pool)[c->spans[row].start + i]);
  values = list;
  return VLX_S_OK;
}

// The UTF-8 form of a span of units.
long TextOf(const char* op, const Column& c, const Span& span, VLXUnicodeString& text)
{
  std::string bytes(3 * static_cast<std::size_t>(span.count), '\0');
  const long n = VLXUnicodeString::EncodeUtf16(c.units.data() + span.start, span.count, &bytes[0], false);
  if (n < 0)
    return RejectValue(op, std::string("the Java text holds an unpaired surrogate at index ") + std::to_string(-1 - n) +
                               ", which UTF-8 cannot carry");
  text = VLXUnicodeString(bytes.data(), static_cast<int>(n));
  return VLX_S_OK;
}

VLXBinary BinaryOf(const Column& c, const Span& span) { return VLXBinary(c.bytes.data() + span.start, span.count); }

// The instance at index of the column's Instance[] into value.
long InstanceAt(const char* op, const Column& c, jint index, VLXKDMInstance& value)
{
  long status = VLX_S_OK;
  JNIEnv* env = Env(op, status);
  if (!env) return status;
  LocalRef item(env, H::GetObjectArrayElement(env, static_cast<jobjectArray>(c.instances.GetGlobalRef()), index));
  return value.SetHandle(env, item.get());
}
}  // namespace

long VLXKDMColumns::GetInteger(long column, long row, int& value) const
{
  return GetScalar(*_store, "VLXKDMColumns::GetInteger(long, long, int&)", column, row, AT::Integer, &Column::ints,
                   value);
}

long VLXKDMColumns::GetDouble(long column, long row, double& value) const
{
  return GetScalar(*_store, "VLXKDMColumns::GetDouble(long, long, double&)", column, row, AT::Double, &Column::doubles,
                   value);
}

long VLXKDMColumns::GetBoolean(long column, long row, VLXBoolean& value) const
{
  return GetScalar(*_store, "VLXKDMColumns::GetBoolean(long, long, VLXBoolean&)", column, row, AT::Boolean,
                   &Column::booleans, value);
}

long VLXKDMColumns::GetTime(long column, long row, VLXTime& value) const
{
  long long ms = 0;
  const long status =
      GetScalar(*_store, "VLXKDMColumns::GetTime(long, long, VLXTime&)", column, row, AT::Date, &Column::millis, ms);
  if (status >= 0) value.Settime_t(Seconds(ms));
  return status;
}

long VLXKDMColumns::GetMilliseconds(long column, long row, long long& milliseconds) const
{
  return GetScalar(*_store, "VLXKDMColumns::GetMilliseconds(long, long, long long&)", column, row, AT::Date,
                   &Column::millis, milliseconds);
}

long VLXKDMColumns::GetText(long column, long row, VLXUnicodeString& value) const
{
  static const char kOp[] = "VLXKDMColumns::GetText(long, long, VLXUnicodeString&)";
  long status = VLX_S_OK;
  const Column* c = _store->Read(kOp, column, row, AT::String, false, status);
  return c ? TextOf(kOp, *c, c->spans[row], value) : status;
}

long VLXKDMColumns::GetBinary(long column, long row, VLXBinary& value) const
{
  long status = VLX_S_OK;
  const Column* c =
      _store->Read("VLXKDMColumns::GetBinary(long, long, VLXBinary&)", column, row, AT::Binary, false, status);
  if (!c) return status;
  value = BinaryOf(*c, c->spans[row]);
  return VLX_S_OK;
}

long VLXKDMColumns::GetInstance(long column, long row, VLXKDMInstance& value) const
{
  static const char kOp[] = "VLXKDMColumns::GetInstance(long, long, VLXKDMInstance&)";
  long status = VLX_S_OK;
  const Column* c = _store->Read(kOp, column, row, AT::Relationship, false, status);
  return c ? InstanceAt(kOp, *c, static_cast<jint>(row), value) : status;
}

long VLXKDMColumns::GetIntegers(long column, long row, VLXRawCollint& values) const
{
  return GetList(*_store, "VLXKDMColumns::GetIntegers(long, long, VLXRawCollint&)", column, row, AT::Integer,
                 &Column::ints, values, [](VLXRawCollint& list, jint v) { list.Append(v); });
}

long VLXKDMColumns::GetDoubles(long column, long row, VLXRawColldouble& values) const
{
  return GetList(*_store, "VLXKDMColumns::GetDoubles(long, long, VLXRawColldouble&)", column, row, AT::Double,
                 &Column::doubles, values, [](VLXRawColldouble& list, jdouble v) { list.Append(v); });
}

long VLXKDMColumns::GetBooleans(long column, long row, VLXListValVLXBoolean& values) const
{
  return GetList(*_store, "VLXKDMColumns::GetBooleans(long, long, VLXListValVLXBoolean&)", column, row, AT::Boolean,
                 &Column::booleans, values, [](VLXListValVLXBoolean& list, jboolean v) { list.Append(v ? 1 : 0); });
}

long VLXKDMColumns::GetTimes(long column, long row, VLXListValVLXTime& values) const
{
  return GetList(*_store, "VLXKDMColumns::GetTimes(long, long, VLXListValVLXTime&)", column, row, AT::Date,
                 &Column::millis, values, [](VLXListValVLXTime& list, jlong ms) {
                   VLXTime time;
                   time.Settime_t(Seconds(ms));
                   list.Append(time);
                 });
}

long VLXKDMColumns::GetTexts(long column, long row, VLXListValVLXUnicodeString& values) const
{
  static const char kOp[] = "VLXKDMColumns::GetTexts(long, long, VLXListValVLXUnicodeString&)";
  long status = VLX_S_OK;
  const Column* c = _store->Read(kOp, column, row, AT::String, true, status);
  if (!c) return status;
  VLXListValVLXUnicodeString list(c->spans[row].count);
  for (jint i = 0; i < c->spans[row].count; ++i) {
    VLXUnicodeString text;
    status = TextOf(kOp, *c, c->pieces[c->spans[row].start + i], text);
    if (status < 0) return status;
    list.Append(text);
  }
  values = list;
  return VLX_S_OK;
}

long VLXKDMColumns::GetBinaries(long column, long row, VLXListValVLXBinary& values) const
{
  long status = VLX_S_OK;
  const Column* c = _store->Read("VLXKDMColumns::GetBinaries(long, long, VLXListValVLXBinary&)", column, row,
                                 AT::Binary, true, status);
  if (!c) return status;
  VLXListValVLXBinary list(c->spans[row].count);
  for (jint i = 0; i < c->spans[row].count; ++i) list.Append(BinaryOf(*c, c->pieces[c->spans[row].start + i]));
  values = list;
  return VLX_S_OK;
}

long VLXKDMColumns::GetInstances(long column, long row, VLXListValVLXKDMInstance& values) const
{
  static const char kOp[] = "VLXKDMColumns::GetInstances(long, long, VLXListValVLXKDMInstance&)";
  long status = VLX_S_OK;
  const Column* c = _store->Read(kOp, column, row, AT::Relationship, true, status);
  if (!c) return status;
  VLXListValVLXKDMInstance list(c->spans[row].count);
  for (jint i = 0; i < c->spans[row].count; ++i) {
    VLXKDMInstance item;
    status = InstanceAt(kOp, *c, c->spans[row].start + i, item);
    if (status < 0) return status;
    list.Append(item);
  }
  values = list;
  return VLX_S_OK;
}
