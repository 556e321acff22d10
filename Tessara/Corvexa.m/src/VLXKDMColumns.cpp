// The batch of columns: native buffers per column, their Java forms (as the Java Columns class
// reads and writes them) and the four transfers through the call frame.
#include "VLXKDMColumns.h"

#include <algorithm>
#include <climits>
#include <memory>
#include <string>
#include <vector>

#include "CallFrame.h"
#include "VLXKDMInstance.h"
#include "VLXKDMModel.h"
#include "VLXListValVLXKDMInstance.h"

using namespace corvexa;
using H = VLXJBXJNIHelper;
using AT = VLXKDMAttributeType;

namespace {

constexpr int kUnknownType = -1;  // a column added to be read, before it is

// A range of items: a row's values of a list column, or a text's units.
struct Span {
  jint start = 0;
  jint count = 0;
};

// One column. Single-valued scalars (and instances) have one item per row, at the row's index;
// texts, binaries and lists have a span per row (empty for a row without a value) over their
// items: units, bytes, list elements, or for lists of texts and binaries the pieces, each a span
// of units or bytes.
struct Column {
  VLXUnicodeString name;
  int type = kUnknownType;
  bool multi = false;
  std::vector<jboolean> has;  // per row: whether it has (or gets) a value
  std::vector<jint> ints;
  std::vector<jdouble> doubles;
  std::vector<jboolean> booleans;
  std::vector<jlong> millis;
  std::vector<Span> spans;
  std::vector<Span> pieces;
  std::vector<jchar> units;
  std::vector<jbyte> bytes;
  // An Instance[]: one element per row (single-valued), or the items of a list column, of which
  // the first instanceCount are used when it is written.
  VLXJBXJavaObject instances;
  jint instanceCount = 0;

  void Start(const VLXUnicodeString& attribute, int valueType, bool multiValued, jint rows)
  {
    name = attribute;
    type = valueType;
    multi = multiValued;
    has.assign(rows, JNI_FALSE);
    ints.clear();
    doubles.clear();
    booleans.clear();
    millis.clear();
    spans.clear();
    pieces.clear();
    units.clear();
    bytes.clear();
    instances.SetGlobalRef(nullptr, nullptr);
    instanceCount = 0;
    if (type == kUnknownType) return;
    if (multi || type == AT::String || type == AT::Binary) {
      spans.assign(rows, Span{});
    } else if (type == AT::Integer) {
      ints.assign(rows, 0);
    } else if (type == AT::Double) {
      doubles.assign(rows, 0);
    } else if (type == AT::Boolean) {
      booleans.assign(rows, JNI_FALSE);
    } else if (type == AT::Date) {
      millis.assign(rows, 0);
    }
  }
};

const char* TypeName(int type)
{
  static const char* const names[] = {"Integer", "Double", "String", "Date", "Boolean", "Binary", "Relationship"};
  return type >= 0 && type <= AT::Relationship ? names[type] : "no type (the column is not read yet)";
}

std::string Kind(int type, bool multi)
{
  return type == kUnknownType ? TypeName(type) : std::string(multi ? "lists of " : "") + TypeName(type) + " values";
}

}  // namespace

class VLXKDMColumns::Store {
 public:
  jint rows = 0;
  std::vector<std::unique_ptr<Column>> columns;  // the first `used` are the batch's; the rest wait for reuse
  std::size_t used = 0;
  std::vector<jint> offsets;  // scratch for reading offsets

  // The column, checked against what the operation needs (a row in range and, unless type is
  // kUnknownType, the type); null with the failure in status.
  Column* At(const char* op, long column, long row, int type, bool multi, long& status) const
  {
    if (column < 0 || static_cast<std::size_t>(column) >= used) {
      status = RejectValue(
          op, "the batch has no column " + std::to_string(column) + " (it has " + std::to_string(used) + ")");
      return nullptr;
    }
    Column* c = columns[column].get();
    if (row < 0 || row >= rows) {
      status =
          RejectValue(op, "the batch has no row " + std::to_string(row) + " (it has " + std::to_string(rows) + ")");
      return nullptr;
    }
    if (type != kUnknownType && (c->type != type || c->multi != multi)) {
      status = RejectValue(op, "column " + std::to_string(column) + " ('" + c->name.c_str() + "') holds " +
                                   Kind(c->type, c->multi) + ", not " + Kind(type, multi));
      return nullptr;
    }
    return c;
  }

