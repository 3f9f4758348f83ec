#include "session/ZELServerSession.h"

#include <string>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/exception_guard.h"
#include "api/message_numbers.h"
#include "api/status.h"
#include "session/ZELServerConnectionInfo.h"
#include "transport/checked_command.h"
#include "transport/ZELServerTCPIPChannel.h"
#include "jobs/jobs_factories.h"
#include "repository/repository_factories.h"
#include "security/security_factories.h"
#include "sharedresources/sharedresources_factories.h"

namespace zel {

namespace {

// Every destroy operation of the interface: the caller's pointer is always left null.
template <class T>
void destroyObject(T** object)
{
    if (object == nullptr)
        return;
    delete *object;
    *object = nullptr;
}

}  // namespace

ZELServerSession::ZELServerSession()
{
    // Without an XML platform every command fails later with its own status; nothing to report here.
    delete xmlPlatform_.acquire();
}

ZELServerSession::~ZELServerSession() { teardown(); }

void ZELServerSession::teardown()
{
    transformationManager_.reset();
    repositoryManager_.reset();
    securityManager_.reset();
    mountPointManager_.reset();
    // The managers go first: they borrow the channel. Whatever kind of connection information made
    // the channel, it is released here.
    channel_.reset();
}

IZELServerStatus* ZELServerSession::init(const IZELServerConnectionInfo& info,
                                         const IZELServerStringArray* handshakeOptions)
{
    return guarded([&] { return connect(info, handshakeOptions); });
}

IZELServerStatus* ZELServerSession::connect(const IZELServerConnectionInfo& info,
                                            const IZELServerStringArray* handshakeOptions)
{
    teardown();
    connectionKind_ = info.getConnectionKind();
    if (connectionKind_ != 0)
        return makeStatus(msg::kUnsupportedConnection);

    channel_.reset(new ZELServerTCPIPChannel());
    if (!channel_)
        return makeStatus(msg::kConnectFailed);
    if (IZELServerStatus* status = channel_->open(info, handshakeOptions))
        return status;
    makeManagers();
    return nullptr;
}

void ZELServerSession::makeManagers()
{
    IZELServerChannel* channel = channel_.get();
    if (!transformationManager_)
        transformationManager_.reset(makeTransformationManager(channel));
    if (!repositoryManager_)
        repositoryManager_.reset(makeRepositoryManager(channel));
    if (!securityManager_)
        securityManager_.reset(makeSecurityManager(channel));
    // Shared resources are reached only over a host-and-port connection.
    if (!mountPointManager_ && connectionKind_ == 0)
        mountPointManager_.reset(makeMountPointManager(channel));
}

IZELServerConnectionInfo* ZELServerSession::createConnectionInfo(const IZELServerString& address,
                                                                 const IZELServerStringArray& properties)
{
    return guarded([&] { return new ZELServerConnectionInfo(address, properties); });
}

IZELServerConnectionInfo* ZELServerSession::createConnectionInfo(const IZELServerString& address,
                                                                 const IZELServerString& userName,
                                                                 const IZELServerString& password)
{
    return guarded([&] { return new ZELServerConnectionInfo(address, userName, password); });
}

IZELServerConnectionInfo* ZELServerSession::createConnectionInfo(const IZELServerString& host, unsigned short port,
                                                                 const IZELServerStringArray& properties)
{
    return guarded([&] { return new ZELServerConnectionInfo(host, port, properties); });
}

IZELServerConnectionInfo* ZELServerSession::createConnectionInfo(const IZELServerString& host, unsigned short port,
                                                                 const IZELServerString& userName,
                                                                 const IZELServerString& password)
{
    return guarded([&] { return new ZELServerConnectionInfo(host, port, userName, password); });
}

void ZELServerSession::destroyConnectionInfo(IZELServerConnectionInfo** info) { destroyObject(info); }

IZELServerStatus* ZELServerSession::disconnect()
{
    return guarded([&] { return channel_ ? channel_->close() : nullptr; });
}

IZELServerTransformationManager* ZELServerSession::getTransformationManager() { return transformationManager_.get(); }
IZELServerRepositoryManager* ZELServerSession::getRepositoryManager() { return repositoryManager_.get(); }
IZELServerSecurityManager* ZELServerSession::getSecurityManager() { return securityManager_.get(); }
IZELServerMountPointManager* ZELServerSession::getMountPointManager() { return mountPointManager_.get(); }

IZELServerString* ZELServerSession::createString()
{
    return guarded([&] { return new ZELServerString(); });
}
void ZELServerSession::destroyString(IZELServerString** string) { destroyObject(string); }
IZELServerStringArray* ZELServerSession::createStringArray()
{
    return guarded([&] { return new ZELServerStringArray(); });
}
void ZELServerSession::destroyStringArray(IZELServerStringArray** array) { destroyObject(array); }

IZELServerStatus* ZELServerSession::getSessionProperty(const IZELServerString& name, IZELServerString& value)
{
    return guarded([&] {
        return CheckedCommand(channel_.get(), "SERVER_SESSION_GET_PROP").add("sessionPropName", name).askText(value);
    });
}

IZELServerIdentity* ZELServerSession::getIdentity() { return channel_ ? channel_->getIdentity() : nullptr; }

void ZELServerSession::destroyStatus(IZELServerStatus** status) { destroyObject(status); }

// Objects of the subsystems. Objects that send commands of their own are bound to the session's
// channel as it is now (null before init): they must not outlive the next init.

IZELServerTransformationRequest* ZELServerSession::createTransformationRequest(const IZELServerString& keyword,
                                                                               const IZELServerString& repository,
                                                                               const IZELServerWorkspace& workspace)
{
    return guarded([&] { return makeTransformationRequest(keyword, repository, workspace); });
}
IZELServerTransformationRequest* ZELServerSession::createTransformationRequest(const IZELServerString& keyword,
                                                                               const IZELServerString& repository,
                                                                               const IZELServerString& workspace)
{
    return guarded([&] { return makeTransformationRequest(keyword, repository, workspace); });
}
IZELServerTransformationRequest* ZELServerSession::createTransformationRequest(const IZELServerString& keyword,
                                                                               const IZELServerString& workspacePath)
{
    return guarded([&] { return makeTransformationRequest(keyword, workspacePath); });
}
void ZELServerSession::destroyTransformationRequest(IZELServerTransformationRequest** request)
{
    destroyObject(request);
}

IZELServerTransformationResult* ZELServerSession::createTransformationResult(const IZELServerString& resultText)
{
    return guarded([&] { return makeTransformationResult(resultText); });
}
IZELServerTransformationResult* ZELServerSession::createTransformationResult()
{
    return guarded([&] { return makeTransformationResult(); });
}
void ZELServerSession::destroyTransformationResult(IZELServerTransformationResult** result) { destroyObject(result); }

IZELServerService* ZELServerSession::createService(const IZELServerString& name, const IZELServerString& displayName,
                                                   const IZELServerString& description,
                                                   const IZELServerString& urlPattern)
{
    return guarded([&] { return makeService(channel_.get(), name, displayName, description, urlPattern); });
}
IZELServerService* ZELServerSession::createService()
{
    return guarded([&] { return makeService(channel_.get()); });
}
void ZELServerSession::destroyService(IZELServerService** service) { destroyObject(service); }
IZELServerVector<IZELServerService>* ZELServerSession::createServiceVector()
{
    return guarded([&] { return makeServiceVector(); });
}
void ZELServerSession::destroyServiceVector(IZELServerVector<IZELServerService>** vector) { destroyObject(vector); }

IZELServerWorkspace* ZELServerSession::createWorkspace()
{
    return guarded([&] { return makeWorkspace(channel_.get()); });
}
void ZELServerSession::destroyWorkspace(IZELServerWorkspace** workspace) { destroyObject(workspace); }
IZELServerVector<IZELServerWorkspace>* ZELServerSession::createWorkspaceVector()
{
    return guarded([&] { return makeWorkspaceVector(); });
}
void ZELServerSession::destroyWorkspaceVector(IZELServerVector<IZELServerWorkspace>** vector) { destroyObject(vector); }

IZELServerRepository* ZELServerSession::createRepository()
{
    return guarded([&] { return makeRepository(channel_.get()); });
}
void ZELServerSession::destroyRepository(IZELServerRepository** repository) { destroyObject(repository); }
IZELServerVector<IZELServerRepository>* ZELServerSession::createRepositoryVector()
{
    return guarded([&] { return makeRepositoryVector(); });
}
void ZELServerSession::destroyRepositoryVector(IZELServerVector<IZELServerRepository>** vector)
{
    destroyObject(vector);
}

IZELServerWorkspaceSummary* ZELServerSession::createWorkspaceSummary()
{
    return guarded([&] { return makeWorkspaceSummary(); });
}
void ZELServerSession::destroyWorkspaceSummary(IZELServerWorkspaceSummary** summary) { destroyObject(summary); }
IZELServerVector<IZELServerWorkspaceSummary>* ZELServerSession::createWorkspaceSummaryVector()
{
    return guarded([&] { return makeWorkspaceSummaryVector(); });
}
void ZELServerSession::destroyWorkspaceSummaryVector(IZELServerVector<IZELServerWorkspaceSummary>** vector)
{
    destroyObject(vector);
}

IZELServerWorkspaceService* ZELServerSession::createWorkspaceService()
{
    return guarded([&] { return makeWorkspaceService(channel_.get()); });
}
void ZELServerSession::destroyWorkspaceService(IZELServerWorkspaceService** workspaceService)
{
    destroyObject(workspaceService);
}
IZELServerVector<IZELServerWorkspaceService>* ZELServerSession::createWorkspaceServiceVector()
{
    return guarded([&] { return makeWorkspaceServiceVector(); });
}
void ZELServerSession::destroyWorkspaceServiceVector(IZELServerVector<IZELServerWorkspaceService>** vector)
{
    destroyObject(vector);
}

IZELServerCustomFormat* ZELServerSession::createCustomFormat()
{
    return guarded([&] { return makeCustomFormat(); });
}
void ZELServerSession::destroyCustomFormat(IZELServerCustomFormat** customFormat) { destroyObject(customFormat); }
IZELServerVector<IZELServerCustomFormat>* ZELServerSession::createCustomFormatVector()
{
    return guarded([&] { return makeCustomFormatVector(); });
}
void ZELServerSession::destroyCustomFormatVector(IZELServerVector<IZELServerCustomFormat>** vector)
{
    destroyObject(vector);
}

IZELServerCustomTransformer* ZELServerSession::createCustomTransformer()
{
    return guarded([&] { return makeCustomTransformer(); });
}
void ZELServerSession::destroyCustomTransformer(IZELServerCustomTransformer** customTransformer)
{
    destroyObject(customTransformer);
}
IZELServerVector<IZELServerCustomTransformer>* ZELServerSession::createCustomTransformerVector()
{
    return guarded([&] { return makeCustomTransformerVector(); });
}
void ZELServerSession::destroyCustomTransformerVector(IZELServerVector<IZELServerCustomTransformer>** vector)
{
    destroyObject(vector);
}

IZELServerResource* ZELServerSession::createResource()
{
    return guarded([&] { return makeResource(); });
}
void ZELServerSession::destroyResource(IZELServerResource** resource) { destroyObject(resource); }
IZELServerVector<IZELServerResource>* ZELServerSession::createResourceVector()
{
    return guarded([&] { return makeResourceVector(); });
}
void ZELServerSession::destroyResourceVector(IZELServerVector<IZELServerResource>** vector) { destroyObject(vector); }

IZELServerPropertyAccessor* ZELServerSession::createPropertyAccessor()
{
    return guarded([&] { return makePropertyAccessor(); });
}
void ZELServerSession::destroyPropertyAccessor(IZELServerPropertyAccessor** accessor) { destroyObject(accessor); }
IZELServerVector<IZELServerProperty>* ZELServerSession::createPropertyVector()
{
    return guarded([&] { return makePropertyVector(); });
}
void ZELServerSession::destroyPropertyVector(IZELServerVector<IZELServerProperty>** vector) { destroyObject(vector); }

IZELServerLogFileInfo* ZELServerSession::createLogFileInfo()
{
    return guarded([&] { return makeLogFileInfo(); });
}
void ZELServerSession::destroyLogFileInfo(IZELServerLogFileInfo** info) { destroyObject(info); }

IZELServerTemplate* ZELServerSession::createTemplate()
{
    return guarded([&] { return makeTemplate(); });
}
void ZELServerSession::destroyTemplate(IZELServerTemplate** templ) { destroyObject(templ); }
IZELServerVector<IZELServerTemplate>* ZELServerSession::createTemplateVector()
{
    return guarded([&] { return makeTemplateVector(); });
}
void ZELServerSession::destroyTemplateVector(IZELServerVector<IZELServerTemplate>** vector) { destroyObject(vector); }

IZELServerVector<IZELServerItem>* ZELServerSession::createItemVector()
{
    return guarded([&] { return makeItemVector(); });
}
void ZELServerSession::destroyItemVector(IZELServerVector<IZELServerItem>** vector) { destroyObject(vector); }

IZELServerMountPoint* ZELServerSession::createMountPoint()
{
    return guarded([&] { return makeMountPoint(channel_.get()); });
}
void ZELServerSession::destroyMountPoint(IZELServerMountPoint** mountPoint) { destroyObject(mountPoint); }
IZELServerVector<IZELServerMountPoint>* ZELServerSession::createMountPointVector()
{
    return guarded([&] { return makeMountPointVector(); });
}
void ZELServerSession::destroyMountPointVector(IZELServerVector<IZELServerMountPoint>** vector)
{
    destroyObject(vector);
}

IZELServerFileInfo* ZELServerSession::createFileInfo()
{
    return guarded([&] { return makeFileInfo(); });
}
void ZELServerSession::destroyFileInfo(IZELServerFileInfo** info) { destroyObject(info); }
IZELServerVector<IZELServerFileInfo>* ZELServerSession::createFileInfoVector()
{
    return guarded([&] { return makeFileInfoVector(); });
}
void ZELServerSession::destroyFileInfoVector(IZELServerVector<IZELServerFileInfo>** vector) { destroyObject(vector); }

}  // namespace zel
