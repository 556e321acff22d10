// The modern C++ interface of Corvexa: value-semantic handles over the proxy API, strings as
// std::string (UTF-8), typed values through get<T>/try_get<T>/set, ranges for range-for, and one
// exception type for every failure.
//
//   corvexa::Replica inv = corvexa::Replica::read_xml_file("inventory.xml");
//   for (corvexa::Instance p : inv.model("Part").instances())
//     if (p.get<int>("quantity") < 10) p.set("quantity", 100);
//   inv.commit();
//
// A handle refers to one Java object; copies refer to the same one. A default-constructed handle
// refers to nothing: every operation on it throws. Every operation that fails throws
// corvexa::Error; none ends the process. The proxy API (VLXKDM...) stays the lower layer: each
// handle gives its proxy through proxy().
#pragma once

#include <chrono>
#include <cstddef>
#include <iterator>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "VLXKDMAttributeDef.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceSet.h"
#include "VLXKDMModel.h"
#include "VLXKDMModelSet.h"
#include "VLXKDMReplica.h"
#include "corvexa/error.hpp"
#include "corvexa/schema.hpp"

namespace corvexa {

// A date: milliseconds since 1970-01-01 00:00 UTC, as the replica keeps them (finer parts of a
// time point are dropped, toward the past). A time_point spans about 292 years either side of
// 1970: reading a date beyond that throws.
using time_point = std::chrono::system_clock::time_point;
// A binary value.
using bytes = std::vector<std::byte>;

// Whether a binary replica is deflated.
enum class Compression { off, on };

class Instance;
class Model;
class Replica;

// An attribute definition of a class.
class CORVEXA_API AttributeDef {
 public:
  AttributeDef() = default;
  explicit AttributeDef(const VLXKDMAttributeDef& proxy) : _proxy(proxy) {}

  [[nodiscard]] std::string name() const;
  [[nodiscard]] Type type() const;
  [[nodiscard]] bool multi_valued() const;
  [[nodiscard]] bool mandatory() const;
  [[nodiscard]] bool unique() const;
  // The maximal length of a text (characters) or bytes value; 0: unlimited.
  [[nodiscard]] int length() const;
  // The classes a reference may point to.
  [[nodiscard]] std::vector<std::string> targets() const;
  [[nodiscard]] std::string comment() const;

  [[nodiscard]] const VLXKDMAttributeDef& proxy() const { return _proxy; }

 private:
  VLXKDMAttributeDef _proxy;
};

// A class definition. A class reached through a replica lists its layout: the attributes it
// inherits (from the root class down), then its own.
class CORVEXA_API ClassDef {
 public:
  ClassDef() = default;
  ClassDef(const VLXKDMClassDef& proxy, const VLXKDMReplica& replica) : _proxy(proxy), _replica(replica) {}

  [[nodiscard]] std::string name() const;
  // The class this one extends; empty when none.
  [[nodiscard]] std::string super_name() const;
  [[nodiscard]] bool is_abstract() const;
  [[nodiscard]] std::string comment() const;
  // Inherited attributes first, then the class's own, in order.
  [[nodiscard]] std::vector<AttributeDef> attributes() const;
  // The class's own attributes.
  [[nodiscard]] std::vector<AttributeDef> own_attributes() const;
  // The attribute of the layout named name; throws when there is none.
  [[nodiscard]] AttributeDef attribute(std::string_view name) const;

  [[nodiscard]] const VLXKDMClassDef& proxy() const { return _proxy; }

 private:
  VLXKDMClassDef _proxy;
  // For the super classes; its getters are not const.
  mutable VLXKDMReplica _replica;
};

// One instance of a class: typed values by attribute name.
//
// get<T> and try_get<T> read a value of type T: int, double, bool, std::string, time_point, bytes,
// Instance, or a std::vector of one of them for a multi-valued attribute. get<T> throws when the
// attribute has no value; try_get<T> then answers std::nullopt. Both throw for an attribute that
// does not exist or holds another type. set writes one, clear removes it.
class CORVEXA_API Instance {
 public:
  Instance() = default;
  explicit Instance(const VLXKDMInstance& proxy) : _proxy(proxy) {}

  template <class T>
  [[nodiscard]] T get(std::string_view attribute) const
  {
    T value{};
    if (!read(attribute, value)) no_value(attribute);
    return value;
  }
  template <class T>
  [[nodiscard]] std::optional<T> try_get(std::string_view attribute) const
  {
    std::optional<T> value(std::in_place);
    if (!read(attribute, *value)) value.reset();
    return value;
  }
  [[nodiscard]] bool has_value(std::string_view attribute) const;