  // As At, for a row that must have a value.
  const Column* Read(const char* op, long column, long row, int type, bool multi, long& status) const
  {
    const Column* c = At(op, column, row, type, multi, status);
    if (c && !c->has[row]) {
      status = RejectValue(op, "row " + std::to_string(row) + " of column " + std::to_string(column) + " ('" +
                                   c->name.c_str() + "') has no value");
      return nullptr;
    }
    return c;
  }

  Column& Add(const VLXUnicodeString& attribute, int type, bool multi)
  {
    if (used == columns.size()) columns.push_back(std::make_unique<Column>());
    Column& c = *columns[used++];
    c.Start(attribute, type, multi, rows);
    return c;
  }

  void Reset(jint rowCount)
  {
    for (std::size_t k = 0; k < used; ++k) columns[k]->instances.SetGlobalRef(nullptr, nullptr);
    used = 0;
    rows = rowCount;
  }
};

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

// ---- The batch's Java forms --------------------------------------------------------------------

// The JNI functions of the Java array of each primitive type.
template <class T>
struct JavaArray;
#define VLXKDM_JAVA_ARRAY(T, Name)                                \
  template <>                                                     \
  struct JavaArray<T> {                                           \
    using A = T##Array;                                           \
    static constexpr auto make = &JNIEnv::New##Name##Array;       \
    static constexpr auto fill = &JNIEnv::Set##Name##ArrayRegion; \
    static constexpr auto read = &JNIEnv::Get##Name##ArrayRegion; \
  };
VLXKDM_JAVA_ARRAY(jint, Int)
VLXKDM_JAVA_ARRAY(jdouble, Double)
VLXKDM_JAVA_ARRAY(jboolean, Boolean)
VLXKDM_JAVA_ARRAY(jlong, Long)
VLXKDM_JAVA_ARRAY(jchar, Char)
VLXKDM_JAVA_ARRAY(jbyte, Byte)
#undef VLXKDM_JAVA_ARRAY

// A new Java array of the n values.
template <class T>
LocalRef NewJava(JNIEnv* env, const T* values, jsize n)
{
  LocalRef array(env, (env->*JavaArray<T>::make)(n));
  if (array.get() && n > 0)
    (env->*JavaArray<T>::fill)(static_cast<typename JavaArray<T>::A>(array.get()), 0, n, values);
  return array;
}

// The items of the spans in span order, with spans.size() + 1 offsets into them: the pool itself
// when its spans already follow each other from 0, else a packed copy.
template <class T>
const T* Packed(const std::vector<Span>& spans, const std::vector<T>& pool, std::vector<T>& packed,
                std::vector<jint>& offsets)
{
  // The spans are distinct ranges of the pool (a row set again leaves its old range unused), which
  // holds at most INT_MAX items: the offsets cannot overflow.
  offsets.resize(spans.size() + 1);
  bool inOrder = true;
  jint at = 0;
  for (std::size_t r = 0; r < spans.size(); ++r) {
    offsets[r] = at;
    if (spans[r].count > 0 && spans[r].start != at) inOrder = false;
    at += spans[r].count;
  }
  offsets[spans.size()] = at;
  if (inOrder) return pool.data();
  packed.clear();
  packed.reserve(static_cast<std::size_t>(at));
  for (const Span& s : spans) packed.insert(packed.end(), pool.begin() + s.start, pool.begin() + s.start + s.count);
  return packed.data();
}

// Builds outer[index] = {values, offsets} (or {values, pieceOffsets, rowOffsets}).
long PutParts(JNIEnv* env, jobjectArray outer, jsize index, std::initializer_list<jobject> parts)
{
  const ReplicaStubs* st = FrameAccess::Table();
  LocalRef form(env, H::NewObjectArray(env, static_cast<jsize>(parts.size()), st->Class(Object), nullptr));
  if (!form.get()) return VLX_E_OUTOFMEMORY;
  jsize i = 0;
  for (jobject part : parts) {
    if (!part) return VLX_E_OUTOFMEMORY;
    H::SetObjectArrayElement(env, static_cast<jobjectArray>(form.get()), i++, part);
  }
  H::SetObjectArrayElement(env, outer, index, form.get());
  return VLX_S_OK;
}

