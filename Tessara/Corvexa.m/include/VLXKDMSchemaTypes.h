// The enumerations that describe a replica's schema. Each value stands for one constant of the Java
// enumeration of the same name. Their underlying type is int, so that any int a caller casts to one
// of them is a value the library can receive and refuse (rather than undefined behaviour).
#pragma once

// The value type of an attribute.
struct VLXKDMAttributeType {
  enum Type : int { Integer = 0, Double = 1, String = 2, Date = 3, Boolean = 4, Binary = 5, Relationship = 6 };
};

// Whether an attribute's value may be read, written, or both.
struct VLXKDMAccessMode {
  enum Mode : int { Read = 0, Write = 1, ReadWrite = 2 };
};

// How a relationship attribute holds its targets: as parts of its instance, or shared with others.
struct VLXKDMAggregationType {
  enum Type : int { Composition = 0, Shared = 1 };
};

// The kind of a class definition.
struct VLXKDMClassType {
  enum Type : int { Class = 0, Extension = 1 };
};

// The software visibility of a class or attribute definition.
struct VLXKDMVisibility {
  enum Mode : int { Public = 0, Protected = 1, Private = 2 };
};
