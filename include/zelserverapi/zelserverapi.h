#pragma once
// The library's entry points. Everything else is reached through the session they hand out.

#include "ZELServerExport.h"
#include "IZELLogSink.h"
#include "IZELServerSession.h"

// The allocator's failure routine: called with an error code when memory is exhausted.
typedef void (*ZELMemoryFailureRoutine)(int errorCode);

extern "C" {

// Creates an uninitialised session, stores it through `session` and returns it; call init next.
// When memory is exhausted, stores and returns null.
ZEL_API IZELServerSession* ZEL_createServerSession(IZELServerSession** session);

// Destroys the session (and everything it owns) when `*session` is not null; always stores null.
ZEL_API void ZEL_destroyServerSession(IZELServerSession** session);

// Installs the library's out-of-memory routine and returns the routine it replaces. When memory runs
// out, the routine reports once, through `sink` with severity 3, naming the plug-in (at most 200
// characters of `pluginName`, which may be null), and ends the process with exit code 1.
// `sink` stays owned by the caller and must live as long as the library is loaded.
ZEL_API ZELMemoryFailureRoutine DllSetMemoryErrorHandler(IZELLogSink* sink, const char* pluginName);
}
