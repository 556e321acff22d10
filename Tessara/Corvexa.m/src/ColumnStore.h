// The batch of columns inside: one column's native buffers, and the batch's columns with the
// checks every operation makes on the column and row it addresses. Shared by the operations on
// native values (VLXKDMColumns.cpp) and the transfers to and from Java (VLXKDMColumnTransfers.cpp).
#pragma once

#include <memory>
#include <string>
#include <vector>

#include <jni.h>

#include "Crossings.h"
#include "VLXKDMColumns.h"

namespace corvexa {

using AT = VLXKDMAttributeType;

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

inline const char* TypeName(int type)
{
  static const char* const names[] = {"Integer", "Double", "String", "Date", "Boolean", "Binary", "Relationship"};
  return type >= 0 && type <= AT::Relationship ? names[type] : "no type (the column is not read yet)";
}

inline std::string Kind(int type, bool multi)
{
  return type == kUnknownType ? TypeName(type) : std::string(multi ? "lists of " : "") + TypeName(type) + " values";
}

}  // namespace corvexa

class VLXKDMColumns::Store {
  using Column = corvexa::Column;

 public:
  jint rows = 0;
  std::vector<std::unique_ptr<Column>> columns;  // the first `used` are the batch's; the rest wait for reuse
  std::size_t used = 0;
  std::vector<jint> offsets;  // scratch for reading offsets

  // The column, checked against what the operation needs (a row in range and, unless type is
  // corvexa::kUnknownType, the type); null with the failure in status.
  Column* At(const char* op, long column, long row, int type, bool multi, long& status) const
  {
    if (column < 0 || static_cast<std::size_t>(column) >= used) {
      status = corvexa::RejectValue(
          op, "the batch has no column " + std::to_string(column) + " (it has " + std::to_string(used) + ")");
      return nullptr;
    }
    Column* c = columns[column].get();
    if (row < 0 || row >= rows) {
      status = corvexa::RejectValue(
          op, "the batch has no row " + std::to_string(row) + " (it has " + std::to_string(rows) + ")");
      return nullptr;
    }
    if (type != corvexa::kUnknownType && (c->type != type || c->multi != multi)) {
      status = corvexa::RejectValue(op, "column " + std::to_string(column) + " ('" + c->name.c_str() + "') holds " +
                                            corvexa::Kind(c->type, c->multi) + ", not " + corvexa::Kind(type, multi));
      return nullptr;
    }
    return c;
  }

  // As At, for a row that must have a value.
  const Column* Read(const char* op, long column, long row, int type, bool multi, long& status) const
  {
    const Column* c = At(op, column, row, type, multi, status);
    if (c && !c->has[row]) {
      status = corvexa::RejectValue(op, "row " + std::to_string(row) + " of column " + std::to_string(column) + " ('" +
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