  void set(std::string_view attribute, int value);
  void set(std::string_view attribute, double value);
  void set(std::string_view attribute, bool value);
  void set(std::string_view attribute, std::string_view value);
  void set(std::string_view attribute, const std::string& value) { set(attribute, std::string_view(value)); }
  void set(std::string_view attribute, const char* value) { set(attribute, std::string_view(value)); }
  void set(std::string_view attribute, time_point value);
  void set(std::string_view attribute, const bytes& value);
  void set(std::string_view attribute, const Instance& value);
  void set(std::string_view attribute, const std::vector<int>& values);
  void set(std::string_view attribute, const std::vector<double>& values);
  void set(std::string_view attribute, const std::vector<bool>& values);
  void set(std::string_view attribute, const std::vector<std::string>& values);
  void set(std::string_view attribute, const std::vector<time_point>& values);
  void set(std::string_view attribute, const std::vector<bytes>& values);
  void set(std::string_view attribute, const std::vector<Instance>& values);
  // Removes the attribute's value.
  void clear(std::string_view attribute);

  // The identifier: a text, or bytes (bytes_id); empty when the instance has none of that kind.
  [[nodiscard]] std::optional<std::string> id() const;
  [[nodiscard]] std::optional<bytes> bytes_id() const;
  void set_id(std::string_view id);
  void set_id(const bytes& id);

  // The states kept until the next commit.
  [[nodiscard]] bool is_created() const;
  [[nodiscard]] bool is_modified() const;
  [[nodiscard]] bool is_deleted() const;

  [[nodiscard]] std::string class_name() const;
  [[nodiscard]] std::string to_string(bool with_values = false) const;

  // Whether the handle refers to an instance.
  explicit operator bool() const { return _proxy.GetHandle() != nullptr; }
  // The same Java instance.
  bool operator==(const Instance& other) const { return _proxy == other._proxy; }
  bool operator!=(const Instance& other) const { return !(*this == other); }

  [[nodiscard]] const VLXKDMInstance& proxy() const { return _proxy; }

 private:
  // The typed reads: false when the attribute has no value (value is then untouched).
  bool read(std::string_view attribute, int& value) const;
  bool read(std::string_view attribute, double& value) const;
  bool read(std::string_view attribute, bool& value) const;
  bool read(std::string_view attribute, std::string& value) const;
  bool read(std::string_view attribute, time_point& value) const;
  bool read(std::string_view attribute, bytes& value) const;
  bool read(std::string_view attribute, Instance& value) const;
  bool read(std::string_view attribute, std::vector<int>& value) const;
  bool read(std::string_view attribute, std::vector<double>& value) const;
  bool read(std::string_view attribute, std::vector<bool>& value) const;
  bool read(std::string_view attribute, std::vector<std::string>& value) const;
  bool read(std::string_view attribute, std::vector<time_point>& value) const;
  bool read(std::string_view attribute, std::vector<bytes>& value) const;
  bool read(std::string_view attribute, std::vector<Instance>& value) const;
  [[noreturn]] void no_value(std::string_view attribute) const;

  friend class Model;
  friend class Instances;
  friend class Columns;
  VLXKDMInstance _proxy;
};

// The live instances of a model, in creation order. Positions count from 0.
class CORVEXA_API Instances {
 public:
  class iterator {
   public:
    using iterator_category = std::input_iterator_tag;
    using value_type = Instance;
    using difference_type = std::ptrdiff_t;
    using pointer = void;
    using reference = Instance;

    iterator() = default;
    Instance operator*() const { return _set->at(_position); }
    iterator& operator++()
    {
      ++_position;
      return *this;
    }
    iterator operator++(int)
    {
      iterator before = *this;
      ++_position;
      return before;
    }
    bool operator==(const iterator& other) const { return _position == other._position; }
    bool operator!=(const iterator& other) const { return _position != other._position; }

   private:
    friend class Instances;
    iterator(const Instances* set, std::size_t position) : _set(set), _position(position) {}
    const Instances* _set = nullptr;
    std::size_t _position = 0;
  };

  Instances() = default;
  explicit Instances(const VLXKDMInstanceSet& proxy);

  // The count when the range was made; iteration stops there.
  [[nodiscard]] std::size_t size() const { return _size; }
  [[nodiscard]] bool empty() const { return _size == 0; }
  [[nodiscard]] iterator begin() const { return iterator(this, 0); }
  [[nodiscard]] iterator end() const { return iterator(this, _size); }
  // The instance at position; throws when it is out of range.
  [[nodiscard]] Instance at(std::size_t position) const;
  [[nodiscard]] Instance operator[](std::size_t position) const { return at(position); }

  [[nodiscard]] const VLXKDMInstanceSet& proxy() const { return _proxy; }

 private:
  VLXKDMInstanceSet _proxy;
  std::size_t _size = 0;
};

// The data of one class: its instances.
class CORVEXA_API Model {
 public:
  Model() = default;
  explicit Model(const VLXKDMModel& proxy) : _proxy(proxy) {}

