// VLXKDMColumns: the values of many instances at once, one column per attribute, held in native
// buffers and moved to or from Java in one call per batch.
//
// A batch has a number of rows (Reset) and columns (AddColumn); row r of every column belongs to
// the same instance. To write, add each column with its attribute's type, set the rows that get a
// value, then CreateInstances (row r becomes the r-th new instance) or SetValues (row r goes to
// the r-th instance of a list). A row left unset is not written. To read, add each column by
// name and call GetValues; the columns then carry their attribute's type and every row's value,
// or no value.
//
// Setting a value only copies it into the batch: texts become UTF-16 there, binaries are appended
// to one buffer, instances are referenced. Setting a row again replaces its value. Nothing crosses
// to Java before the transfer, whose arguments are a few primitive arrays per column; a transfer
// is all or nothing: when Java refuses a value, nothing of the batch is applied and the last error
// names the row (from 0) and the attribute. The buffers keep their memory from batch to batch.
//
// Rows and columns count from 0. Every operation returns a result code; a failing one leaves its
// out-parameters and the batch as they were, with the thread's last error saying why (a column or
// row out of range, a value of another type than the column's, a row without a value). A batch is
// used by one thread at a time.
#pragma once

#include "CorvexaExport.h"
#include "VLXBinary.h"
#include "VLXKDMSchemaTypes.h"
#include "VLXListValVLXBinary.h"
#include "VLXListValVLXBoolean.h"
#include "VLXListValVLXTime.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXRawColldouble.h"
#include "VLXRawCollint.h"
#include "VLXResult.h"
#include "VLXTime.h"
#include "VLXUnicodeString.h"

class VLXKDMInstance;
class VLXKDMModel;
class VLXListValVLXKDMInstance;

class CORVEXA_API VLXKDMColumns {
 public:
  // A batch of no rows and no columns.
  VLXKDMColumns();
  // Releases the instances the batch refers to.
  ~VLXKDMColumns();
  VLXKDMColumns(const VLXKDMColumns&) = delete;
  VLXKDMColumns& operator=(const VLXKDMColumns&) = delete;

  // ---- Shape ----
  // Starts a new batch of rows rows (0 or more) without columns.
  long Reset(long rows);
  long GetRowCount(long& rows) const;
  long GetColumnCount(long& columns) const;
  // A column to write to attribute: its values must be of type (lists of them when multiValued).
  long AddColumn(const VLXUnicodeString& attribute, VLXKDMAttributeType::Type type, VLXBoolean multiValued,
                 long& column);
  // A column to read from attribute: its type comes with the values.
  long AddColumn(const VLXUnicodeString& attribute, long& column);
  // The column's attribute, type and multiplicity; a column added to be read has no type (-1)
  // before it is read.
  long GetColumn(long column, VLXUnicodeString& attribute, int& type, VLXBoolean& multiValued) const;

  // ---- Values to write: row's value of column, which must have the setter's type ----
  long SetInteger(long column, long row, int value);
  long SetDouble(long column, long row, double value);
  long SetBoolean(long column, long row, VLXBoolean value);
  // A date as whole seconds, or as milliseconds since 1970-01-01 00:00 UTC (either may be before).
  long SetTime(long column, long row, const VLXTime& value);
  long SetMilliseconds(long column, long row, long long milliseconds);
  // A text of UTF-8 bytes (NUL included), refused unless well-formed.
  long SetText(long column, long row, const VLXUnicodeString& value);
  long SetText(long column, long row, const char* utf8, int length);
  long SetBinary(long column, long row, const VLXBinary& value);
  long SetBinary(long column, long row, const unsigned char* bytes, int length);
  // The instance value; an unbuilt proxy clears the row's value when written.
  long SetInstance(long column, long row, const VLXKDMInstance& value);
  // The values of a multi-valued column's row (an empty list writes an empty list).
  long SetIntegers(long column, long row, const VLXRawCollint& values);
  long SetDoubles(long column, long row, const VLXRawColldouble& values);
  long SetBooleans(long column, long row, const VLXListValVLXBoolean& values);
  long SetTimes(long column, long row, const VLXListValVLXTime& values);
  long SetTexts(long column, long row, const VLXListValVLXUnicodeString& values);
  long SetBinaries(long column, long row, const VLXListValVLXBinary& values);
  long SetInstances(long column, long row, const VLXListValVLXKDMInstance& values);

  // ---- Transfers ----
  // Creates one instance of model per row, in row order (marked created), with the batch's values,
  // and gives them in instances.
  long CreateInstances(VLXKDMModel& model, VLXListValVLXKDMInstance& instances);
  // As above without handing out the new instances (for large batches: no proxy per instance).
  long CreateInstances(VLXKDMModel& model);
  // Writes the batch's values to the instances, row r to the r-th; there must be one per row.
  long SetValues(const VLXListValVLXKDMInstance& instances);
  // Reads the columns' attributes of the model's live instances (in set order), or of the
  // instances of the list, into the batch: the rows become as many as the instances.
  long GetValues(VLXKDMModel& model);
  long GetValues(const VLXListValVLXKDMInstance& instances);

  // ---- Values read: row's value of column; a row without a value fails (see HasValue) ----
  long HasValue(long column, long row, VLXBoolean& hasValue) const;
  long GetInteger(long column, long row, int& value) const;
  long GetDouble(long column, long row, double& value) const;
  long GetBoolean(long column, long row, VLXBoolean& value) const;
  // A date as the nearest whole second (halves up), or as its milliseconds.
  long GetTime(long column, long row, VLXTime& value) const;
  long GetMilliseconds(long column, long row, long long& milliseconds) const;
  long GetText(long column, long row, VLXUnicodeString& value) const;
  long GetBinary(long column, long row, VLXBinary& value) const;
  long GetInstance(long column, long row, VLXKDMInstance& value) const;
  long GetIntegers(long column, long row, VLXRawCollint& values) const;
  long GetDoubles(long column, long row, VLXRawColldouble& values) const;
  long GetBooleans(long column, long row, VLXListValVLXBoolean& values) const;
  long GetTimes(long column, long row, VLXListValVLXTime& values) const;
  long GetTexts(long column, long row, VLXListValVLXUnicodeString& values) const;
  long GetBinaries(long column, long row, VLXListValVLXBinary& values) const;
  long GetInstances(long column, long row, VLXListValVLXKDMInstance& values) const;

  class Store;

 private:
  Store* _store;
};
