#pragma once
// Ownership of what a session makes, for the library's clients: ZELServerOwned<T> is a std::unique_ptr
// whose deleter hands the object back to the session's matching destroy operation, so a client writes
// no destroy call by hand and an early return leaks nothing. Header only: nothing here is exported.
//
//   ZELServerOwned<IZELServerSession> session = zelServerCreateSession();
//   ZELServerOwned<IZELServerRepository> repository = zelServerOwn(*session, session->createRepository());
//   ZELServerOwned<IZELServerStatus> status = zelServerOwn(*session, manager->getRepository(...));
//
// The session must outlive every object it owns this way. A user token goes back to the session's
// security manager, which made it. Paths are released by their mount point and are not covered.

#include <memory>

#include "interfaces.h"
#include "zelserverapi.h"

// The matching destroy operation of each kind the session makes.
inline void zelServerDestroy(IZELServerSession*, IZELServerSession* s) { ZEL_destroyServerSession(&s); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerStatus* p) { s->destroyStatus(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerConnectionInfo* p) { s->destroyConnectionInfo(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerString* p) { s->destroyString(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerStringArray* p) { s->destroyStringArray(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerTransformationRequest* p)
{
    s->destroyTransformationRequest(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerTransformationResult* p)
{
    s->destroyTransformationResult(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerService* p) { s->destroyService(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerWorkspace* p) { s->destroyWorkspace(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerRepository* p) { s->destroyRepository(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerWorkspaceSummary* p) { s->destroyWorkspaceSummary(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerWorkspaceService* p) { s->destroyWorkspaceService(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerCustomFormat* p) { s->destroyCustomFormat(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerCustomTransformer* p) { s->destroyCustomTransformer(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerResource* p) { s->destroyResource(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerPropertyAccessor* p) { s->destroyPropertyAccessor(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerLogFileInfo* p) { s->destroyLogFileInfo(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerTemplate* p) { s->destroyTemplate(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerMountPoint* p) { s->destroyMountPoint(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerFileInfo* p) { s->destroyFileInfo(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerUserToken* p)
{
    s->getSecurityManager()->destroyUserToken(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerService>* p)
{
    s->destroyServiceVector(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerWorkspace>* p)
{
    s->destroyWorkspaceVector(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerRepository>* p)
{
    s->destroyRepositoryVector(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerWorkspaceSummary>* p)
{
    s->destroyWorkspaceSummaryVector(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerWorkspaceService>* p)
{
    s->destroyWorkspaceServiceVector(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerCustomFormat>* p)
{
    s->destroyCustomFormatVector(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerCustomTransformer>* p)
{
    s->destroyCustomTransformerVector(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerResource>* p)
{
    s->destroyResourceVector(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerProperty>* p)
{
    s->destroyPropertyVector(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerTemplate>* p)
{
    s->destroyTemplateVector(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerItem>* p) { s->destroyItemVector(&p); }
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerMountPoint>* p)
{
    s->destroyMountPointVector(&p);
}
inline void zelServerDestroy(IZELServerSession* s, IZELServerVector<IZELServerFileInfo>* p)
{
    s->destroyFileInfoVector(&p);
}

// The deleter: remembers the session that made the object.
struct ZELServerRelease {
    IZELServerSession* session = nullptr;
    template <typename T>
    void operator()(T* object) const
    {
        zelServerDestroy(session, object);
    }
};

template <typename T>
using ZELServerOwned = std::unique_ptr<T, ZELServerRelease>;

// Takes ownership of `object` (which may be null) on behalf of the session that made it.
template <typename T>
ZELServerOwned<T> zelServerOwn(IZELServerSession& session, T* object)
{
    return ZELServerOwned<T>(object, ZELServerRelease{&session});
}

// A new session, destroyed through ZEL_destroyServerSession; null when memory is exhausted.
inline ZELServerOwned<IZELServerSession> zelServerCreateSession()
{
    IZELServerSession* session = nullptr;
    ZEL_createServerSession(&session);
    return ZELServerOwned<IZELServerSession>(session, ZELServerRelease{});
}
