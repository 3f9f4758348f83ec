#pragma once
// The one object a client gets from the library (ZEL_createServerSession). It owns one connection to
// the server and the four managers that speak through it, and it is the factory for every object a
// client hands to the managers or receives from them: objects are created here and destroyed here,
// never with the client's own allocator, because the client and the library may use different heaps.
//
// Destroy operations take the address of the caller's pointer, destroy the object when the pointer is
// not null, and always store null there. Vectors are made empty and destroy their elements with them.
// Objects described as bound to the connection must not be used after the session that made them was
// initialised again or destroyed. A session is used by one thread at a time.
//
// No exception leaves an operation of the session or of any object it makes. Memory running out goes
// to the out-of-memory routine (DllSetMemoryErrorHandler); should it return, or the failure be of
// another kind, an operation with a status returns 393625 with the failure's text, and one without
// returns null, 0 or false (or nothing). A failure in the middle of the server's answer closes the
// connection: later commands return 393622 until init connects again.

#include "IZELServerConnectionInfo.h"
#include "IZELServerIdentity.h"
#include "IZELServerStatus.h"
#include "IZELServerString.h"
#include "IZELServerStringArray.h"
#include "IZELServerVector.h"

class IZELServerTransformationManager;
class IZELServerRepositoryManager;
class IZELServerSecurityManager;
class IZELServerMountPointManager;
class IZELServerTransformationRequest;
class IZELServerTransformationResult;
class IZELServerService;
class IZELServerWorkspace;
class IZELServerRepository;
class IZELServerWorkspaceSummary;
class IZELServerWorkspaceService;
class IZELServerCustomFormat;
class IZELServerCustomTransformer;
class IZELServerResource;
class IZELServerPropertyAccessor;
class IZELServerProperty;
class IZELServerLogFileInfo;
class IZELServerTemplate;
class IZELServerItem;
class IZELServerMountPoint;
class IZELServerFileInfo;

class IZELServerSession {
public:
    // Connects and signs in. Discards any earlier state of this session first (managers, connection).
    // `handshakeOptions` is an optional flat pair list; "CLIENT_ID" and "TRUSTED_HOST_NAMES" are read.
    // Returns null when signed in; 393639 for a web-address connection (the session stays empty);
    // otherwise the connection's status (393601 cannot connect, 393631 sign-in refused, ...), and then
    // only the connection is kept (disconnect and getIdentity work), no managers.
    virtual IZELServerStatus* init(const IZELServerConnectionInfo& info,
                                   const IZELServerStringArray* handshakeOptions) = 0;

    // Connection information: by web address (kind 1, which this session refuses at init) or by host
    // and port (kind 0); with a flat pair list of properties, or with a user name and password.
    virtual IZELServerConnectionInfo* createConnectionInfo(const IZELServerString& address,
                                                           const IZELServerStringArray& properties) = 0;
    virtual IZELServerConnectionInfo* createConnectionInfo(const IZELServerString& address,
                                                           const IZELServerString& userName,
                                                           const IZELServerString& password) = 0;
    virtual IZELServerConnectionInfo* createConnectionInfo(const IZELServerString& host, unsigned short port,
                                                           const IZELServerStringArray& properties) = 0;
    virtual IZELServerConnectionInfo* createConnectionInfo(const IZELServerString& host, unsigned short port,
                                                           const IZELServerString& userName,
                                                           const IZELServerString& password) = 0;
    virtual void destroyConnectionInfo(IZELServerConnectionInfo** info) = 0;

    // Drops the connection and keeps every object. Null when there is no connection object at all;
    // 393622 when the connection is already closed.
    virtual IZELServerStatus* disconnect() = 0;

    // The owned managers; null before a successful init.
    virtual IZELServerTransformationManager* getTransformationManager() = 0;
    virtual IZELServerRepositoryManager* getRepositoryManager() = 0;

    virtual IZELServerString* createString() = 0;
    virtual void destroyString(IZELServerString** string) = 0;
    virtual IZELServerStringArray* createStringArray() = 0;
    virtual void destroyStringArray(IZELServerStringArray** array) = 0;

    // A job description: the service keyword, a repository and a workspace (object or item name, the
    // workspace path being repository/name-less-extension/name), or a workspace path as it stands.
    virtual IZELServerTransformationRequest* createTransformationRequest(const IZELServerString& keyword,
                                                                         const IZELServerString& repository,
                                                                         const IZELServerWorkspace& workspace) = 0;
    virtual IZELServerTransformationRequest* createTransformationRequest(const IZELServerString& keyword,
                                                                         const IZELServerString& repository,
                                                                         const IZELServerString& workspace) = 0;
    virtual IZELServerTransformationRequest* createTransformationRequest(const IZELServerString& keyword,
                                                                         const IZELServerString& workspacePath) = 0;
    virtual void destroyTransformationRequest(IZELServerTransformationRequest** request) = 0;

    // A job result, filled from a result text, or empty.
    virtual IZELServerTransformationResult* createTransformationResult(const IZELServerString& resultText) = 0;
    virtual IZELServerTransformationResult* createTransformationResult() = 0;
    virtual void destroyTransformationResult(IZELServerTransformationResult** result) = 0;

    // A service bound to the connection: name, display name, description and URL pattern, enabled and
    // open to workspace registrations; or an empty one.
    virtual IZELServerService* createService(const IZELServerString& name, const IZELServerString& displayName,
                                             const IZELServerString& description,
                                             const IZELServerString& urlPattern) = 0;
    virtual IZELServerService* createService() = 0;
    virtual void destroyService(IZELServerService** service) = 0;
    virtual IZELServerVector<IZELServerService>* createServiceVector() = 0;
    virtual void destroyServiceVector(IZELServerVector<IZELServerService>** vector) = 0;