// The Java form of a variable column (texts, binaries, lists of scalars) from its pool.
template <class T>
long PutVariable(JNIEnv* env, jobjectArray outer, jsize index, const Column& c, const std::vector<T>& pool)
{
  std::vector<T> packed;
  std::vector<jint> offsets;
  const T* items = Packed(c.spans, pool, packed, offsets);
  LocalRef values = NewJava(env, items, offsets.back());
  LocalRef rows = NewJava(env, offsets.data(), static_cast<jsize>(offsets.size()));
  return PutParts(env, outer, index, {values.get(), rows.get()});
}

// The Java form of a list of texts or binaries: {units or bytes, piece offsets, row offsets}.
template <class T>
long PutPieces(JNIEnv* env, jobjectArray outer, jsize index, const Column& c, const std::vector<T>& pool)
{
  std::vector<Span> pieces;
  std::vector<jint> rowOffsets;
  const Span* rowPieces = Packed(c.spans, c.pieces, pieces, rowOffsets);
  const std::vector<Span> ordered(rowPieces, rowPieces + rowOffsets.back());
  std::vector<T> packed;
  std::vector<jint> pieceOffsets;
  const T* items = Packed(ordered, pool, packed, pieceOffsets);
  LocalRef values = NewJava(env, items, pieceOffsets.back());
  LocalRef byPiece = NewJava(env, pieceOffsets.data(), static_cast<jsize>(pieceOffsets.size()));
  LocalRef byRow = NewJava(env, rowOffsets.data(), static_cast<jsize>(rowOffsets.size()));
  return PutParts(env, outer, index, {values.get(), byPiece.get(), byRow.get()});
}

// The Java form of an instance column: the row's elements (single), or the packed items (list).
long PutInstances(JNIEnv* env, jobjectArray outer, jsize index, const Column& c, jint rows)
{
  const ReplicaStubs* st = FrameAccess::Table();
  const jobjectArray pool = static_cast<jobjectArray>(c.instances.GetGlobalRef());
  if (!c.multi) {
    if (pool) {
      H::SetObjectArrayElement(env, outer, index, pool);
      return VLX_S_OK;
    }
    LocalRef none(env, H::NewObjectArray(env, rows, st->Class(Instance), nullptr));
    if (!none.get()) return VLX_E_OUTOFMEMORY;
    H::SetObjectArrayElement(env, outer, index, none.get());
    return VLX_S_OK;
  }
  std::vector<Span> unused;
  std::vector<jint> offsets;
  std::vector<jint> order(static_cast<std::size_t>(c.instanceCount));
  for (jint i = 0; i < c.instanceCount; ++i) order[static_cast<std::size_t>(i)] = i;
  std::vector<jint> packed;
  const jint* items = Packed(c.spans, order, packed, offsets);
  LocalRef values;
  if (pool && items == order.data()) {
    values = LocalRef(env, H::NewLocalRef(env, pool));
  } else {
    values = LocalRef(env, H::NewObjectArray(env, offsets.back(), st->Class(Instance), nullptr));
    for (jint i = 0; values.get() && i < offsets.back(); ++i) {
      LocalRef item(env, H::GetObjectArrayElement(env, pool, items[i]));
      H::SetObjectArrayElement(env, static_cast<jobjectArray>(values.get()), i, item.get());
    }
  }
  LocalRef rowOffsets = NewJava(env, offsets.data(), static_cast<jsize>(offsets.size()));
  return PutParts(env, outer, index, {values.get(), rowOffsets.get()});
}

long PutColumn(JNIEnv* env, jobjectArray outer, jsize k, const Column& c, jint rows)
{
  if (c.type == AT::Relationship) return PutInstances(env, outer, k, c, rows);
  if (c.multi && c.type == AT::String) return PutPieces(env, outer, k, c, c.units);
  if (c.multi && c.type == AT::Binary) return PutPieces(env, outer, k, c, c.bytes);
  if (c.type == AT::String) return PutVariable(env, outer, k, c, c.units);
  if (c.type == AT::Binary) return PutVariable(env, outer, k, c, c.bytes);
  if (c.multi) {
    switch (c.type) {
      case AT::Integer:
        return PutVariable(env, outer, k, c, c.ints);
      case AT::Double:
        return PutVariable(env, outer, k, c, c.doubles);
      case AT::Boolean:
        return PutVariable(env, outer, k, c, c.booleans);
      default:
        return PutVariable(env, outer, k, c, c.millis);
    }
  }
  LocalRef values;
  switch (c.type) {
    case AT::Integer:
      values = NewJava(env, c.ints.data(), rows);
      break;
    case AT::Double:
      values = NewJava(env, c.doubles.data(), rows);
      break;
    case AT::Boolean:
      values = NewJava(env, c.booleans.data(), rows);
      break;
    default:
      values = NewJava(env, c.millis.data(), rows);
      break;
  }
  if (!values.get()) return VLX_E_OUTOFMEMORY;
  H::SetObjectArrayElement(env, outer, k, values.get());
  return VLX_S_OK;
}

