// Result codes and the one-byte boolean shared by every Corvexa library.
//
// A result code is a 32-bit signed value carried in a `long`. On LP64 systems a `long` is 64 bits
// wide, so a failure code written as a bare hexadecimal literal (0x80004005) would be a positive
// number there. Every failure code below is therefore the 32-bit value sign-extended into `long`:
// test results with VLX_SUCCEEDED / VLX_FAILED, never against a bare literal.
#ifndef VLXResult_h
#define VLXResult_h

typedef unsigned char VLXBoolean;

#define VLX_S_OK 0L
#define VLX_E_FAIL ((long)(int)0x80004005)
#define VLX_E_INVALIDARG ((long)(int)0x80070057)
#define VLX_E_OUTOFMEMORY ((long)(int)0x8007000E)
#define VLX_E_NOTIMPL ((long)(int)0x80004001)
#define VLX_E_NOINTERFACE ((long)(int)0x80004002)

#define VLX_SUCCEEDED(rc) ((long)(rc) >= 0)
#define VLX_FAILED(rc) ((long)(rc) < 0)

#endif