  [[nodiscard]] ClassDef class_def() const;
  // The name of the class.
  [[nodiscard]] std::string name() const;
  [[nodiscard]] Instances instances() const;
  // A new instance, marked created.
  [[nodiscard]] Instance create();
  // Removes an instance (marked deleted until the next commit).
  void remove(const Instance& instance);
  // The live instance with this identifier; empty when none has it.
  [[nodiscard]] std::optional<Instance> find(std::string_view id) const;
  [[nodiscard]] std::optional<Instance> find(const bytes& id) const;
  // The live instances whose attribute holds value: one of int, double, bool, a text, bytes or an
  // Instance (by identity), or for a multi-valued attribute a std::vector of them, compared element
  // by element. with_subclasses also searches the models of the subclasses.
  template <class T>
  [[nodiscard]] std::vector<Instance> select(std::string_view attribute, const T& value,
                                             bool with_subclasses = false) const
  {
    return select_value(attribute, Value::of(value), with_subclasses);
  }
  // The live instances whose attribute has no value.
  [[nodiscard]] std::vector<Instance> select_without_value(std::string_view attribute,
                                                           bool with_subclasses = false) const;

  [[nodiscard]] const VLXKDMModel& proxy() const { return _proxy; }

 private:
  // A value to select by, in the value holder's form.
  struct CORVEXA_API Value {
    VLXKDMInstanceValue holder;
    static Value of(int v);
    static Value of(double v);
    static Value of(bool v);
    static Value of(std::string_view v);
    static Value of(const std::string& v) { return of(std::string_view(v)); }
    static Value of(const char* v) { return of(std::string_view(v)); }
    static Value of(const bytes& v);
    static Value of(const Instance& v);
    static Value of(const std::vector<int>& v);
    static Value of(const std::vector<double>& v);
    static Value of(const std::vector<bool>& v);
    static Value of(const std::vector<std::string>& v);
    static Value of(const std::vector<bytes>& v);
    static Value of(const std::vector<Instance>& v);
  };
  std::vector<Instance> select_value(std::string_view attribute, const Value& value, bool with_subclasses) const;

  friend class Replica;
  friend class Columns;
  VLXKDMModel _proxy;
};

// A replica: a schema (classes) and its data (one model per class).
class CORVEXA_API Replica {
 public:
  // Refers to nothing: use create or one of the readers.
  Replica() = default;
  explicit Replica(const VLXKDMReplica& proxy) : _proxy(proxy) {}

  // A new, empty replica.
  [[nodiscard]] static Replica create(std::string_view name = {});

  // ---- Documents in: each makes a new replica, schema and data.
  [[nodiscard]] static Replica read_xml_file(const std::string& path);
  [[nodiscard]] static Replica read_xml_string(std::string_view xml);
  // The compression is read from the bytes.
  [[nodiscard]] static Replica read_binary_file(const std::string& path);
  [[nodiscard]] static Replica from_binary(const bytes& data);

  // ---- Documents into this replica.
  // Adds the classes of an XSD, each with an empty model.
  void insert_schema_file(const std::string& path);
  void insert_schema_string(std::string_view xsd);
  // Adds the instances of an XML document, all or nothing.
  void populate_from_xml_file(const std::string& path);
  void populate_from_xml_string(std::string_view xml);

  // ---- Documents out. A file is written whole or not at all (a temporary file beside it, renamed
  // into place when complete).
  [[nodiscard]] std::string xml(bool with_schema = true, bool with_state = false) const;
  [[nodiscard]] std::string xsd() const;
  [[nodiscard]] bytes binary(Compression compression = Compression::off) const;
  void write_xml_file(const std::string& path, bool with_schema = true, bool with_state = false) const;
  void write_xsd_file(const std::string& path) const;
  void write_binary_file(const std::string& path, Compression compression = Compression::off) const;

  // ---- Schema and data.
  [[nodiscard]] std::string name() const;
  void set_name(std::string_view name);
  // Every class, in the order of their models.
  [[nodiscard]] std::vector<ClassDef> classes() const;
  // The class named name; throws when there is none.
  [[nodiscard]] ClassDef class_def(std::string_view name) const;
  // Adds a class (with an empty model) as declared; answers it.
  ClassDef define(const ClassDeclaration& declaration);
  [[nodiscard]] std::vector<Model> models() const;
  // The model of the class named class_name; throws when there is none.
  [[nodiscard]] Model model(std::string_view class_name) const;
  // The live instance with this identifier, in any model; empty when none has it.
  [[nodiscard]] std::optional<Instance> find(std::string_view id) const;
  [[nodiscard]] std::optional<Instance> find(const bytes& id) const;

  // Checks the whole replica and makes its pending changes permanent; throws, changing nothing,
  // with every violation in the message.
  void commit();

  // ---- Exchange with Java code that calls into native code.
  // The replica a Java object refers to (a com.velmora.tessara.kdmreplica.Replica).
  [[nodiscard]] static Replica from_java(JNIEnv* env, jobject replica);
  // A new local reference to the Java replica, owned by the calling Java frame.
  [[nodiscard]] jobject to_java(JNIEnv* env) const;

  [[nodiscard]] const VLXKDMReplica& proxy() const { return _proxy; }

 private:
  // The replica proxy's getters are not const.
  mutable VLXKDMReplica _proxy;
};

}  // namespace corvexa

#include "corvexa/columns.hpp"
