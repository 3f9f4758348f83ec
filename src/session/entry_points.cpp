// The library's exported entry points for sessions. (DllSetMemoryErrorHandler lives with the heap's
// failure routine in memory_handler.cpp.)

#include <zelserverapi/zelserverapi.h>

#include "api/exception_guard.h"
#include "session/ZELServerSession.h"

extern "C" {

ZEL_API IZELServerSession* ZEL_createServerSession(IZELServerSession** session)
{
    // The session is allocated through the library heap, whose `new` yields null on exhaustion.
    IZELServerSession* created = zel::guarded([]() -> IZELServerSession* { return new zel::ZELServerSession(); });
    if (session != nullptr)
        *session = created;
    return created;
}

ZEL_API void ZEL_destroyServerSession(IZELServerSession** session)
{
    if (session == nullptr)
        return;
    delete *session;
    *session = nullptr;
}
}
