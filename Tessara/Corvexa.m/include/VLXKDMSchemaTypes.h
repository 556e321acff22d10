// The enumerations that describe a replica's schema. Each value stands for one constant of the Java
// enumeration of the same name.
#pragma once

// The value type of an attribute.
struct VLXKDMAttributeType {
  enum Type { Integer = 0, Double = 1, String = 2, Date = 3, Boolean = 4, Binary = 5, Relationship = 6 };
};

// Whether an attribute's value may be read, written, or both.
struct VLXKDMAccessMode {
  enum Mode { Read = 0, Write = 1, ReadWrite = 2 };
};

// How a relationship attribute holds its targets: as parts of its instance, or shared with others.
struct VLXKDMAggregationType {
  enum Type { Composition = 0, Shared = 1 };
};

// The kind of a class definition.
struct VLXKDMClassType {
  enum Type { Class = 0, Extension = 1 };
};

// The software visibility of a class or attribute definition.
struct VLXKDMVisibility {
  enum Mode { Public = 0, Protected = 1, Private = 2 };
};
