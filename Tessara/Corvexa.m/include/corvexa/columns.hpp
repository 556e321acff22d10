// Batches of columns in the modern interface: the values of many instances moved in one call per
// batch (over VLXKDMColumns). Rows and columns count from 0.
//
//   corvexa::Columns batch(rows);
//   const std::size_t code = batch.add_column("code", corvexa::Type::integer);
//   const std::size_t tags = batch.add_column("tags", corvexa::Type::text, true);
//   for (std::size_t r = 0; r < rows; ++r) batch.set(code, r, codes[r]), batch.set(tags, r, tag_lists[r]);
//   batch.create_in(model);                    // row r becomes the r-th new instance
//
//   corvexa::Columns read;
//   const std::size_t c = read.add_column("code");
//   read.read(model);                          // one row per live instance
//   std::optional<int> first = read.try_get<int>(c, 0);
#pragma once

#include <cstddef>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

class VLXKDMColumns;

namespace corvexa {

// A batch: rows (one per instance) by columns (one per attribute). A transfer is all or nothing;
// a refused value throws, naming the row and the attribute. Used by one thread at a time.
class CORVEXA_API Columns {
 public:
  explicit Columns(std::size_t rows = 0);
  Columns(Columns&&) noexcept;
  Columns& operator=(Columns&&) noexcept;
  ~Columns();

  // Starts a new batch of rows rows without columns (the buffers are kept).
  void reset(std::size_t rows);
  [[nodiscard]] std::size_t rows() const;
  [[nodiscard]] std::size_t columns() const;
  // A column to write to attribute, of type (a list of them when multi_valued); answers its position.
  std::size_t add_column(std::string_view attribute, Type type, bool multi_valued = false);
  // A column to read from attribute: its type comes with the values.
  std::size_t add_column(std::string_view attribute);

  // Row's value of column, which must have the value's type. A row left unset is not written.
  void set(std::size_t column, std::size_t row, int value);
  void set(std::size_t column, std::size_t row, double value);
  void set(std::size_t column, std::size_t row, bool value);
  void set(std::size_t column, std::size_t row, std::string_view value);
  void set(std::size_t column, std::size_t row, const std::string& value) { set(column, row, std::string_view(value)); }
  void set(std::size_t column, std::size_t row, const char* value) { set(column, row, std::string_view(value)); }
  void set(std::size_t column, std::size_t row, time_point value);
  void set(std::size_t column, std::size_t row, const bytes& value);
  void set(std::size_t column, std::size_t row, const Instance& value);
  void set(std::size_t column, std::size_t row, const std::vector<int>& values);
  void set(std::size_t column, std::size_t row, const std::vector<double>& values);
  void set(std::size_t column, std::size_t row, const std::vector<bool>& values);
  void set(std::size_t column, std::size_t row, const std::vector<std::string>& values);
  void set(std::size_t column, std::size_t row, const std::vector<bytes>& values);
  void set(std::size_t column, std::size_t row, const std::vector<Instance>& values);

  // Creates one instance of model per row, in row order, with the batch's values.
  void create_in(Model& model);
  // Writes row r to instances[r]; there must be one instance per row.
  void write_to(const std::vector<Instance>& instances);
  // Reads the columns' attributes of the model's live instances, or of instances: one row each.
  void read(const Model& model);
  void read(const std::vector<Instance>& instances);

  [[nodiscard]] bool has_value(std::size_t column, std::size_t row) const;
  // Row's value of column as T (the types of set); get throws when the row has none.
  template <class T>
  [[nodiscard]] T get(std::size_t column, std::size_t row) const
  {
    T value{};
    if (!has_value(column, row)) no_value(column, row);
    fetch(column, row, value);
    return value;
  }
  template <class T>
  [[nodiscard]] std::optional<T> try_get(std::size_t column, std::size_t row) const
  {
    if (!has_value(column, row)) return std::nullopt;
    return get<T>(column, row);
  }

  [[nodiscard]] const VLXKDMColumns& proxy() const { return *_batch; }

 private:
  void fetch(std::size_t column, std::size_t row, int& value) const;
  void fetch(std::size_t column, std::size_t row, double& value) const;
  void fetch(std::size_t column, std::size_t row, bool& value) const;
  void fetch(std::size_t column, std::size_t row, std::string& value) const;
  void fetch(std::size_t column, std::size_t row, time_point& value) const;
  void fetch(std::size_t column, std::size_t row, bytes& value) const;
  void fetch(std::size_t column, std::size_t row, Instance& value) const;
  void fetch(std::size_t column, std::size_t row, std::vector<int>& value) const;
  void fetch(std::size_t column, std::size_t row, std::vector<double>& value) const;
  void fetch(std::size_t column, std::size_t row, std::vector<bool>& value) const;
  void fetch(std::size_t column, std::size_t row, std::vector<std::string>& value) const;
  void fetch(std::size_t column, std::size_t row, std::vector<bytes>& value) const;
  void fetch(std::size_t column, std::size_t row, std::vector<Instance>& value) const;
  [[noreturn]] void no_value(std::size_t column, std::size_t row) const;

  std::unique_ptr<VLXKDMColumns> _batch;
};

}  // namespace corvexa
