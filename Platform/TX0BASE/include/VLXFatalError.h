// Report of a broken precondition.
//
// VLXFatalError hands the message, the source file and the line to the installed handler. The
// default handler writes them to standard error and aborts the process. An application (or a test)
// may install a handler that returns: every caller in the Corvexa libraries then goes on safely
// with a harmless fallback (documented at each call site).
#ifndef VLXFatalError_h
#define VLXFatalError_h

typedef void (*VLXFatalErrorHandler)(const char* message, const char* file, int line);

// Reports a fatal error. `message` may be null. The three texts after it are optional details
// (null when absent); when present they are appended to the message, separated by blanks, before
// the handler sees it. `file` may be null.
void VLXFatalError(const char* message, const char* detail1, const char* detail2, const char* detail3, const char* file,
                   int line);

// Installs `handler` (null restores the default one) and returns the handler that was installed
// before (never null). Safe to call from any thread.
VLXFatalErrorHandler VLXSetFatalErrorHandler(VLXFatalErrorHandler handler);

#endif
