// Schema building in the modern interface: a class declared with its attributes.
//
//   replica.define(corvexa::ClassDeclaration("Part")
//                      .attribute(corvexa::AttributeDeclaration("number",
//                      corvexa::Type::text).mandatory().unique().length(12))
//                      .attribute(corvexa::AttributeDeclaration("tags", corvexa::Type::text).multi_valued())
//                      .attribute(corvexa::AttributeDeclaration("supplier",
//                      corvexa::Type::reference).target("Supplier")));
#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace corvexa {

// The value type of an attribute.
enum class Type { integer, floating, text, date, boolean, bytes, reference };

// An attribute as declared.
class AttributeDeclaration {
 public:
  AttributeDeclaration(std::string_view name, Type type) : _name(name), _type(type) {}

  // Many values (a std::vector in get/set) rather than one.
  AttributeDeclaration& multi_valued(bool on = true) { return _multi = on, *this; }
  AttributeDeclaration& mandatory(bool on = true) { return _mandatory = on, *this; }
  AttributeDeclaration& unique(bool on = true) { return _unique = on, *this; }
  // The maximal length of a text (characters) or bytes value; 0: unlimited.
  AttributeDeclaration& length(int maximum) { return _length = maximum, *this; }
  // A class a reference may point to (repeat for several).
  AttributeDeclaration& target(std::string_view class_name) { return _targets.emplace_back(class_name), *this; }
  AttributeDeclaration& comment(std::string_view text) { return _comment = text, *this; }

  const std::string& name() const { return _name; }
  Type type() const { return _type; }
  bool is_multi_valued() const { return _multi; }
  bool is_mandatory() const { return _mandatory; }
  bool is_unique() const { return _unique; }
  int max_length() const { return _length; }
  const std::vector<std::string>& targets() const { return _targets; }
  const std::string& comment_text() const { return _comment; }

 private:
  std::string _name;
  Type _type;
  bool _multi = false;
  bool _mandatory = false;
  bool _unique = false;
  int _length = 0;
  std::vector<std::string> _targets;
  std::string _comment;
};

// A class as declared: its name, the class it extends, and its own attributes in order.
class ClassDeclaration {
 public:
  explicit ClassDeclaration(std::string_view name) : _name(name) {}

  ClassDeclaration& extends(std::string_view super_name) { return _super = super_name, *this; }
  ClassDeclaration& abstract(bool on = true) { return _abstract = on, *this; }
  ClassDeclaration& comment(std::string_view text) { return _comment = text, *this; }
  ClassDeclaration& attribute(AttributeDeclaration declaration)
  {
    return _attributes.push_back(std::move(declaration)), *this;
  }
  ClassDeclaration& attribute(std::string_view name, Type type) { return attribute(AttributeDeclaration(name, type)); }

  const std::string& name() const { return _name; }
  const std::string& super_name() const { return _super; }
  bool is_abstract() const { return _abstract; }
  const std::string& comment_text() const { return _comment; }
  const std::vector<AttributeDeclaration>& attributes() const { return _attributes; }

 private:
  std::string _name;
  std::string _super;
  bool _abstract = false;
  std::string _comment;
  std::vector<AttributeDeclaration> _attributes;
};

}  // namespace corvexa