// A new Java array of the batch's columns (what: its element class and one element per column).
template <class Each>
long NewColumnArray(JNIEnv* env, const Store& s, Slot elementClass, jobjectArray& out, Each each)
{
  const ReplicaStubs* st = FrameAccess::Table();
  LocalRef array(env, H::NewObjectArray(env, static_cast<jsize>(s.used), st->Class(elementClass), nullptr));
  if (!array.get()) return VLX_E_OUTOFMEMORY;
  for (std::size_t k = 0; k < s.used; ++k) {
    const long status = each(static_cast<jobjectArray>(array.get()), static_cast<jsize>(k), *s.columns[k]);
    if (status < 0) return status;
    if (H::ExceptionCheck(env)) return VLX_E_FAIL;
  }
  out = static_cast<jobjectArray>(array.release());
  return VLX_S_OK;
}

// The frame's arguments made from the batch: the attribute names, the columns and their masks.
struct NamesOf {
  const Store& store;
};
struct ColumnsOf {
  const Store& store;
};
struct MasksOf {
  const Store& store;
};
// An instance list as an Instance[], an unbuilt proxy as null (which Java refuses, naming the row).
struct RowsOf {
  const VLXListValVLXKDMInstance& list;
};

template <class Arg>
struct BatchArg {
  using J = jobjectArray;
  static constexpr bool kOwnsRef = true;
  static constexpr bool kEarly = false;
};

}  // namespace

namespace corvexa {

template <>
struct ArgOf<NamesOf> : BatchArg<NamesOf> {
  static long To(JNIEnv* env, const NamesOf& arg, J& out)
  {
    return NewColumnArray(env, arg.store, String, out, [env](jobjectArray array, jsize k, const Column& c) {
      jstring name = nullptr;
      const long status = ArgOf<VLXUnicodeString>::To(env, c.name, name);
      LocalRef owned(env, name);
      if (status >= 0) H::SetObjectArrayElement(env, array, k, name);
      return status;
    });
  }
};

template <>
struct ArgOf<ColumnsOf> : BatchArg<ColumnsOf> {
  static long To(JNIEnv* env, const ColumnsOf& arg, J& out)
  {
    const jint rows = arg.store.rows;
    return NewColumnArray(env, arg.store, Object, out, [env, rows](jobjectArray array, jsize k, const Column& c) {
      return PutColumn(env, array, k, c, rows);
    });
  }
};

template <>
struct ArgOf<MasksOf> : BatchArg<MasksOf> {
  static long To(JNIEnv* env, const MasksOf& arg, J& out)
  {
    const jint rows = arg.store.rows;
    return NewColumnArray(env, arg.store, BooleanArray, out, [env, rows](jobjectArray array, jsize k, const Column& c) {
      LocalRef mask = NewJava(env, c.has.data(), rows);
      if (!mask.get()) return VLX_E_OUTOFMEMORY;
      H::SetObjectArrayElement(env, array, k, mask.get());
      return VLX_S_OK;
    });
  }
};

template <>
struct ArgOf<RowsOf> : BatchArg<RowsOf> {
  static long To(JNIEnv* env, const RowsOf& arg, J& out)
  {
    const ReplicaStubs* st = FrameAccess::Table();
    LocalRef array(env, H::NewObjectArray(env, arg.list.Size(), st->Class(Instance), nullptr));
    if (!array.get()) return VLX_E_OUTOFMEMORY;
    for (int p = 1; p <= arg.list.Size(); ++p)
      H::SetObjectArrayElement(env, static_cast<jobjectArray>(array.get()), p - 1, arg.list[p].GetHandle());
    out = static_cast<jobjectArray>(array.release());
    return VLX_S_OK;
  }
};

// A result not wanted: its local reference is released.
struct Dropped {};
template <>
struct ResultOf<Dropped> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, Dropped&, long status)
  {
    LocalRef owned(env, result);
    return status;
  }
};

// ---- Java's columns into the batch -------------------------------------------------------------

