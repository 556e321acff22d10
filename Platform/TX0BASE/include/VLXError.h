// VLXError: an error object, and the per-thread last-error registry.
//
// An error carries a message id, the name of its message catalog and text parameters. Its message
// text comes from the catalog registry: libraries register their catalogs (id -> text, where /p1,
// /p2, ... stand for the parameters) with RegisterCatalog.
//
// The last error is kept per thread, like errno: a failure on one thread never replaces another
// thread's last error. The registry holds one reference to the error it records and releases it
// when the error is replaced or cleaned, or when the thread exits.
#ifndef VLXError_h
#define VLXError_h

#include "VLXBaseUnknown.h"
#include "VLXUnicodeString.h"

#include <string>
#include <vector>

// One row of a message catalog.
struct VLXMessageEntry {
  const char* id;
  const char* text;
};

class VLXError : public VLXBaseUnknown {
 public:
  // Kinds of GetReturn.
  static const int ReturnSuccess = 1;
  static const int ReturnError = 2;

  // An error with message id `messageId` of catalog `catalog` (null texts are taken as empty).
  VLXError(const char* messageId, const char* catalog);
  VLXError(const VLXError& other);
  VLXError& operator=(const VLXError& other);
  ~VLXError() override;

  const char* GetId() const { return _id.c_str(); }
  const char* GetCatalog() const { return _catalog.c_str(); }

  int GetNLSParameterCount() const { return static_cast<int>(_parameters.size()); }
  // The parameter at `position` (from 1). A position outside 1..GetNLSParameterCount() is reported
  // through VLXFatalError; if the handler returns, the result is an empty string.
  const VLXUnicodeString& GetNLSParameter(int position) const;
  // Replaces the parameters by the `count` strings at `params` (count < 1 or null params: none).
  void SetNLSRequestParams(int count, const VLXUnicodeString* params);

  // The catalog text of the id with each /pN replaced by parameter N (an empty text when the error
  // has fewer parameters). When the catalog or the id is not registered: "catalog:id" followed by
  // the parameters in parentheses.
  VLXUnicodeString GetMessageText() const;

  // Where the error was recorded (GetReturn's file and line); empty and 0 until then.
  const char* GetSourceFile() const { return _file.c_str(); }
  int GetSourceLine() const { return _line; }
  void SetSource(const char* file, int line);

  // Registers (or extends) the catalog `catalog` with `count` rows; a later row for an id replaces
  // the earlier one. The texts are copied. Safe to call from any thread.
  static void RegisterCatalog(const char* catalog, const VLXMessageEntry* entries, int count);
  // Writes the registered text of `id` in `catalog` into `text` and returns 1; returns 0 and
  // leaves `text` alone when there is none.
  static int LookupMessage(const char* catalog, const char* id, VLXUnicodeString& text);

  // The calling thread's last error with a reference added for the caller (who Releases it), or
  // null when there is none. `code` and `owner` are not used.
  static VLXError* VLXGetLastError(long code, void* owner);
  // Forgets the calling thread's last error (dropping the registry's reference).
  static void VLXCleanLastError();
  // kind ReturnSuccess (1): returns VLX_S_OK; `error` is not used (its reference stays the caller's).
  // kind ReturnError (2): when `error` is not null, stamps it with file and line, records it as the
  // calling thread's last error TAKING OVER the caller's reference and releases the previous last
  // error; returns VLX_E_FAIL (also for a null `error`, which leaves the last error as it is).
  // Any other kind: VLX_E_INVALIDARG, nothing recorded.
  // `owner` is not used.
  static long GetReturn(int kind, VLXError* error, void* owner, const char* file, int line);

  // The start of an operation on the calling thread: errors recorded before it are earlier ones.
  // It leaves the last error as it is. Costs one thread-local write.
  static void MarkOperationStart();
  // The calling thread's last error, with a reference added for the caller, when it was recorded
  // since the thread's last MarkOperationStart (or ever, if there was none); otherwise null.
  static VLXError* VLXGetOperationError();

 private:
  std::string _id;
  std::string _catalog;
  std::vector<VLXUnicodeString> _parameters;
  std::string _file;
  int _line = 0;
};

#endif
