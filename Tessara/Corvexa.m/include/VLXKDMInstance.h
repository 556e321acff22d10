// One object of a class definition inside a replica: an optional identifier (a text or bytes), the
// states the replica keeps for it (created, modified, deleted), and one value per attribute of its
// class. Attributes are addressed by name or by position (from 0); both pass to Java unchanged, and
// an unknown name or a position out of range fails with the Java side's error. Every operation
// needs a built proxy; on failure, out-parameters (and out-proxies) are left as they were.
#pragma once

#include <jni.h>

#include "VLXBinary.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMJavaObject.h"
#include "VLXListValVLXBinary.h"
#include "VLXListValVLXBoolean.h"
#include "VLXListValVLXTime.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXRawColldouble.h"
#include "VLXRawCollint.h"
#include "VLXTime.h"
#include "VLXUnicodeString.h"

class VLXKDMInstanceValue;
class VLXListValVLXKDMInstance;
typedef VLXListValVLXKDMInstance VLXListOfVLXKDMInstance;

class CORVEXA_API VLXKDMInstance : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMInstance)

 public:
  // Attaches classDef to the class of the instance.
  long GetClassDef(VLXKDMClassDef& classDef) const;

  // The identifier. Without one: writes 1 into noID and nothing else. With a text: writes 0, 1 and
  // the text, leaving bytes alone. With bytes: writes 0, 0 and the bytes, leaving text alone. An
  // identifier of any other Java class fails (after writing 0 into noID) with a last error naming
  // that class.
  long GetID(VLXBoolean& noID, VLXBoolean& isText, VLXUnicodeString& text, VLXBinary& bytes) const;
  // Sets the identifier, a text or bytes; identifiers are unique among the live instances of a
  // model (a text never collides with bytes).
  long SetID(const VLXUnicodeString& id);
  long SetID(const VLXBinary& id);

  // The states: created since the last commit, modified since then, removed from its set.
  long IsCreated(VLXBoolean& created) const;
  long IsModified(VLXBoolean& modified) const;
  long IsDeleted(VLXBoolean& deleted) const;

  // Whether the attribute holds a value. A name that is not well-formed UTF-8 returns the
  // converter's own code, with no translation.
  long IsValuated(const VLXUnicodeString& name, VLXBoolean& valuated) const;
  long IsValuated(int position, VLXBoolean& valuated) const;
  // Removes the value of the attribute.
  long ClearValue(const VLXUnicodeString& name);
  long ClearValue(int position);

  // Reads the attribute's value into value (see VLXKDMInstanceValue), whatever its type; an
  // attribute without value fails, since there is no Java object to read. Returns the result of
  // reading the value's local form. A name that is not well-formed UTF-8 returns the converter's
  // own code, with no translation, and leaves value untouched; a Java failure leaves it untouched.
  long GetValue(const VLXUnicodeString& name, VLXKDMInstanceValue& value) const;
  long GetValue(int position, VLXKDMInstanceValue& value) const;
  // Writes the attribute's value from value: first gives value its Java form (which it keeps),
  // then sends it. A value without type is a broken precondition, reported through VLXFatalError;
  // if the report returns, the operation fails without any Java call, leaving the attribute as it
  // was. The Java side checks the value against the attribute's type and kind.
  long SetValue(const VLXUnicodeString& name, VLXKDMInstanceValue& value);
  long SetValue(int position, VLXKDMInstanceValue& value);

  // The typed setters: one Java object made from the argument, checked by the Java side against
  // the attribute's type and kind (single or list). A time crosses as seconds * 1000 ms; any non-zero
  // boolean byte is sent as true. An instance (or element of a list of instances) that is not attached
  // to a Java object is a broken precondition, reported through VLXFatalError; if the report
  // returns, the setter fails without calling Java. An empty list sets an empty value, which is not
  // the same as no value.
  long SetValue(const VLXUnicodeString& name, int value);
  long SetValue(int position, int value);
  long SetValue(const VLXUnicodeString& name, double value);
  long SetValue(int position, double value);
  long SetValue(const VLXUnicodeString& name, VLXBoolean value);
  long SetValue(int position, VLXBoolean value);
  // A bool stores a Boolean, as a VLXBoolean does (without these, true would go as the int 1).
  long SetValue(const VLXUnicodeString& name, bool value);
  long SetValue(int position, bool value);
  long SetValue(const VLXUnicodeString& name, const VLXUnicodeString& value);
  long SetValue(int position, const VLXUnicodeString& value);
  long SetValue(const VLXUnicodeString& name, const VLXTime& value);
  long SetValue(int position, const VLXTime& value);
  long SetValue(const VLXUnicodeString& name, const VLXBinary& value);
  long SetValue(int position, const VLXBinary& value);
  long SetValue(const VLXUnicodeString& name, const VLXKDMInstance& value);
  long SetValue(int position, const VLXKDMInstance& value);
  long SetValue(const VLXUnicodeString& name, const VLXListOfInt& value);
  long SetValue(int position, const VLXListOfInt& value);
  long SetValue(const VLXUnicodeString& name, const VLXListOfDouble& value);
  long SetValue(int position, const VLXListOfDouble& value);
  long SetValue(const VLXUnicodeString& name, const VLXListOfVLXBoolean& value);
  long SetValue(int position, const VLXListOfVLXBoolean& value);
  long SetValue(const VLXUnicodeString& name, const VLXListOfVLXUnicodeString& value);
  long SetValue(int position, const VLXListOfVLXUnicodeString& value);
  long SetValue(const VLXUnicodeString& name, const VLXListOfVLXTime& value);
  long SetValue(int position, const VLXListOfVLXTime& value);
  long SetValue(const VLXUnicodeString& name, const VLXListOfVLXBinary& value);
  long SetValue(int position, const VLXListOfVLXBinary& value);
  long SetValue(const VLXUnicodeString& name, const VLXListOfVLXKDMInstance& value);
  long SetValue(int position, const VLXListOfVLXKDMInstance& value);

  // The variadic setters: exactly count values of the setter's type must follow (0 sets an empty
  // list), gathered into a list that is then set as by the list setter, whose name failures carry.
  // The values are: const VLXBinary*, VLXBoolean (passed as int; any non-zero value is true),
  // const VLXTime*, double, const VLXKDMInstance*, int, and NUL-terminated UTF-8 texts
  // (const char*). A null binary or text pointer stands for the empty value. A negative count, or
  // a null time or instance pointer, fails with VLX_E_INVALIDARG and changes nothing. Values that
  // do not match the count and type cannot be detected: the behaviour is then undefined.
  long SetValueBinaries(const VLXUnicodeString& name, int count, ...);
  long SetValueBinaries(int position, int count, ...);
  long SetValueBooleans(const VLXUnicodeString& name, int count, ...);
  long SetValueBooleans(int position, int count, ...);
  long SetValueDates(const VLXUnicodeString& name, int count, ...);
  long SetValueDates(int position, int count, ...);
  long SetValueDoubles(const VLXUnicodeString& name, int count, ...);
  long SetValueDoubles(int position, int count, ...);
  long SetValueInstances(const VLXUnicodeString& name, int count, ...);
  long SetValueInstances(int position, int count, ...);
  long SetValueIntegers(const VLXUnicodeString& name, int count, ...);
  long SetValueIntegers(int position, int count, ...);
  long SetValueStrings(const VLXUnicodeString& name, int count, ...);
  long SetValueStrings(int position, int count, ...);

  // A readable text form of the instance; with withValues (any non-zero byte), its values too.
  long ToString(VLXUnicodeString& text) const;
  long ToString(VLXBoolean withValues, VLXUnicodeString& text) const;

 private:
  // Sends object, which the caller owns, as the attribute's new value. Every typed setter ends here.
  long SetValue(const VLXUnicodeString& name, jobject object);
  long SetValue(int position, jobject object);
  // Their frame; with started, the rest of it inside a typed setter's frame already started on that
  // environment.
  template <class Attribute>
  long SetObject(JNIEnv* started, const Attribute& attribute, jobject object);
  // A typed setter: the Java form of value, made under the setter's method name text, goes to the
  // SetValue above.
  template <class Attribute, class T>
  long SetConverted(const char* methodName, const Attribute& attribute, const T& value);
};
