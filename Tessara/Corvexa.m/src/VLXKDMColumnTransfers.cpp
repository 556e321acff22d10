// The batch of columns crossing to Java: each column's Java form (as the Java Columns class reads
// and writes them), the columns Java answers landing in the batch, and the four transfers.
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