    virtual IZELServerWorkspace* createWorkspace() = 0;
    virtual void destroyWorkspace(IZELServerWorkspace** workspace) = 0;
    virtual IZELServerVector<IZELServerWorkspace>* createWorkspaceVector() = 0;
    virtual void destroyWorkspaceVector(IZELServerVector<IZELServerWorkspace>** vector) = 0;

    virtual IZELServerRepository* createRepository() = 0;
    virtual void destroyRepository(IZELServerRepository** repository) = 0;
    virtual IZELServerVector<IZELServerRepository>* createRepositoryVector() = 0;
    virtual void destroyRepositoryVector(IZELServerVector<IZELServerRepository>** vector) = 0;

    virtual IZELServerWorkspaceSummary* createWorkspaceSummary() = 0;
    virtual void destroyWorkspaceSummary(IZELServerWorkspaceSummary** summary) = 0;
    virtual IZELServerVector<IZELServerWorkspaceSummary>* createWorkspaceSummaryVector() = 0;
    virtual void destroyWorkspaceSummaryVector(IZELServerVector<IZELServerWorkspaceSummary>** vector) = 0;

    virtual IZELServerWorkspaceService* createWorkspaceService() = 0;
    virtual void destroyWorkspaceService(IZELServerWorkspaceService** workspaceService) = 0;
    virtual IZELServerVector<IZELServerWorkspaceService>* createWorkspaceServiceVector() = 0;
    virtual void destroyWorkspaceServiceVector(IZELServerVector<IZELServerWorkspaceService>** vector) = 0;

    // Destroys a status returned by any operation of the library.
    virtual void destroyStatus(IZELServerStatus** status) = 0;

    virtual IZELServerCustomFormat* createCustomFormat() = 0;
    virtual void destroyCustomFormat(IZELServerCustomFormat** customFormat) = 0;
    virtual IZELServerVector<IZELServerCustomFormat>* createCustomFormatVector() = 0;
    virtual void destroyCustomFormatVector(IZELServerVector<IZELServerCustomFormat>** vector) = 0;

    virtual IZELServerCustomTransformer* createCustomTransformer() = 0;
    virtual void destroyCustomTransformer(IZELServerCustomTransformer** customTransformer) = 0;
    virtual IZELServerVector<IZELServerCustomTransformer>* createCustomTransformerVector() = 0;
    virtual void destroyCustomTransformerVector(IZELServerVector<IZELServerCustomTransformer>** vector) = 0;

    virtual IZELServerResource* createResource() = 0;
    virtual void destroyResource(IZELServerResource** resource) = 0;
    virtual IZELServerVector<IZELServerResource>* createResourceVector() = 0;
    virtual void destroyResourceVector(IZELServerVector<IZELServerResource>** vector) = 0;

    virtual IZELServerPropertyAccessor* createPropertyAccessor() = 0;
    virtual void destroyPropertyAccessor(IZELServerPropertyAccessor** accessor) = 0;
    virtual IZELServerVector<IZELServerProperty>* createPropertyVector() = 0;
    virtual void destroyPropertyVector(IZELServerVector<IZELServerProperty>** vector) = 0;

    virtual IZELServerLogFileInfo* createLogFileInfo() = 0;
    virtual void destroyLogFileInfo(IZELServerLogFileInfo** info) = 0;

    // Asks the server for one of its session properties ("SERVER_SESSION_GET_PROP") and writes the
    // answer into `value`. Needs a successful init. Returns null or the exchange's status.
    virtual IZELServerStatus* getSessionProperty(const IZELServerString& name, IZELServerString& value) = 0;

    virtual IZELServerTemplate* createTemplate() = 0;
    virtual void destroyTemplate(IZELServerTemplate** templ) = 0;
    virtual IZELServerVector<IZELServerTemplate>* createTemplateVector() = 0;
    virtual void destroyTemplateVector(IZELServerVector<IZELServerTemplate>** vector) = 0;

    virtual IZELServerVector<IZELServerItem>* createItemVector() = 0;
    virtual void destroyItemVector(IZELServerVector<IZELServerItem>** vector) = 0;

    // The identity received at sign-in, owned by the session (null before init or without one).
    virtual IZELServerIdentity* getIdentity() = 0;

    virtual IZELServerSecurityManager* getSecurityManager() = 0;
    // Null before init and for connections that are not made from a host and a port.
    virtual IZELServerMountPointManager* getMountPointManager() = 0;

    virtual IZELServerMountPoint* createMountPoint() = 0;
    virtual void destroyMountPoint(IZELServerMountPoint** mountPoint) = 0;
    virtual IZELServerVector<IZELServerMountPoint>* createMountPointVector() = 0;
    virtual void destroyMountPointVector(IZELServerVector<IZELServerMountPoint>** vector) = 0;

    virtual IZELServerFileInfo* createFileInfo() = 0;
    virtual void destroyFileInfo(IZELServerFileInfo** info) = 0;
    virtual IZELServerVector<IZELServerFileInfo>* createFileInfoVector() = 0;
    virtual void destroyFileInfoVector(IZELServerVector<IZELServerFileInfo>** vector) = 0;

    // Tears the session down (managers first, then the connection); use ZEL_destroyServerSession.
    virtual ~IZELServerSession() = default;

protected:
    IZELServerSession() = default;
    IZELServerSession(const IZELServerSession&) = delete;
    IZELServerSession& operator=(const IZELServerSession&) = delete;
};
