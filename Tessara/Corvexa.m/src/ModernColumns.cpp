// corvexa::Columns over VLXKDMColumns: the batch's operations with std types, and the failures
// thrown.
#include <climits>

#include "ModernSupport.h"
#include "VLXKDMColumns.h"

namespace corvexa {

namespace {

// A position as the batch's long; one past LONG_MAX cannot be a row or column, and is refused there.
long At(std::size_t position)
{
  return position > static_cast<std::size_t>(LONG_MAX) ? -1 : static_cast<long>(position);
}

std::string Cell(const char* operation, std::size_t column, std::size_t row)
{
  return std::string(operation) + "(column " + std::to_string(column) + ", row " + std::to_string(row) + ")";
}

void CheckCell(long code, const char* operation, std::size_t column, std::size_t row)
{
  if (code < 0) Throw(code, Cell(operation, column, row));
}

template <class List, class T, class Convert>
List ListOf(const std::vector<T>& values, Convert convert)
{
  List out(static_cast<int>(values.size()));
  for (const auto& v : values) out.Append(convert(v));
  return out;
}

template <class Out, class List, class Convert>
void FromList(const List& list, std::vector<Out>& out, Convert convert)
{
  out.clear();
  out.reserve(static_cast<std::size_t>(list.Size()));
  for (const auto& v : list) out.push_back(convert(v));
}

VLXListValVLXKDMInstance Proxies(const std::vector<InstanceHandle>& instances, const char* operation)
{
  VLXListValVLXKDMInstance out(static_cast<int>(instances.size()));
  for (const InstanceHandle& in : instances) {
    if (!in) Refuse(operation, {}, "an empty Instance handle");
    out.Append(in.proxy());
  }
  return out;
}

}  // namespace

Columns::Columns(std::size_t rows) : _batch(std::make_unique<VLXKDMColumns>()) { reset(rows); }
Columns::Columns(ColumnsHandle&&) noexcept = default;
ColumnsHandle& Columns::operator=(ColumnsHandle&&) noexcept = default;
Columns::~Columns() = default;

void Columns::reset(std::size_t rows) { Check(_batch->Reset(At(rows)), "corvexa::Columns::reset"); }

std::size_t Columns::rows() const
{
  long rows = 0;
  Check(_batch->GetRowCount(rows), "corvexa::Columns::rows");
  return static_cast<std::size_t>(rows);
}

std::size_t Columns::columns() const
{
  long columns = 0;
  Check(_batch->GetColumnCount(columns), "corvexa::Columns::columns");
  return static_cast<std::size_t>(columns);
}

std::size_t Columns::add_column(std::string_view attribute, Type type, bool multi_valued)
{
  long column = 0;
  Check(_batch->AddColumn(Text(attribute), static_cast<VLXKDMAttributeType::Type>(type), multi_valued ? 1 : 0, column),
        "corvexa::Columns::add_column", attribute);
  return static_cast<std::size_t>(column);
}

std::size_t Columns::add_column(std::string_view attribute)
{
  long column = 0;
  Check(_batch->AddColumn(Text(attribute), column), "corvexa::Columns::add_column", attribute);
  return static_cast<std::size_t>(column);
}

// ---- Values to write --------------------------------------------------------------------------

#define CORVEXA_SET(Native, call)                                      \
  void Columns::set(std::size_t column, std::size_t row, Native value) \
  {                                                                    \
    const long c = At(column), r = At(row);                            \
    CheckCell(_batch->call, "corvexa::Columns::set", column, row);     \
  }
CORVEXA_SET(int, SetInteger(c, r, value))
CORVEXA_SET(double, SetDouble(c, r, value))
CORVEXA_SET(bool, SetBoolean(c, r, value ? 1 : 0))
CORVEXA_SET(std::string_view, SetText(c, r, value.data(), Length(value.size())))
CORVEXA_SET(time_point,
            SetMilliseconds(c, r, std::chrono::floor<std::chrono::milliseconds>(value.time_since_epoch()).count()))
CORVEXA_SET(const bytes&, SetBinary(c, r, Binary(value)))
CORVEXA_SET(const std::vector<int>&, SetIntegers(c, r, ListOf<VLXRawCollint>(value, [](int v) { return v; })))
CORVEXA_SET(const std::vector<double>&, SetDoubles(c, r, ListOf<VLXRawColldouble>(value, [](double v) { return v; })))
CORVEXA_SET(const std::vector<bool>&,
            SetBooleans(c, r, ListOf<VLXListValVLXBoolean>(value, [](bool v) { return VLXBoolean(v ? 1 : 0); })))
CORVEXA_SET(const std::vector<std::string>&,
            SetTexts(c, r, ListOf<VLXListValVLXUnicodeString>(value, [](const std::string& v) { return Text(v); })))
CORVEXA_SET(const std::vector<bytes>&,
            SetBinaries(c, r, ListOf<VLXListValVLXBinary>(value, [](const bytes& v) { return Binary(v); })))
CORVEXA_SET(const std::vector<InstanceHandle>&, SetInstances(c, r, Proxies(value, "corvexa::Columns::set")))
#undef CORVEXA_SET

void Columns::set(std::size_t column, std::size_t row, const InstanceHandle& value)
{
  if (!value) Refuse("corvexa::Columns::set", {}, "an empty Instance handle");
  CheckCell(_batch->SetInstance(At(column), At(row), value._proxy), "corvexa::Columns::set", column, row);
}

// ---- Transfers --------------------------------------------------------------------------------

void Columns::create_in(ModelHandle& model)
{
  Check(_batch->CreateInstances(model._proxy), "corvexa::Columns::create_in");
}

void Columns::write_to(const std::vector<InstanceHandle>& instances)
{
  Check(_batch->SetValues(Proxies(instances, "corvexa::Columns::write_to")), "corvexa::Columns::write_to");
}

void Columns::read(const ModelHandle& model)
{
  VLXKDMModel proxy(model._proxy);  // VLXKDMColumns takes a model it could change
  Check(_batch->GetValues(proxy), "corvexa::Columns::read");
}

void Columns::read(const std::vector<InstanceHandle>& instances)
{
  Check(_batch->GetValues(Proxies(instances, "corvexa::Columns::read")), "corvexa::Columns::read");
}

// ---- Values read ------------------------------------------------------------------------------

bool Columns::has_value(std::size_t column, std::size_t row) const
{
  VLXBoolean has = 0;
  CheckCell(_batch->HasValue(At(column), At(row), has), "corvexa::Columns::has_value", column, row);
  return has != 0;
}

void Columns::no_value(std::size_t column, std::size_t row) const
{
  Refuse(Cell("corvexa::Columns::get", column, row).c_str(), {}, "the row has no value");
}

#define CORVEXA_FETCH(Native, Platform, Getter, assign)                                         \
  void Columns::fetch(std::size_t column, std::size_t row, Native& value) const                 \
  {                                                                                             \
    Platform read{};                                                                            \
    CheckCell(_batch->Getter(At(column), At(row), read), "corvexa::Columns::get", column, row); \
    assign;                                                                                     \
  }
CORVEXA_FETCH(int, int, GetInteger, value = read)
CORVEXA_FETCH(double, double, GetDouble, value = read)
CORVEXA_FETCH(bool, VLXBoolean, GetBoolean, value = read != 0)
CORVEXA_FETCH(std::string, VLXUnicodeString, GetText, value = Text(read))
CORVEXA_FETCH(time_point, long long, GetMilliseconds,
              value = time_point(std::chrono::duration_cast<time_point::duration>(std::chrono::milliseconds(read))))
CORVEXA_FETCH(bytes, VLXBinary, GetBinary, value = Bytes(read))
CORVEXA_FETCH(InstanceHandle, VLXKDMInstance, GetInstance, value = InstanceHandle(read))
CORVEXA_FETCH(std::vector<int>, VLXRawCollint, GetIntegers, FromList(read, value, [](int v) { return v; }))
CORVEXA_FETCH(std::vector<double>, VLXRawColldouble, GetDoubles, FromList(read, value, [](double v) { return v; }))
CORVEXA_FETCH(std::vector<bool>, VLXListValVLXBoolean, GetBooleans,
              FromList(read, value, [](VLXBoolean v) { return v != 0; }))
CORVEXA_FETCH(std::vector<std::string>, VLXListValVLXUnicodeString, GetTexts,
              FromList(read, value, [](const VLXUnicodeString& v) { return Text(v); }))
CORVEXA_FETCH(std::vector<bytes>, VLXListValVLXBinary, GetBinaries,
              FromList(read, value, [](const VLXBinary& v) { return Bytes(v); }))
CORVEXA_FETCH(std::vector<InstanceHandle>, VLXListValVLXKDMInstance, GetInstances,
              FromList(read, value, [](const VLXKDMInstance& v) { return InstanceHandle(v); }))
#undef CORVEXA_FETCH

}  // namespace corvexa