// The columns Java answered (each column's form followed by the presence masks) land in the batch,
// whose rows become rows. A form other than the one its type has is reported, not guessed.
struct ColumnsRead {
  Store& store;
  jint rows;
};

template <>
struct ResultOf<ColumnsRead> {
  using Raw = jobject;

  static long Land(JNIEnv* env, jobject result, ColumnsRead& out, long)
  {
    LocalRef owned(env, result);
    Store& s = out.store;
    const jobjectArray all = static_cast<jobjectArray>(result);
    const jsize n = static_cast<jsize>(s.used);
    if (!all || H::GetArrayLength(env, all) != 2 * n) return Malformed(s, "not one column and one mask per column");
    if (out.rows < 0) {  // a model's instances: as many as the first mask has rows
      LocalRef mask(env, H::GetObjectArrayElement(env, all, n));
      if (!Is(env, mask.get(), BooleanArray)) return Malformed(s, "no mask");
      out.rows = H::GetArrayLength(env, static_cast<jarray>(mask.get()));
    }
    s.rows = out.rows;
    for (jsize k = 0; k < n; ++k) {
      Column& c = *s.columns[static_cast<std::size_t>(k)];
      LocalRef form(env, H::GetObjectArrayElement(env, all, k));
      LocalRef mask(env, H::GetObjectArrayElement(env, all, n + k));
      if (!Into(env, s, c, form.get(), mask.get())) return Malformed(s, std::string("column '") + c.name.c_str() + "'");
    }
    return VLX_S_OK;
  }

 private:
  // A read that cannot be landed empties the batch's rows and fails.
  static long Malformed(Store& s, const std::string& what)
  {
    s.rows = 0;
    for (std::size_t k = 0; k < s.used; ++k) s.columns[k]->Start(s.columns[k]->name, kUnknownType, false, 0);
    return RejectValue("VLXKDMColumns::GetValues", "the Java columns cannot be read: " + what);
  }

  static bool Is(JNIEnv* env, jobject object, Slot cls)
  {
    return object && H::IsInstanceOf(env, object, FrameAccess::Table()->Class(cls));
  }

  // Copies the first n elements of array (a Java array of T) into values.
  template <class T>
  static bool Copy(JNIEnv* env, jobject array, jsize n, std::vector<T>& values)
  {
    if (H::GetArrayLength(env, static_cast<jarray>(array)) < n) return false;
    values.resize(static_cast<std::size_t>(n));
    if (n > 0) (env->*JavaArray<T>::read)(static_cast<typename JavaArray<T>::A>(array), 0, n, values.data());
    return true;
  }

  // The spans of `count` ranges from their count + 1 offsets (0 first, never decreasing, at most
  // limit).
  static bool Spans(JNIEnv* env, Store& s, jobject offsets, jsize count, jsize limit, std::vector<Span>& spans)
  {
    if (!Is(env, offsets, IntArray) || H::GetArrayLength(env, static_cast<jarray>(offsets)) != count + 1 ||
        !Copy(env, offsets, count + 1, s.offsets))
      return false;
    spans.resize(static_cast<std::size_t>(count));
    for (jsize r = 0; r < count; ++r) {
      const jint from = s.offsets[r], to = s.offsets[r + 1];
      if (from < 0 || to < from || to > limit) return false;
      spans[r] = Span{from, to - from};
    }
    return true;
  }

  // Values of the type the Java array object holds, copied into the column (n of them at least).
  static bool Scalars(JNIEnv* env, Column& c, jobject values, jsize& n, bool exact)
  {
    const jsize length = values ? H::GetArrayLength(env, static_cast<jarray>(values)) : -1;
    if (exact && length != n) return false;
    n = length;
    if (Is(env, values, IntArray)) return c.type = AT::Integer, Copy(env, values, n, c.ints);
    if (Is(env, values, DoubleArray)) return c.type = AT::Double, Copy(env, values, n, c.doubles);
    if (Is(env, values, BooleanArray)) return c.type = AT::Boolean, Copy(env, values, n, c.booleans);
    if (Is(env, values, LongArray)) return c.type = AT::Date, Copy(env, values, n, c.millis);
    if (Is(env, values, CharArray)) return c.type = AT::String, Copy(env, values, n, c.units);
    if (Is(env, values, ByteArray)) return c.type = AT::Binary, Copy(env, values, n, c.bytes);
    if (Is(env, values, InstanceArray)) return c.type = AT::Relationship, c.instances.SetGlobalRef(env, values) >= 0;
    return false;
  }

