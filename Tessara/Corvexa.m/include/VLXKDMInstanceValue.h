// VLXKDMInstanceValue: one attribute value of an instance, of one of seven types, single or a list.
//
// A value has a local form (the native value, read and written with the typed getters and setters)
// and a remote form (a Java object: a boxed scalar, a string, a date, a byte array, an instance, or
// an array of these), held as the proxy's handle. VLXKDMInstance::GetValue attaches a value to the
// Java object of an attribute and builds its local form; VLXKDMInstance::SetValue builds the
// remote form of a value and sends it.
//
// States: Empty (new: no type, no Java object); Attached (a Java object given by SetHandle, local
// form not read yet); Local (after a setter: a type, no Java object); Synchronized (after BuildLocal
// or BuildRemote: the Java object is the Java form of the local value). Copies share the Java
// object (through a reference of their own) and copy the state.
//
// A value is used by one thread at a time.
#pragma once

#include "CorvexaExport.h"
#include "VLXBinary.h"
#include "VLXKDMInstance.h"
#include "VLXKDMJavaObject.h"
#include "VLXListValVLXBinary.h"
#include "VLXListValVLXBoolean.h"
#include "VLXListValVLXKDMInstance.h"
#include "VLXListValVLXTime.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXRawColldouble.h"
#include "VLXRawCollint.h"
#include "VLXTime.h"
#include "VLXUnicodeString.h"

class CORVEXA_API VLXKDMInstanceValue : public VLXKDMJavaObject {
 public:
  // The value types. A value without type answers (Type) -1.
  enum Type : int {
    IntegerType = 0,
    DoubleType = 1,
    StringType = 2,
    DateType = 3,
    BooleanType = 4,
    BinaryType = 5,
    InstanceType = 6
  };

  // Empty: no type, not a list, no Java object, every member empty.
  VLXKDMInstanceValue();
  VLXKDMInstanceValue(const VLXKDMInstanceValue& other);
  VLXKDMInstanceValue& operator=(const VLXKDMInstanceValue& other);
  virtual ~VLXKDMInstanceValue();

  // Reads the local form from the attached Java object: recognises its type and kind from its
  // exact Java class (Integer, Double, Boolean, String, Date, byte[], Instance, or int[], double[],
  // boolean[], String[], Date[], byte[][], Instance[]) and converts it; the value is then
  // Synchronized. Fails, changing nothing, when the value has no Java object. A Java object of any
  // other class is a broken precondition, reported through VLXFatalError; if the report returns,
  // BuildLocal fails. Whenever it fails, the value is left exactly as it was.
  long BuildLocal();
  // Makes the Java object of the local form and attaches the value to it (Synchronized). In the
  // Synchronized state, with its Java object still held, it does nothing and succeeds. A value without type is a broken
  // precondition, reported through VLXFatalError; if the report returns, BuildRemote fails. A failure leaves the value
  // as it was: not Synchronized, its former Java object (if any) kept.
  long BuildRemote();

  // The value's type, or (Type) -1.
  Type GetType();
  // True when the value is a list.
  VLXBoolean IsMultiValuated() const;

  // The typed getters: each requires the value to have its type and kind (single or list); a
  // value of another type or kind is a broken precondition, reported through VLXFatalError, after
  // which the getter answers its member as it is. They make no Java call.
  int GetInteger() const;
  double GetDouble() const;
  VLXBoolean GetBoolean() const;
  const VLXUnicodeString& GetString() const;
  const VLXTime& GetDate() const;
  const VLXBinary& GetBinary() const;
  const VLXKDMInstance& GetInstance() const;
  const VLXRawCollint& GetListOfInteger() const;
  const VLXRawColldouble& GetListOfDouble() const;
  const VLXListValVLXBoolean& GetListOfBoolean() const;
  const VLXListValVLXUnicodeString& GetListOfString() const;
  const VLXListValVLXTime& GetListOfDate() const;
  const VLXListValVLXBinary& GetListOfBinary() const;
  const VLXListValVLXKDMInstance& GetListOfInstance() const;

  // The typed setters: each drops the Java object, empties the former local value, and stores a
  // copy of its argument with its type and kind (the Local state). An instance is stored as a proxy
  // of the same Java object; a list of instances as a list of such proxies.
  void SetInteger(int value);
  void SetDouble(double value);
  void SetBoolean(VLXBoolean value);
  void SetString(const VLXUnicodeString& value);
  void SetDate(const VLXTime& value);
  void SetBinary(const VLXBinary& value);
  void SetInstance(const VLXKDMInstance& value);
  void SetListOfInteger(const VLXRawCollint& value);
  void SetListOfDouble(const VLXRawColldouble& value);
  void SetListOfBoolean(const VLXListValVLXBoolean& value);
  void SetListOfString(const VLXListValVLXUnicodeString& value);
  void SetListOfDate(const VLXListValVLXTime& value);
  void SetListOfBinary(const VLXListValVLXBinary& value);
  void SetListOfInstance(const VLXListValVLXKDMInstance& value);

 protected:
  // Accepts only the Java classes of an attribute value (VLX_E_INVALIDARG for another, naming it);
  // an attached object is no longer the Java form of the local value (the value is not
  // Synchronized until BuildLocal).
  long AcceptObject(JNIEnv* env, jobject object) override;

 private:
  // The one table of the seven types, single and list: their members, Java classes and getter
  // preconditions, read by BuildLocal, InternalBuild, Clean and the getters.
  struct Dispatch;
  friend struct Dispatch;

  friend class corvexa::FrameAccess;

  // Drops the Java object and empties the local value of the current type and kind.
  void Clean();
  // Reads the local form of object; with attach, the value also holds object. On failure the value
  // is exactly as it was.
  long Read(JNIEnv* env, jobject object, bool attach);
  // A new Java object (a local reference, or the single instance's own global reference) holding
  // the local value.
  long InternalBuild(jobject& object);

  int _integer;
  double _double;
  VLXBoolean _boolean;
  VLXUnicodeString _string;
  VLXTime _date;
  VLXBinary _binary;
  VLXKDMInstance _instance;
  VLXRawCollint _listOfInteger;
  VLXRawColldouble _listOfDouble;
  VLXListValVLXBoolean _listOfBoolean;
  VLXListValVLXUnicodeString _listOfString;
  VLXListValVLXTime _listOfDate;
  VLXListValVLXBinary _listOfBinary;
  VLXListValVLXKDMInstance _listOfInstance;
  unsigned char _isSynchronized;
  VLXBoolean _isArray;
  Type _type;
};