  static bool Into(JNIEnv* env, Store& s, Column& c, jobject form, jobject mask)
  {
    const jsize rows = s.rows;
    c.Start(c.name, kUnknownType, false, rows);
    if (!Is(env, mask, BooleanArray) || !Copy(env, mask, rows, c.has)) return false;
    jsize n = rows;
    if (!Is(env, form, ObjectArray) || Is(env, form, InstanceArray)) return Scalars(env, c, form, n, true);
    // {values, offsets} or {units or bytes, piece offsets, row offsets}
    const jobjectArray parts = static_cast<jobjectArray>(form);
    const jsize count = H::GetArrayLength(env, parts);
    if (count != 2 && count != 3) return false;
    LocalRef values(env, H::GetObjectArrayElement(env, parts, 0));
    LocalRef offsets(env, H::GetObjectArrayElement(env, parts, count - 1));
    if (!Scalars(env, c, values.get(), n, false)) return false;
    const bool texts = c.type == AT::String || c.type == AT::Binary;
    c.multi = !texts || count == 3;
    if (count == 2) return Spans(env, s, offsets.get(), rows, n, c.spans);
    LocalRef pieceOffsets(env, H::GetObjectArrayElement(env, parts, 1));
    const jsize pieces = pieceOffsets.get() ? H::GetArrayLength(env, static_cast<jarray>(pieceOffsets.get())) - 1 : -1;
    return texts && pieces >= 0 && Spans(env, s, pieceOffsets.get(), pieces, n, c.pieces) &&
           Spans(env, s, offsets.get(), rows, pieces, c.spans);
  }
};

}  // namespace corvexa

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

// ---- Transfers ----

long VLXKDMColumns::CreateInstances(VLXKDMModel& model, VLXListValVLXKDMInstance& instances)
{
  return CallStatic("VLXKDMColumns::CreateInstances(VLXKDMModel&, VLXListValVLXKDMInstance&)", Columns,
                    slot<Columns_create>)
      .with(model, static_cast<int>(_store->rows), NamesOf{*_store}, ColumnsOf{*_store}, MasksOf{*_store})
      .returning(instances);
}

long VLXKDMColumns::CreateInstances(VLXKDMModel& model)
{
  Dropped none;
  return CallStatic("VLXKDMColumns::CreateInstances(VLXKDMModel&)", Columns, slot<Columns_create>)
      .with(model, static_cast<int>(_store->rows), NamesOf{*_store}, ColumnsOf{*_store}, MasksOf{*_store})
      .returning(none);
}

long VLXKDMColumns::SetValues(const VLXListValVLXKDMInstance& instances)
{
  static const char kOp[] = "VLXKDMColumns::SetValues(const VLXListValVLXKDMInstance&)";
  if (instances.Size() != _store->rows)
    return RejectValue(kOp, "the list holds " + std::to_string(instances.Size()) + " instances for the batch's " +
                                std::to_string(_store->rows) + " rows");
  return CallStatic(kOp, Columns, slot<Columns_set>)
      .with(RowsOf{instances}, NamesOf{*_store}, ColumnsOf{*_store}, MasksOf{*_store})
      .run();
}

long VLXKDMColumns::GetValues(VLXKDMModel& model)
{
  static const char kOp[] = "VLXKDMColumns::GetValues(VLXKDMModel&)";
  if (_store->used == 0) return RejectValue(kOp, "the batch has no column to read");
  // The rows are the model's instances: the first mask's length tells how many.
  ColumnsRead read{*_store, -1};
  return CallStatic(kOp, Columns, slot<Columns_getOfModel>).with(model, NamesOf{*_store}).returning(read);
}

long VLXKDMColumns::GetValues(const VLXListValVLXKDMInstance& instances)
{
  if (instances.Size() == 0) {
    _store->rows = 0;
    for (std::size_t k = 0; k < _store->used; ++k) {
      Column& c = *_store->columns[k];
      c.Start(c.name, kUnknownType, false, 0);
    }
    return VLX_S_OK;
  }
  ColumnsRead read{*_store, instances.Size()};
  return CallStatic("VLXKDMColumns::GetValues(const VLXListValVLXKDMInstance&)", Columns, slot<Columns_getOfInstances>)
      .with(RowsOf{instances}, NamesOf{*_store})
      .returning(read);
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
